#include "cimxml/Service.h"

#include "cimxml/HttpHeaders.h"
#include "cimxml/MethodTable.h"
#include "cimxml/ProtocolError.h"
#include "cimxml/Recording.h"
#include "cimxml/ReplyStream.h"
#include "cimxml/RequestReader.h"
#include "cimxml/ResponseWriter.h"
#include "text/StatusText.h"

#include <unistd.h>

#include <array>
#include <exception>

namespace ObjectManager::CimXml {

namespace {

/** @param message for the client. @param problem the line for the log. */
HttpReply failure(unsigned int status, std::vector<std::pair<std::string, std::string>> headers,
                  const std::string& message, const std::string& problem) {
    headers.emplace_back("Content-Type", "text/plain; charset=\"utf-8\"");
    return {status, std::move(headers), message + '\n', problem};
}

/** The machine's host name, for a request that names no host. */
std::string ownHostName() {
    std::array<char, 256> name{};
    return gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "localhost";
}

/** The description of an operation's failure, for the client. */
std::string descriptionOf(const CimError& error) {
    // That an object does not exist is a complete answer; the reasons that were logged would only confuse.
    return error.code == CMPI_RC_ERR_NOT_FOUND
               ? error.what()
               : error.what() + reasonsText(error.reasons, error.refused ? ": " : "; the provider logged: ");
}

} // namespace

Service::Service(Dispatcher& dispatcher, const Catalogue& catalogue, const ServiceSettings& settings)
    : _dispatcher(dispatcher), _catalogue(catalogue), _clock(settings.clock),
      _enumerations(settings.enumerations, settings.clock, settings.newContext), _recorder(settings.recorder) {}

/** Carries out the operation, and records it if it has to be recorded. */
void Service::performRecorded(const Operation& operation) {
    const Message& message = operation.message;
    const auto record = [&](Audit::Verdict verdict, const std::string& reason) {
        if (!message.isIntrinsic() || verdict == Audit::Verdict::denied) {
            _recorder(recordOf(message, operation.caller, _catalogue, verdict, reason));
        }
    };
    std::string remark;
    try {
        remark = CimXml::perform(operation);
    } catch (const CimError& error) {
        record(error.code == CMPI_RC_ERR_ACCESS_DENIED ? Audit::Verdict::denied : Audit::Verdict::refused,
               descriptionOf(error));
        throw;
    } catch (const std::exception& error) {
        record(Audit::Verdict::refused, error.what());
        throw;
    }
    record(Audit::Verdict::accepted, remark);
}

/**
 * Carries out the operation, and makes its reply. A large reply is sent to the outlet while it is being made.
 *
 * If the operation fails before anything has been sent, the reply is an error. Afterwards that is impossible: the
 * document then breaks off without the end tag of its root, so that no client takes it for a complete reply. The reply
 * returned has the trailers that DSP0200 defines for this case, the status code and its description; the server sends
 * them to a client that accepts trailers, and closes the connection of any other client.
 */
HttpReply Service::perform(const Message& message, const Caller& caller, const RequestHeaders& headers,
                           Server::Outlet* outlet, Enumerations::TimePoint start) {
    const auto headersOfAnswer = [&] {
        return headers.ofAnswer(std::chrono::floor<std::chrono::microseconds>(_clock() - start));
    };
    const auto brokenOff = [&](CMPIrc code, const std::string& description) {
        return HttpReply{Http::ok, trailersOfFailure(code, description, headers.replyPrefix()), "", description};
    };
    ReplyStream stream(outlet, headersOfAnswer);
    const std::string host = headers.host();
    // The outcome of a method call is recorded before the client learns of it, so nothing is sent before the record.
    ResponseWriter writer(_catalogue, host.empty() ? ownHostName() : host, message.nameSpace(),
                          stream.canSend() && message.isIntrinsic() ? &stream : nullptr);
    const char* const response = message.isIntrinsic() ? "IMETHODRESPONSE" : "METHODRESPONSE";
    writer.raw("<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">\n<MESSAGE");
    writer.attribute("ID", message.id());
    writer.attribute("PROTOCOLVERSION", "1.0");
    writer.raw(">\n<SIMPLERSP>\n<");
    writer.raw(response);
    writer.attribute("NAME", message.method());
    writer.raw(">\n");
    const std::size_t begin = writer.size();
    try {
        performRecorded({_dispatcher, _catalogue, message, caller, writer, stream, _enumerations});
    } catch (const CimError& error) {
        if (stream.hasBegun()) {
            return brokenOff(error.code, descriptionOf(error));
        }
        writer.truncate(begin);
        writer.error(error.code, descriptionOf(error));
    } catch (const std::exception& error) {
        if (stream.hasBegun()) {
            return brokenOff(CMPI_RC_ERR_FAILED, error.what());
        }
        throw;
    }
    writer.raw("</");
    writer.raw(response);
    writer.raw(">\n</SIMPLERSP>\n</MESSAGE>\n</CIM>\n");
    // The headers of a reply that has begun have already been sent.
    return {Http::ok, stream.hasBegun() ? Server::HttpHeaders() : headersOfAnswer(), writer.take()};
}

HttpReply Service::answer(const HttpRequest& request, const Caller& caller) {
    const Enumerations::TimePoint start = _clock();
    std::string prefix;
    try {
        _enumerations.closeExpired();
        const RequestHeaders headers(request);
        prefix = headers.replyPrefix();
        headers.check();
        const Message message(request.body);
        headers.checkAgainst(message);
        return perform(message, caller, headers, request.outlet, start);
    } catch (const ProtocolError& error) {
        return failure(error.status(), headersOfFailure(error, prefix), error.what(),
                       error.cimError() == nullptr ? error.what() : error.cimError());
    } catch (const std::exception& error) {
        return failure(Http::internalServerError, {}, error.what(), error.what());
    }
}

} // namespace ObjectManager::CimXml

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

/** @param problem what the log says of it. */
HttpReply failure(unsigned int status, std::vector<std::pair<std::string, std::string>> headers,
                  const std::string& message, const std::string& problem) {
    headers.emplace_back("Content-Type", "text/plain; charset=\"utf-8\"");
    return {status, std::move(headers), message + '\n', problem};
}

/** The host's name for those who were asked by none. */
std::string ownHostName() {
    std::array<char, 256> name{};
    return gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "localhost";
}

/** What the client is told of an operation that failed. */
std::string descriptionOf(const CimError& error) {
    // That there is no such instance is all there is to say.
    return error.code == CMPI_RC_ERR_NOT_FOUND
               ? error.what()
               : error.what() + reasonsText(error.reasons, error.refused ? ": " : "; the provider logged: ");
}

} // namespace

Service::Service(Dispatcher& dispatcher, const Catalogue& catalogue, const ServiceSettings& settings)
    : _dispatcher(dispatcher), _catalogue(catalogue), _clock(settings.clock),
      _enumerations(settings.enumerations, settings.clock, settings.newContext), _recorder(settings.recorder) {}

/** Does what the message asks for, and records what has to be. */
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
 * Does what the message asks for, and answers it. A large answer goes to the outlet while it is made.
 *
 * Where the operation fails and nothing has been sent, its answer is an error. Behind the first byte that is too late:
 * the document ends where it is, without the end of its root, and what DSP0200 has for the trailers of an answer in
 * chunks, the status code and its description, is given to the server, which sends it to clients that take trailers,
 * and ends the connection to the others. So nobody takes what came for the answer.
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
    // What became of a method's call is recorded before anybody is told: its answer waits for that as a whole.
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
    // An answer that has begun has its headers.
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

#include "cimxml/Service.h"

#include "cimxml/HttpHeaders.h"
#include "cimxml/MethodTable.h"
#include "cimxml/ProtocolError.h"
#include "cimxml/Recording.h"
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
        remark = perform(operation);
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

/** The document that answers the message. */
std::string Service::documentOf(const Message& message, const Caller& caller, const std::string& host) {
    ResponseWriter writer(_catalogue, host.empty() ? ownHostName() : host, message.nameSpace());
    const char* const response = message.isIntrinsic() ? "IMETHODRESPONSE" : "METHODRESPONSE";
    writer.raw("<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">\n<MESSAGE");
    writer.attribute("ID", message.id());
    writer.attribute("PROTOCOLVERSION", "1.0");
    writer.raw(">\n<SIMPLERSP>\n<");
    writer.raw(response);
    writer.attribute("NAME", message.method());
    writer.raw(">\n");
    const std::size_t start = writer.size();
    try {
        performRecorded({_dispatcher, _catalogue, message, caller, writer, _enumerations});
    } catch (const CimError& error) {
        writer.truncate(start);
        writer.error(error.code, descriptionOf(error));
    }
    writer.raw("</");
    writer.raw(response);
    writer.raw(">\n</SIMPLERSP>\n</MESSAGE>\n</CIM>\n");
    return writer.take();
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
        std::string document = documentOf(message, caller, headers.host());
        return {Http::ok, headers.ofAnswer(std::chrono::floor<std::chrono::microseconds>(_clock() - start)),
                std::move(document)};
    } catch (const ProtocolError& error) {
        return failure(error.status(), headersOfFailure(error, prefix), error.what(),
                       error.cimError() == nullptr ? error.what() : error.cimError());
    } catch (const std::exception& error) {
        return failure(Http::internalServerError, {}, error.what(), error.what());
    }
}

} // namespace ObjectManager::CimXml

/** Answers HTTP requests that ask for CIM operations in CIM-XML (DSP0200 and DSP0201). */
#ifndef CIMXML_SERVICE_H
#define CIMXML_SERVICE_H

#include "audit/CallRecord.h"
#include "cimxml/Enumerations.h"
#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"
#include "server/HttpMessage.h"

namespace ObjectManager::CimXml {

using Server::Caller;
using Server::HttpReply;
using Server::HttpRequest;

class Message;
class RequestHeaders;
struct Operation;

struct ServiceSettings {
    EnumerationLimits enumerations;
    /** Measures how long answers take and how long enumerations stay open. */
    Enumerations::Clock clock = std::chrono::steady_clock::now;
    Enumerations::NewContext newContext = randomContext;
    /** Called for every method call, whatever its outcome, and for every other request that its user may not make. */
    Audit::Recorder recorder = [](const Audit::CallRecord&) {};
};

class Service {
public:
    /** Dispatcher and catalogue must outlive the service. */
    Service(Dispatcher& dispatcher, const Catalogue& catalogue, const ServiceSettings& settings = {});

    /** Used by several threads at once. Only exceptions of the request's outlet pass. */
    HttpReply answer(const HttpRequest& request, const Caller& caller);

private:
    HttpReply perform(const Message& message, const Caller& caller, const RequestHeaders& headers,
                      Server::Outlet* outlet, Enumerations::TimePoint start);
    void performRecorded(const Operation& operation);

    Dispatcher& _dispatcher;
    const Catalogue& _catalogue;
    const Enumerations::Clock _clock;
    Enumerations _enumerations;
    const Audit::Recorder _recorder;
};

} // namespace ObjectManager::CimXml

#endif

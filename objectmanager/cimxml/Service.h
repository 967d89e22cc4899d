/** CIM-XML (DSP0200 and DSP0201): from an HTTP request to the operation that it asks for, and back. */
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
    /** What the time of answers and of open enumerations is taken from. */
    Enumerations::Clock clock = std::chrono::steady_clock::now;
    Enumerations::NewContext newContext = randomContext;
    /** Takes every call of a method, whatever became of it, and every other request that its client has no right to. */
    Audit::Recorder recorder = [](const Audit::CallRecord&) {};
};

class Service {
public:
    /** Dispatcher and catalogue outlive the service. */
    Service(Dispatcher& dispatcher, const Catalogue& catalogue, const ServiceSettings& settings = {});

    /** Used by several threads at once. Throws nothing but what the request's outlet throws. */
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

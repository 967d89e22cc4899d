/** CIM-XML (DSP0200 and DSP0201): from an HTTP request to the operation that it asks for, and back. */
#ifndef CIMXML_SERVICE_H
#define CIMXML_SERVICE_H

#include "cimxml/Enumerations.h"
#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"
#include "server/HttpMessage.h"

namespace ObjectManager::CimXml {

using Server::Caller;
using Server::HttpReply;
using Server::HttpRequest;

struct ServiceSettings {
    EnumerationLimits enumerations;
    /** What the time of answers and of open enumerations is taken from. */
    Enumerations::Clock clock = std::chrono::steady_clock::now;
    Enumerations::NewContext newContext = randomContext;
};

class Service {
public:
    /** Dispatcher and catalogue outlive the service. */
    Service(Dispatcher& dispatcher, const Catalogue& catalogue, const ServiceSettings& settings = {});

    /** Used by several threads at once; never throws. */
    HttpReply answer(const HttpRequest& request, const Caller& caller);

private:
    Dispatcher& _dispatcher;
    const Catalogue& _catalogue;
    const Enumerations::Clock _clock;
    Enumerations _enumerations;
};

} // namespace ObjectManager::CimXml

#endif

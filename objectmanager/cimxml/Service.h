/** CIM-XML (DSP0200 and DSP0201): from an HTTP request to the operation that it asks for, and back. */
#ifndef CIMXML_SERVICE_H
#define CIMXML_SERVICE_H

#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"
#include "server/HttpMessage.h"

namespace ObjectManager::CimXml {

using Server::Caller;
using Server::HttpReply;
using Server::HttpRequest;

class Service {
public:
    /** All outlive the service. */
    Service(Dispatcher& dispatcher, const Catalogue& catalogue);

    /** Used by several threads at once; never throws. */
    HttpReply answer(const HttpRequest& request, const Caller& caller);

private:
    Dispatcher& _dispatcher;
    const Catalogue& _catalogue;
};

} // namespace ObjectManager::CimXml

#endif

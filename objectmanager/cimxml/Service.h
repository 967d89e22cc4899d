/** CIM-XML (DSP0200 and DSP0201): from an HTTP request to the operation that it asks for, and back. */
#ifndef CIMXML_SERVICE_H
#define CIMXML_SERVICE_H

#include "dispatch/Dispatcher.h"
#include "schema/Catalogue.h"

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ObjectManager::CimXml {

/** A request as it came in. Header names are compared without regard to letter case. */
struct HttpRequest {
    std::string method;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string_view body;
};

struct HttpReply {
    unsigned int status;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;
};

/** Who asks, and what he may do. */
struct Caller {
    std::string user;
    bool mayRead;
    bool mayChangePower;
};

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

/** What the headers of a request say, and those of the reply. */
#ifndef CIMXML_HTTPHEADERS_H
#define CIMXML_HTTPHEADERS_H

#include "cimxml/ProtocolError.h"
#include "cimxml/RequestReader.h"
#include "cimxml/Service.h"
#include "model/CimError.h"

#include <chrono>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ObjectManager::CimXml {

/**
 * The headers of a request. Requests are made with POST, or with M-POST after RFC 2774: there the header Man declares
 * the number that the names of CIM's headers begin with, as in "73-CIMOperation". It is taken from the header Opt too,
 * and with POST. Where M-POST declares another extension in Man, it is refused.
 *
 * The functions throw ProtocolError where the request cannot be answered.
 */
class RequestHeaders {
public:
    /** The request outlives this. Looks at nothing but the HTTP method and its extension. */
    explicit RequestHeaders(const HttpRequest& request);

    /** What can be told before the body is read: that it asks for a CIM operation, in a form that is understood. */
    void check() const;
    /** That they say what the body says. */
    void checkAgainst(const Message& message) const;

    /** The media type of the reply: application/xml, unless the client takes text/xml only. */
    const char* replyType() const;
    /** What the client calls the host; empty where it does not tell. */
    std::string host() const;

    /** What the names of CIM's headers in the reply begin with, "73-"; empty for POST. */
    std::string replyPrefix() const { return _extended ? _prefix : std::string(); }

    /** The headers of a reply that is a CIM document, and took some time to make. */
    std::vector<std::pair<std::string, std::string>> ofAnswer(std::chrono::microseconds taken) const;

private:
    /** The entries of all headers of that name, whose values are lists. */
    std::vector<std::string_view> listOf(std::string_view name) const;
    /** One of CIM's own, which may be there once only. */
    const std::string* findOwn(std::string_view name) const;
    std::string prefixed(std::string_view name) const { return _prefix + std::string(name); }
    void checkTypes() const;
    void checkObject(const Message& message) const;

    const HttpRequest& _request;
    /** The method is M-POST. */
    bool _extended;
    /** For example "73-"; empty where none is declared. */
    std::string _prefix;
};

/** What is told behind a reply that failed after it had begun. */
std::vector<std::pair<std::string, std::string>> trailersOfFailure(CMPIrc code, const std::string& description,
                                                                   const std::string& prefix);

/** Those of a reply to a request that was refused. */
std::vector<std::pair<std::string, std::string>> headersOfFailure(const ProtocolError& error,
                                                                  const std::string& prefix);

} // namespace ObjectManager::CimXml

#endif

/** The headers of requests and of replies, as DSP0200 defines them. */
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
 * The headers of a request. The HTTP method is POST, or M-POST as in RFC 2774: then the header Man declares a number
 * with which the names of CIM's headers begin, as in "73-CIMOperation". The header Opt may declare the number as well,
 * and so may a request with POST. A request with M-POST is refused if its header Man declares any other extension.
 *
 * The functions throw ProtocolError if the request has to be refused.
 */
class RequestHeaders {
public:
    /** The request must outlive this object. Checks only the HTTP method and its extension. */
    explicit RequestHeaders(const HttpRequest& request);

    /** Checks, before the body is read, that the request is a CIM operation in a form that the server understands. */
    void check() const;
    /** Checks that the headers agree with the message in the body. */
    void checkAgainst(const Message& message) const;

    /** The media type of the reply: application/xml, unless the client accepts only text/xml. */
    const char* replyType() const;
    /** The name that the client uses for the server's host; empty if the request has no header Host. */
    std::string host() const;

    /** The prefix of CIM's headers in the reply, for example "73-"; empty for POST. */
    std::string replyPrefix() const { return _extended ? _prefix : std::string(); }

    /** The headers of a reply that is a CIM document. @param taken how long the server needed to make the reply. */
    std::vector<std::pair<std::string, std::string>> ofAnswer(std::chrono::microseconds taken) const;

private:
    /** The entries of all headers of a name whose values are lists. */
    std::vector<std::string_view> listOf(std::string_view name) const;
    /** The value of one of CIM's headers; null if it is missing. Throws if the header is there twice. */
    const std::string* findOwn(std::string_view name) const;
    std::string prefixed(std::string_view name) const { return _prefix + std::string(name); }
    void checkTypes() const;
    void checkObject(const Message& message) const;

    const HttpRequest& _request;
    /** Whether the HTTP method is M-POST. */
    bool _extended;
    /** The prefix of CIM's headers, for example "73-"; empty if the request declares none. */
    std::string _prefix;
};

/** The trailers of a reply whose operation failed after the reply had begun (DSP0200). */
std::vector<std::pair<std::string, std::string>> trailersOfFailure(CMPIrc code, const std::string& description,
                                                                   const std::string& prefix);

/** The headers of the reply to a request that was refused. */
std::vector<std::pair<std::string, std::string>> headersOfFailure(const ProtocolError& error,
                                                                  const std::string& prefix);

} // namespace ObjectManager::CimXml

#endif

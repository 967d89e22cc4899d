/**
 * Requests as they come over the wire, with the replies that they get. Every file in cases/ is one:
 *
 *     # What it is about.
 *     POST operator                       the HTTP method and who asks: operator, reader or stranger
 *     CIMOperation: MethodCall            headers, and after an empty line the body
 *     ==== 200                            the status of the reply
 *     CIMOperation: MethodResponse        its headers, and after an empty line its body
 */
#ifndef TESTS_OBJECTMANAGER_CIMXML_WIRECASE_H
#define TESTS_OBJECTMANAGER_CIMXML_WIRECASE_H

#include "cimxml/Service.h"

#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

constexpr std::string_view replySeparator = "==== ";

struct WireCase {
    /** The part up to the reply, as it stands in the file. */
    std::string requestText;
    /** Refers to `body`. */
    HttpRequest request() const { return {method, headers, body}; }
    std::string method;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;
    Caller caller;
    /** Behind the separator; empty where there is none. */
    std::string reply;
};

/** Whatever the text is, it is a case. */
WireCase readWireCase(const std::string& text);

/** A reply in the form in which cases have it. */
std::string textOf(const HttpReply& reply);

} // namespace ObjectManager::CimXml

#endif

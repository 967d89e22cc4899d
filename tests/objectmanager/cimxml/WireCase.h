/**
 * Requests as they come over the wire, with the replies that they get. Every file in cases/ has one or several, which
 * are answered one after the other by a server that was just started:
 *
 *     # What it is about.
 *     POST operator 5                     the HTTP method; who asks: operator, reader or stranger; and how many seconds
 *                                         pass before, or nothing
 *     CIMOperation: MethodCall            headers, and after an empty line the body
 *     ==== 200                            the status of the reply
 *     CIMOperation: MethodResponse        its headers, and after an empty line its body
 *     ++++                                before the next request
 */
#ifndef TESTS_OBJECTMANAGER_CIMXML_WIRECASE_H
#define TESTS_OBJECTMANAGER_CIMXML_WIRECASE_H

#include "cimxml/Service.h"

#include <chrono>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::CimXml {

constexpr std::string_view replySeparator = "==== ";
constexpr std::string_view requestSeparator = "++++\n";

struct WireCase {
    /** The part up to the reply, as it stands in the file. */
    std::string requestText;
    /** Refers to `body`. */
    HttpRequest request() const { return {method, headers, body}; }
    std::string method;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;
    Caller caller;
    std::chrono::seconds pause{0};
    /** Behind the separator; empty where there is none. */
    std::string reply;
};

/** Whatever the text is, it is a case. */
WireCase readWireCase(const std::string& text);

/** All requests of a file. Whatever the text is, it has at least one. */
std::vector<WireCase> readWireCases(const std::string& text);

/** A reply in the form in which cases have it. */
std::string textOf(const HttpReply& reply);

} // namespace ObjectManager::CimXml

#endif

/**
 * Requests as they come over the wire, with their exact replies. Every file in cases/ has one or more requests, which a
 * service that has just been made answers one after the other:
 *
 *     # What the case is about.
 *     POST operator 5                     the HTTP method, the user (operator, reader or stranger), and optionally how
 *                                         many seconds pass before the request
 *     CIMOperation: MethodCall            the headers and, after an empty line, the body
 *     ==== 200                            the status of the reply
 *     CIMOperation: MethodResponse        its headers and, after an empty line, its body
 *     ++++                                separates requests
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
    /** The part of the file before the reply, unchanged. */
    std::string requestText;
    /** The request, which refers to `body`. */
    HttpRequest request() const { return {method, headers, body}; }
    std::string method;
    std::vector<std::pair<std::string, std::string>> headers;
    std::string body;
    Caller caller;
    std::chrono::seconds pause{0};
    /** The text after the separator; empty if the file has no reply yet. */
    std::string reply;
};

/** Reads one request with its reply. Every text is a valid case: fuzzing uses this, too. */
WireCase readWireCase(const std::string& text);

/** Reads all requests of a file. Every text has at least one. */
std::vector<WireCase> readWireCases(const std::string& text);

/** A reply as text, in the form of the files. */
std::string textOf(const HttpReply& reply);

} // namespace ObjectManager::CimXml

#endif

/**
 * A service on the shipped classes and providers with a simulated machine, in root/cimv2 and root/interop, and on the
 * classes of the tests' own provider, in root/test.
 */
#ifndef TESTS_OBJECTMANAGER_CIMXML_SERVICEFIXTURE_H
#define TESTS_OBJECTMANAGER_CIMXML_SERVICEFIXTURE_H

#include "cimxml/Service.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <utility>
#include <vector>

namespace ObjectManager::CimXml {

class ServiceFixture : public testing::Test {
protected:
    /** Made once: the agent reads its configuration once in a process. */
    static Service& service();

    /** Another one beside it, with settings of its own. */
    static Service serviceWith(const ServiceSettings& settings);

    /** Where the simulated machine keeps its state. */
    static std::filesystem::path stateFile();

    static HttpReply answer(const std::string& httpMethod, std::vector<std::pair<std::string, std::string>> headers,
                            const std::string& body, const Caller& caller = {"operator", true, true});
};

/** The headers of a request for an intrinsic method in a namespace. */
std::vector<std::pair<std::string, std::string>> requestHeaders(const std::string& method,
                                                                const std::string& nameSpace = "root/test");

/** The document that asks for an intrinsic method, with these IPARAMVALUE elements. */
std::string requestBody(const std::string& method, const std::string& parameters,
                        const std::string& nameSpace = "root/test");

/** The value of a header; empty where it is not there. */
std::string headerOf(const HttpReply& reply, const std::string& name);

} // namespace ObjectManager::CimXml

#endif

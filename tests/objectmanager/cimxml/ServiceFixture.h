/**
 * A service with the shipped classes and providers and a simulated machine, in root/cimv2 and root/interop, and with
 * the classes of the tests' own provider, in root/test.
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
    /** The service of all tests. It is made once, since the agent reads its configuration once in a process. */
    static Service& service();

    /** Another service for the same machine, with other settings. */
    static Service serviceWith(const ServiceSettings& settings);

    /** The file with the state of the simulated machine. */
    static std::filesystem::path stateFile();

    static HttpReply answer(const std::string& httpMethod, std::vector<std::pair<std::string, std::string>> headers,
                            const std::string& body, const Caller& caller = {"operator", true, true});
};

/** The headers of a request that calls an intrinsic method in a namespace. */
std::vector<std::pair<std::string, std::string>> requestHeaders(const std::string& method,
                                                                const std::string& nameSpace = "root/test");

/** The document that calls an intrinsic method. @param parameters the elements IPARAMVALUE. */
std::string requestBody(const std::string& method, const std::string& parameters,
                        const std::string& nameSpace = "root/test");

/** The value of a header; empty if the reply does not have it. */
std::string headerOf(const HttpReply& reply, const std::string& name);

} // namespace ObjectManager::CimXml

#endif

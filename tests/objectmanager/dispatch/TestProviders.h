/** The registrations of the provider libraries that the tests load. */
#ifndef TESTS_OBJECTMANAGER_DISPATCH_TESTPROVIDERS_H
#define TESTS_OBJECTMANAGER_DISPATCH_TESTPROVIDERS_H

#include "CimErrors.h"
#include "dispatch/Dispatcher.h"

#include <string>
#include <utility>

namespace ObjectManager {

/** The folder of the libraries. */
inline const std::filesystem::path testProviders = TEST_PROVIDERS;

/** A class that liborvtestprovider.so serves with instances and methods. */
inline Registration testRegistration(const std::string& className) {
    Registration registration;
    registration.className = className;
    registration.provider = "TestProvider";
    registration.location = "orvtestprovider";
    registration.nameSpaces = {"root/cimv2", "root/interop"};
    registration.instance = true;
    registration.method = true;
    return registration;
}

/** An association class that liborvtestprovider.so serves. */
inline Registration testAssociation(const std::string& className) {
    Registration registration = testRegistration(className);
    registration.instance = false;
    registration.method = false;
    registration.association = true;
    return registration;
}

/** A provider in liborvbrokenprovider.so. */
inline Registration brokenRegistration(const std::string& provider) {
    Registration registration;
    registration.className = "Test_" + provider;
    registration.provider = provider;
    registration.location = "orvbrokenprovider";
    registration.nameSpaces = {"root/cimv2"};
    registration.instance = true;
    return registration;
}

} // namespace ObjectManager

#endif

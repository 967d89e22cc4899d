#include "registry/Registry.h"

#include "CimErrors.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ObjectManager {
namespace {

Registration registrationOf(const std::string& className, const std::string& provider, bool Registration::*kind) {
    Registration registration;
    registration.className = className;
    registration.provider = provider;
    registration.location = "orvtestprovider";
    registration.nameSpaces = {"root/cimv2", "root/interop"};
    registration.*kind = true;
    return registration;
}

class RegistryTest : public testing::Test {
protected:
    const Registry registry{{registrationOf("Test_Disk", "DiskInstances", &Registration::instance),
                             registrationOf("Test_Disk", "DiskMethods", &Registration::method),
                             registrationOf("Test_Holds", "Holds", &Registration::association)}};
};

TEST_F(RegistryTest, FindsTheProviderOfEachKind) {
    EXPECT_EQ("DiskInstances", registry.find("root/cimv2", "Test_Disk", ProviderKind::instance).provider);
    EXPECT_EQ("DiskMethods", registry.find("root/cimv2", "Test_Disk", ProviderKind::method).provider);
    EXPECT_EQ("Holds", registry.find("root/interop", "Test_Holds", ProviderKind::association).provider);
}

TEST_F(RegistryTest, ServesTheClassesOfOneNamespaceOfDiscoveryInTheOtherOneToo) {
    EXPECT_EQ("Holds", registry.find("interop", "Test_Holds", ProviderKind::association).provider);
    EXPECT_THAT(registry.nameSpaces(), testing::ElementsAre("interop", "root/cimv2", "root/interop"));

    Registration registration = registrationOf("Test_Disk", "DiskInstances", &Registration::instance);
    registration.nameSpaces = {"Interop"};
    EXPECT_THAT(Registry({registration}).nameSpaces(), testing::ElementsAre("Interop", "root/interop"));
    registration.nameSpaces = {"root/cimv2"};
    EXPECT_THAT(Registry({registration}).nameSpaces(), testing::ElementsAre("root/cimv2"));
}

TEST(Registration, TellsWhichMethodsTheProviderMayImplement) {
    Registration registration;
    EXPECT_TRUE(registration.mayImplement("Any"));
    registration.methods = {"Start", "Stop"};
    EXPECT_TRUE(registration.mayImplement("STOP"));
    EXPECT_FALSE(registration.mayImplement("Any"));
}

TEST_F(RegistryTest, LetterCaseDoesNotMatter) {
    EXPECT_EQ("DiskInstances", registry.find("ROOT/CIMV2", "test_disk", ProviderKind::instance).provider);
}

TEST_F(RegistryTest, KnowsTheNamespacesThatARegistrationNames) {
    EXPECT_NO_THROW(registry.requireNameSpace("Root/Interop"));
    EXPECT_THAT(errorOf([&] { registry.requireNameSpace("root/inter"); }),
                isError(CMPI_RC_ERR_INVALID_NAMESPACE, "no provider is registered in namespace \"root/inter\""));
    EXPECT_TRUE(registry.registrations().front().isIn("ROOT/cimv2"));
    EXPECT_FALSE(registry.registrations().front().isIn("root"));
}

TEST_F(RegistryTest, SaysWhatIsNotRegistered) {
    const auto find = [&](const char* nameSpace, const char* className, ProviderKind kind) {
        return errorOf([&] { registry.find(nameSpace, className, kind); });
    };
    EXPECT_THAT(find("root", "Test_Disk", ProviderKind::instance),
                isError(CMPI_RC_ERR_INVALID_NAMESPACE, "no provider is registered in namespace \"root\""));
    EXPECT_THAT(find("root/cimv2", "Test_Tape", ProviderKind::instance),
                isError(CMPI_RC_ERR_INVALID_CLASS,
                        "no provider is registered for class \"Test_Tape\" in namespace \"root/cimv2\""));
    EXPECT_THAT(find("root/cimv2", "Test_Holds", ProviderKind::instance),
                isError(CMPI_RC_ERR_NOT_SUPPORTED, "no instance provider is registered for class \"Test_Holds\""));
    EXPECT_THAT(find("root/cimv2", "Test_Disk", ProviderKind::association),
                isError(CMPI_RC_ERR_NOT_SUPPORTED, "no association provider is registered for class \"Test_Disk\""));
    EXPECT_THAT(find("root/cimv2", "Test_Holds", ProviderKind::method),
                isError(CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "no method provider is registered for class \"Test_Holds\""));
}

} // namespace
} // namespace ObjectManager

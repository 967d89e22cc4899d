#include "registry/RegistrationWriter.h"
#include "registry/RegistrationReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

namespace ObjectManager {
namespace {

const ProviderModule module = {"disks", "Test", "1.2.3"};

Registration disk() {
    Registration registration;
    registration.className = "Test_Disk";
    registration.provider = "DiskProvider";
    registration.location = "testdisks";
    registration.nameSpaces = {"root/cimv2", "root/interop"};
    registration.instance = true;
    registration.method = true;
    registration.methods = {"Start", "Stop"};
    return registration;
}

/** A registration with the same provider as the disks. */
Registration diskInBay() {
    Registration registration = disk();
    registration.className = "Test_DiskInBay";
    registration.nameSpaces = {"root/cimv2"};
    registration.method = false;
    registration.methods = {};
    registration.association = true;
    return registration;
}

TEST(RegistrationSections, AreWhatObjectManagersRead) {
    EXPECT_EQ(registrationSections({disk(), diskInBay()}), "[Test_Disk]\n"
                                                           "   provider: DiskProvider\n"
                                                           "   location: testdisks\n"
                                                           "   type: instance method\n"
                                                           "   namespace: root/cimv2 root/interop\n"
                                                           "   methods: Start Stop\n"
                                                           "[Test_DiskInBay]\n"
                                                           "   provider: DiskProvider\n"
                                                           "   location: testdisks\n"
                                                           "   type: instance association\n"
                                                           "   namespace: root/cimv2\n");
}

TEST(RegistrationSections, AreReadBackAsTheyWere) {
    Registration all = disk();
    all.association = all.property = all.indication = true;
    const std::string text = registrationSections({all});
    const std::vector<Registration> read = readRegistrations(text, "x.reg");
    ASSERT_EQ(read.size(), 1);
    EXPECT_TRUE(read[0].instance && read[0].method && read[0].association && read[0].property && read[0].indication);
    EXPECT_EQ(registrationSections(read), text);
}

TEST(RegistrationInstances, AreOneModuleWithEachProviderOnceAndTheCapabilitiesOfEachClass) {
    EXPECT_EQ(registrationInstances({disk(), diskInBay()}, module), "instance of PG_ProviderModule {\n"
                                                                    "    Name = \"disks\";\n"
                                                                    "    Vendor = \"Test\";\n"
                                                                    "    Version = \"1.2.3\";\n"
                                                                    "    InterfaceType = \"CMPI\";\n"
                                                                    "    InterfaceVersion = \"2.0.0\";\n"
                                                                    "    Location = \"testdisks\";\n"
                                                                    "};\n"
                                                                    "\n"
                                                                    "instance of PG_Provider {\n"
                                                                    "    ProviderModuleName = \"disks\";\n"
                                                                    "    Name = \"DiskProvider\";\n"
                                                                    "};\n"
                                                                    "\n"
                                                                    "instance of PG_ProviderCapabilities {\n"
                                                                    "    ProviderModuleName = \"disks\";\n"
                                                                    "    ProviderName = \"DiskProvider\";\n"
                                                                    "    CapabilityID = \"Test_Disk\";\n"
                                                                    "    ClassName = \"Test_Disk\";\n"
                                                                    "    Namespaces = {\"root/cimv2\", "
                                                                    "\"root/interop\"};\n"
                                                                    "    ProviderType = {2, 5};\n"
                                                                    "    SupportedProperties = NULL;\n"
                                                                    "    SupportedMethods = {\"Start\", \"Stop\"};\n"
                                                                    "};\n"
                                                                    "\n"
                                                                    "instance of PG_ProviderCapabilities {\n"
                                                                    "    ProviderModuleName = \"disks\";\n"
                                                                    "    ProviderName = \"DiskProvider\";\n"
                                                                    "    CapabilityID = \"Test_DiskInBay\";\n"
                                                                    "    ClassName = \"Test_DiskInBay\";\n"
                                                                    "    Namespaces = {\"root/cimv2\"};\n"
                                                                    "    ProviderType = {2, 3};\n"
                                                                    "    SupportedProperties = NULL;\n"
                                                                    "    SupportedMethods = NULL;\n"
                                                                    "};\n");
}

std::string errorOf(const std::vector<Registration>& registrations) {
    try {
        registrationInstances(registrations, module);
    } catch (const std::invalid_argument& error) {
        return error.what();
    }
    return "";
}

TEST(RegistrationInstances, AreOfOneLibrary) {
    Registration elsewhere = diskInBay();
    elsewhere.location = "testbays";
    EXPECT_EQ(errorOf({disk(), elsewhere}), "Test_DiskInBay: found location 'testbays', expected 'testdisks'");
    EXPECT_EQ(errorOf({}), "found no registration, expected the registrations of a library");
}

TEST(RegistrationInstances, HaveNoNumberForPropertyProviders) {
    Registration property = disk();
    property.property = true;
    EXPECT_EQ(errorOf({property}),
              "Test_Disk: found type 'property', expected one that PG_ProviderCapabilities has a number for");
}

} // namespace
} // namespace ObjectManager

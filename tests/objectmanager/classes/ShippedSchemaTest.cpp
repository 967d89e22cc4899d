#include "classes/Catalogue.h"
#include "classes/Literals.h"
#include "classes/SchemaFiles.h"
#include "registry/RegistrationReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace ObjectManager {
namespace {

using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::Field;
using testing::HasSubstr;
using testing::Not;
using testing::Optional;

class ShippedSchemaTest : public testing::Test {
protected:
    Catalogue _catalogue = readCatalogue(ORV_SCHEMA_FOLDER);
    std::vector<Registration> _registrations = readRegistrations(std::filesystem::path(ORV_SCHEMA_FOLDER));
};

TEST_F(ShippedSchemaTest, DeclaresEveryRegisteredClass) {
    ASSERT_FALSE(_registrations.empty());
    for (const Registration& registration : _registrations) {
        EXPECT_NE(_catalogue.find(registration.className), nullptr) << registration.className;
        EXPECT_THAT(registration.nameSpaces, Contains("root/interop")) << registration.className;
    }
}

TEST_F(ShippedSchemaTest, RegistersTheServiceForInstancesAndMethods) {
    EXPECT_THAT(_registrations, Contains(AllOf(Field(&Registration::className, "TALVO_PowerManagementService"),
                                               Field(&Registration::provider, "PowerManagementServiceProvider"),
                                               Field(&Registration::location, "orvpowerstatemanagementprovider"),
                                               Field(&Registration::instance, true), Field(&Registration::method, true),
                                               Field(&Registration::association, false),
                                               Field(&Registration::methods, ElementsAre("RequestPowerStateChange")))));
}

/** sfcb terminates if a registration has a key that it does not know. */
TEST_F(ShippedSchemaTest, RegistersWithSfcbInItsOwnForm) {
    const std::filesystem::path folder = ORV_SCHEMA_FOLDER;
    for (const char* name : {"orv-power-management.reg", "orv-computer-system.reg", "orv-profile.reg"}) {
        std::string text = readFile(folder / name);
        const std::string methods = "   methods: RequestPowerStateChange\n";
        if (const std::size_t line = text.find(methods); line != std::string::npos) {
            text.erase(line, methods.size());
        }
        EXPECT_EQ(readFile(folder / "sfcb" / name), text);
    }
}

TEST_F(ShippedSchemaTest, RegistersTheCapabilitiesForInstancesOnly) {
    EXPECT_THAT(_registrations,
                Contains(AllOf(Field(&Registration::className, "TALVO_PowerManagementCapabilities"),
                               Field(&Registration::provider, "PowerManagementCapabilitiesProvider"),
                               Field(&Registration::instance, true), Field(&Registration::method, false),
                               Field(&Registration::association, false))));
}

/** The text of the instances that register a library, by the name of its files. */
std::string instancesOf(const std::string& name) {
    return readFile(std::filesystem::path(ORV_SCHEMA_FOLDER) / "pg" / (name + ".mof"));
}

std::string quoted(const std::vector<std::string>& names) {
    std::string text;
    for (const std::string& name : names) {
        text += (text.empty() ? "\"" : ", \"") + name + '"';
    }
    return text;
}

TEST_F(ShippedSchemaTest, RegistersTheLibrariesByInstancesToo) {
    const std::string power = instancesOf("orv-power-management");
    EXPECT_THAT(power, HasSubstr("    Location = \"orvpowerstatemanagementprovider\";\n"));
    EXPECT_THAT(power, Not(HasSubstr("TALVO_ComputerSystem")));
    const std::string computerSystem = instancesOf("orv-computer-system");
    EXPECT_THAT(computerSystem, HasSubstr("    Location = \"orvcomputersystemprovider\";\n"));
    EXPECT_THAT(computerSystem, Not(HasSubstr("TALVO_Power")));
    const std::string profile = instancesOf("orv-profile");
    EXPECT_THAT(profile, HasSubstr("    Location = \"orvprofileprovider\";\n"));
    for (const Registration& registration : _registrations) {
        if (registration.location == "orvcim") {
            EXPECT_THAT(power + computerSystem + profile, Not(HasSubstr(registration.className)));
            continue;
        }
        const std::string types = registration.association ? "2, 3" : registration.method ? "2, 5" : "2";
        EXPECT_THAT(power + computerSystem + profile, HasSubstr("    ProviderName = \"" + registration.provider +
                                                                "\";\n"
                                                                "    CapabilityID = \"" +
                                                                registration.className +
                                                                "\";\n"
                                                                "    ClassName = \"" +
                                                                registration.className +
                                                                "\";\n"
                                                                "    Namespaces = {" +
                                                                quoted(registration.nameSpaces) +
                                                                "};\n"
                                                                "    ProviderType = {" +
                                                                types + "};\n"));
    }
}

struct Link {
    const char* className;
    const char* ancestor;
    std::vector<std::string> ends;
};

TEST_F(ShippedSchemaTest, RegistersAndDeclaresTheAssociationsWithTheClassesAtTheirEnds) {
    const Link links[] = {
        {"TALVO_AssociatedPowerManagementService",
         "CIM_AssociatedPowerManagementService",
         {"ServiceProvided TALVO_PowerManagementService", "UserOfService CIM_ComputerSystem"}},
        {"TALVO_PowerManagementElementCapabilities",
         "CIM_ElementCapabilities",
         {"ManagedElement TALVO_PowerManagementService", "Capabilities TALVO_PowerManagementCapabilities"}},
        {"TALVO_PowerManagementHostedService",
         "CIM_HostedService",
         {"Antecedent CIM_ComputerSystem", "Dependent TALVO_PowerManagementService"}},
    };
    for (const Link& link : links) {
        EXPECT_THAT(_registrations,
                    Contains(AllOf(Field(&Registration::className, link.className),
                                   Field(&Registration::location, "orvpowerstatemanagementprovider"),
                                   Field(&Registration::instance, true), Field(&Registration::association, true))));
        EXPECT_TRUE(_catalogue.isA(link.className, link.ancestor)) << link.className;
        std::vector<std::string> ends;
        std::vector<std::string> roles;
        for (const ReferenceEnd& end : _catalogue.references(link.className)) {
            ends.push_back(end.role + " " + end.className);
            roles.push_back(end.role);
        }
        EXPECT_EQ(ends, link.ends);
        EXPECT_THAT(_catalogue.keyNames(link.className), testing::ElementsAreArray(roles));
    }
}

TEST_F(ShippedSchemaTest, GivesTheServiceItsKeysAndItsMethod) {
    EXPECT_THAT(_catalogue.keyNames("TALVO_PowerManagementService"),
                ElementsAre("Name", "SystemCreationClassName", "SystemName", "CreationClassName"));
    const Method* method = _catalogue.find("TALVO_PowerManagementService")->method("RequestPowerStateChange");
    ASSERT_NE(method, nullptr);
    EXPECT_EQ(method->type, CMPI_uint32);
    EXPECT_THAT(method->parameters,
                ElementsAre(AllOf(Field(&Parameter::name, "PowerState"), Field(&Parameter::type, CMPI_uint16)),
                            AllOf(Field(&Parameter::name, "ManagedElement"), Field(&Parameter::type, CMPI_ref),
                                  Field(&Parameter::referenceClass, "CIM_ManagedElement")),
                            AllOf(Field(&Parameter::name, "Time"), Field(&Parameter::type, CMPI_dateTime)),
                            AllOf(Field(&Parameter::name, "Job"), Field(&Parameter::referenceClass, "CIM_ConcreteJob")),
                            AllOf(Field(&Parameter::name, "TimeoutPeriod"), Field(&Parameter::type, CMPI_dateTime))));
    EXPECT_FALSE(method->parameters[3].isIn());
    EXPECT_TRUE(method->parameters[3].isOut());
    EXPECT_THAT(meaning(*method, unsignedValue(CMPI_uint32, 0)), Optional(std::string("Completed with No Error")));
}

TEST_F(ShippedSchemaTest, GivesTheCapabilitiesTheirKeyAndTheirCodes) {
    EXPECT_THAT(_catalogue.keyNames("TALVO_PowerManagementCapabilities"), ElementsAre("InstanceID"));
    const Class& capabilities = *_catalogue.find("TALVO_PowerManagementCapabilities");
    const auto meaningOf = [&](const char* name, std::uint64_t code) {
        return meaning(*capabilities.property(name), unsignedValue(CMPI_uint16, code));
    };
    EXPECT_THAT(meaningOf("PowerStatesSupported", 2), Optional(std::string("On")));
    EXPECT_THAT(meaningOf("PowerStatesSupported", 5), Optional(std::string("Power Cycle (Off - Soft)")));
    EXPECT_THAT(meaningOf("PowerStatesSupported", 8), Optional(std::string("Off - Soft")));
    EXPECT_THAT(meaningOf("PowerChangeCapabilities", 3), Optional(std::string("Power State Settable")));
    EXPECT_THAT(meaningOf("PowerChangeCapabilities", 8), Optional(std::string("Graceful Shutdown Supported")));
}

/** If this test passes, the served classes can be loaded together with the whole common model of any version. */
TEST_F(ShippedSchemaTest, HasTheServedClassesOverrideNothingButToNarrowReferences) {
    for (const Class* served : _catalogue.all()) {
        if (!served->name.starts_with("TALVO_")) {
            continue;
        }
        const Class& ancestor = *_catalogue.find(served->superClass);
        EXPECT_EQ(served->methods.size(), ancestor.methods.size()) << served->name;
        ASSERT_EQ(served->properties.size(), ancestor.properties.size()) << served->name;
        for (const Property& property : served->properties) {
            if (property.isDeclaredBy(*served)) {
                const std::string& wider = ancestor.property(property.name)->referenceClass;
                EXPECT_NE(property.referenceClass, wider) << served->name << '.' << property.name;
                EXPECT_TRUE(_catalogue.isA(property.referenceClass, wider)) << served->name << '.' << property.name;
            }
        }
        for (const Method& method : served->methods) {
            EXPECT_FALSE(method.isDeclaredBy(*served)) << served->name << '.' << method.name;
        }
    }
}

TEST_F(ShippedSchemaTest, DerivesTheServedClassesFromTheClassesOfTheProfile) {
    const std::pair<const char*, const char*> derivations[] = {
        {"TALVO_AssociatedPowerManagementService", "CIM_AssociatedPowerManagementService"},
        {"TALVO_ComputerSystem", "CIM_ComputerSystem"},
        {"TALVO_ElementConformsToProfile", "CIM_ElementConformsToProfile"},
        {"TALVO_PowerManagementCapabilities", "CIM_PowerManagementCapabilities"},
        {"TALVO_PowerManagementElementCapabilities", "CIM_ElementCapabilities"},
        {"TALVO_PowerManagementHostedService", "CIM_HostedService"},
        {"TALVO_PowerManagementService", "CIM_PowerManagementService"},
        {"TALVO_ReferencedProfile", "CIM_ReferencedProfile"},
        {"TALVO_RegisteredProfile", "CIM_RegisteredProfile"},
    };
    std::vector<std::pair<std::string, std::string>> served;
    for (const Class* declared : _catalogue.all()) {
        if (declared->name.starts_with("TALVO_")) {
            served.emplace_back(declared->name, declared->superClass);
        }
    }
    EXPECT_THAT(served, testing::ElementsAreArray(derivations));
}

TEST_F(ShippedSchemaTest, HasTheServedClassesDescendFromTheCommonModel) {
    EXPECT_TRUE(_catalogue.isA("TALVO_PowerManagementService", "CIM_Service"));
    EXPECT_TRUE(_catalogue.isA("TALVO_PowerManagementService", "CIM_ManagedElement"));
    EXPECT_TRUE(_catalogue.isA("TALVO_PowerManagementCapabilities", "CIM_Capabilities"));
}

} // namespace
} // namespace ObjectManager

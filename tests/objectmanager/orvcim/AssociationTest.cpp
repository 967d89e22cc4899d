/* The associations of the shipped classes, from every end and as a drawing. */
#include "Provided.h"
#include "basics/Files.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <iterator>
#include <ostream>

namespace OrvcimTest {
namespace {

using ObjectManager::contentOf;
using testing::HasSubstr;
using testing::StartsWith;

/** The name of the file in data that has the expected answer. */
struct Query {
    const char* name;
    const char* command;
    /** SYSTEM, SERVICE or CAPABILITIES stands for the path of that object of the machine. */
    const char* source;
    std::vector<std::string> options;
};

void PrintTo(const Query& query, std::ostream* out) {
    *out << query.name;
}

class AssociationTest : public ProvidedTest, public testing::WithParamInterface<Query> {
protected:
    std::string pathOf(const std::string& source) const {
        return source == "SYSTEM" ? _system : source == "SERVICE" ? _service : _capabilities;
    }
};

TEST_P(AssociationTest, IsAnsweredAsItsFileSays) {
    std::vector<std::string> arguments = {GetParam().command, pathOf(GetParam().source)};
    arguments.insert(arguments.end(), GetParam().options.begin(), GetParam().options.end());
    EXPECT_EQ(answerOf(arguments), contentOf(std::filesystem::path(ORVCIM_TEST_DATA) / GetParam().name));
}

const std::vector<std::string> elementName = {"--properties", "ElementName"};

INSTANTIATE_TEST_SUITE_P(
    query, AssociationTest,
    testing::Values(Query{"system.associator-names", "associator-names", "SYSTEM", {}},
                    Query{"service.associator-names", "associator-names", "SERVICE", {}},
                    Query{"capabilities.associator-names", "associator-names", "CAPABILITIES", {}},
                    Query{"system.associators", "associators", "SYSTEM", elementName},
                    Query{"service.associators", "associators", "SERVICE", elementName},
                    Query{"capabilities.associators", "associators", "CAPABILITIES", elementName},
                    Query{"system.reference-names", "reference-names", "SYSTEM", {}},
                    Query{"service.reference-names", "reference-names", "SERVICE", {}},
                    Query{"capabilities.reference-names", "reference-names", "CAPABILITIES", {}},
                    Query{"system.references", "references", "SYSTEM", {}},
                    Query{"service.references", "references", "SERVICE", {}},
                    Query{"capabilities.references", "references", "CAPABILITIES", {}},
                    Query{"nothing", "associators", "CAPABILITIES", {"--assoc-class", "CIM_Dependency"}},
                    Query{"nothing", "associators", "SYSTEM", {"--result-class", "CIM_System"}},
                    Query{"nothing", "references", "SERVICE", {"--role", "UserOfService"}}),
    [](const auto& query) {
        std::string name = query.param.command + std::to_string(query.index);
        std::erase(name, '-');
        return name;
    });

struct Restricted {
    const char* option;
    const char* value;
    const char* association;
};

TEST_F(ProvidedTest, RestrictsAssociationsByClassesTheirAncestorsAndRoles) {
    const Restricted restrictions[] = {
        {"--assoc-class", "TALVO_PowerManagementHostedService", "TALVO_PowerManagementHostedService"},
        {"--assoc-class", "CIM_Dependency", "TALVO_PowerManagementHostedService"},
        {"--assoc-class", "cim_serviceavailabletoelement", "TALVO_AssociatedPowerManagementService"},
        {"--result-class", "CIM_Capabilities", "TALVO_PowerManagementElementCapabilities"},
        {"--role", "ServiceProvided", "TALVO_AssociatedPowerManagementService"},
        {"--role", "dependent", "TALVO_PowerManagementHostedService"},
        {"--result-role", "Capabilities", "TALVO_PowerManagementElementCapabilities"},
    };
    for (const Restricted& restricted : restrictions) {
        const std::string names = answerOf({"associator-names", _service, restricted.option, restricted.value});
        EXPECT_THAT(names, StartsWith(std::string(restricted.association) + "\n  root/cimv2:"));
        EXPECT_EQ(std::count(names.begin(), names.end(), '\n'), 2) << names;
    }
}

/** The shipped schema without the registration of the computer system. */
class NoComputerSystemTest : public ProvidedTest {
protected:
    NoComputerSystemTest() {
        std::filesystem::copy(ORV_SCHEMA_FOLDER, _folder / "schema");
        std::filesystem::remove(_folder / "schema" / "orv-computer-system.reg");
    }

    Outcome withoutSystem(std::vector<std::string> arguments) const {
        arguments.insert(arguments.end(), {"--schema", (_folder / "schema").string()});
        return orvcim(arguments);
    }
};

TEST_F(NoComputerSystemTest, FailsForTheAssociationsThatNeedItAndSaysWhy) {
    for (const char* command : {"associators", "associator-names", "references", "reference-names"}) {
        const Outcome outcome = withoutSystem({command, _service});
        EXPECT_EQ(outcome.err, "orvcim: " + _service +
                                   ": CIM_ERR_INVALID_CLASS (5): TALVO_AssociatedPowerManagementService: no provider "
                                   "is registered for class \"TALVO_ComputerSystem\" in namespace \"root/cimv2\"; the "
                                   "provider logged: CBEnumInstanceNames Failed for the target Class\n");
        EXPECT_EQ(outcome.out, "");
        EXPECT_EQ(outcome.status, 1);
    }
}

TEST_F(NoComputerSystemTest, ServesTheAssociationThatDoesNotNeedIt) {
    const Outcome outcome = withoutSystem({"associator-names", _service, "--assoc-class", "CIM_ElementCapabilities"});
    EXPECT_EQ(outcome.out, "TALVO_PowerManagementElementCapabilities\n  " + _capabilities + "\n");
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.status, 0);
}

TEST_F(NoComputerSystemTest, TellsWhatTheProviderLoggedBesideAnAnswerThatIsMerelyEmpty) {
    const Outcome outcome = withoutSystem({"instances", "TALVO_AssociatedPowerManagementService"});
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "orvcim: the provider logged: CBEnumInstanceNames Failed for the target Class\n");
    EXPECT_EQ(outcome.status, 0);
}

TEST_F(ProvidedTest, WalksFromTheProfilesToTheMachine) {
    const std::string profile = "root/interop:TALVO_RegisteredProfile.InstanceID=";
    const std::string service =
        "root/cimv2:TALVO_PowerManagementService.Name=\"PowerStateManagement_chassis/blade1\",SystemCreationClassName="
        "\"TALVO_ComputerSystem\",SystemName=\"machine.example\",CreationClassName=\"TALVO_PowerManagementService\"";
    EXPECT_EQ(answerOf({"profiles"}), "Namespaces: interop, root/cimv2, root/interop\n"
                                      "\n"
                                      "Power State Management 1.0.2\n"
                                      "  profile           " +
                                          profile +
                                          "\"TALVO:DSP1027-1.0.2\"\n"
                                          "  organization      2 (DMTF)\n"
                                          "  refers to         Profile Registration 1.0.0\n"
                                          "  central instance  " +
                                          service +
                                          "\n"
                                          "  hosted by         " +
                                          _system +
                                          "\n"
                                          "  manages           " +
                                          _system +
                                          "\n"
                                          "  capabilities      " +
                                          _capabilities +
                                          "\n"
                                          "  power states      2 (On), 5 (Power Cycle (Off - Soft)), 8 (Off - Soft)\n"
                                          "\n"
                                          "Profile Registration 1.0.0\n"
                                          "  profile       " +
                                          profile +
                                          "\"TALVO:DSP1033-1.0.0\"\n"
                                          "  organization  2 (DMTF)\n");
}

TEST_F(ProvidedTest, FindsNoProfilesInASchemaThatHasNone) {
    std::filesystem::copy(ORV_SCHEMA_FOLDER, _folder / "schema");
    std::filesystem::remove(_folder / "schema" / "orv-profile.reg");
    const Outcome outcome = orvcim({"profiles", "--schema", (_folder / "schema").string()});
    EXPECT_EQ(outcome.err,
              "orvcim: found no registered profile in root/interop, expected that of power state management\n");
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, 1);
}

using GraphTest = ProvidedTest;

TEST_F(GraphTest, HasEveryInstanceWithItsAssociations) {
    EXPECT_EQ(answerOf({"graph"}), contentOf(std::filesystem::path(ORVCIM_TEST_DATA) / "graph.dot"));
}

} // namespace
} // namespace OrvcimTest

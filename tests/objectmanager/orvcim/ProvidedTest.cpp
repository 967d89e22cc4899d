#include "Provided.h"

#include <chrono>

#include <gmock/gmock.h>

#include <unistd.h>

#include <utility>

namespace OrvcimTest {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

TEST_F(ProvidedTest, EveryRegisteredProviderLoads) {
    EXPECT_EQ(orvcim({"check"}).status, 0);
}

TEST_F(ProvidedTest, ChecksTheAgent) {
    EXPECT_THAT(answerOf({"check"}), HasSubstr("Embedded agent: ok\n"
                                               "  user                 uid " +
                                               std::to_string(geteuid()) +
                                               "\n"
                                               "  configuration        " +
                                               (_folder / "agent.toml").string() +
                                               "\n"
                                               "  log                  " +
                                               (_folder / "log").string() +
                                               ", level 6000\n"
                                               "  machine              a simulated machine (1 node, state in " +
                                               (_folder / "state.json").string() +
                                               ")\n"
                                               "  node chassis/blade1  2 (On)\n"));
}

TEST_F(ProvidedTest, ChecksTheAgentsConfiguration) {
    configure("reboot-time = \"soon\"\n");
    const Outcome wrong = orvcim({"check", "--format", "json"});
    EXPECT_EQ(wrong.err, "orvcim: not usable: the embedded agent\n");
    EXPECT_EQ(wrong.status, 1);
    EXPECT_THAT(wrong.out, HasSubstr("agent.toml:8: instrumentation.simulated.reboot-time: \\\"soon\\\": expected a "
                                     "number of seconds from 0 to 86400: until this is corrected, the agent offers "
                                     "no power-management node\""));

    configure("");
    std::filesystem::create_directory(_folder / "state.json");
    EXPECT_THAT(orvcim({"check"}).out, HasSubstr("state.json: is not a regular file: Invalid argument"));

    std::ofstream(_folder / "agent.toml") << "[log]\ndestination = \"file\"\nfile = \"/nowhere/agent.log\"\n";
    EXPECT_THAT(
        orvcim({"check", "--format", "json"}).out,
        HasSubstr(
            "the log /nowhere/agent.log cannot be written: there is no folder /nowhere: make it, or name another "));
}

TEST_F(ProvidedTest, NamesTheService) {
    EXPECT_EQ(answerOf({"names", "TALVO_PowerManagementService"}), _service + "\n");
    EXPECT_EQ(answerOf({"names", "TALVO_PowerManagementService", "--namespace", "root/interop"}).substr(0, 13),
              "root/interop:");
}

TEST_F(ProvidedTest, ShowsTheServiceInEveryFormat) {
    const std::string table = answerOf({"get", _service});
    EXPECT_THAT(table, StartsWith("root/cimv2:TALVO_PowerManagementService\n"
                                  "  * CreationClassName        TALVO_PowerManagementService\n"
                                  "  * Name                     PowerStateManagement_chassis/blade1\n"
                                  "  * SystemCreationClassName  TALVO_ComputerSystem\n"
                                  "  * SystemName               machine.example\n"
                                  "    Caption                  "));
    EXPECT_THAT(table, HasSubstr("    ElementName              PowerStateManagement_chassis/blade1\n"));
    EXPECT_EQ(answerOf({"instances", "TALVO_PowerManagementService"}), table);
    EXPECT_EQ(answerOf({"instances", "TALVO_PowerManagementService", "--properties", "ElementName", "--format", "mof"}),
              "instance of TALVO_PowerManagementService {\n"
              "    CreationClassName = \"TALVO_PowerManagementService\";\n"
              "    Name = \"PowerStateManagement_chassis/blade1\";\n"
              "    SystemCreationClassName = \"TALVO_ComputerSystem\";\n"
              "    SystemName = \"machine.example\";\n"
              "    ElementName = \"PowerStateManagement_chassis/blade1\";\n"
              "};\n");
    EXPECT_THAT(answerOf({"get", _service, "--format", "json"}),
                HasSubstr("\"SystemName\": \"machine.example\",\n    \"Caption\": \""));
}

TEST_F(ProvidedTest, ShowsTheCapabilitiesWithWhatTheirCodesMean) {
    EXPECT_EQ(answerOf({"instances", "TALVO_PowerManagementCapabilities"}),
              "root/cimv2:TALVO_PowerManagementCapabilities\n"
              "  * InstanceID               chassis/blade1\n"
              "    PowerChangeCapabilities  3 (Power State Settable), 4 (Power Cycling Supported),\n"
              "                             8 (Graceful Shutdown Supported)\n"
              "    ElementName              PowerStateManagementCapabilities_chassis/blade1\n"
              "    PowerStatesSupported     2 (On), 5 (Power Cycle (Off - Soft)), 8 (Off - Soft)\n");
}

TEST_F(ProvidedTest, ShowsTheComputerSystemWithWhatItsCodesMean) {
    EXPECT_EQ(answerOf({"instances", "TALVO_ComputerSystem", "--properties",
                        "ElementName,NameFormat,EnabledState,RequestedState,Dedicated"}),
              "root/cimv2:TALVO_ComputerSystem\n"
              "  * CreationClassName  TALVO_ComputerSystem\n"
              "  * Name               machine.example\n"
              "    ElementName        machine.example\n"
              "    NameFormat         IP\n"
              "    EnabledState       2 (Enabled)\n"
              "    RequestedState     12 (Not Applicable)\n"
              "    Dedicated          0 (Not Dedicated)\n");
    EXPECT_EQ(
        orvcim({"instances", "TALVO_ComputerSystem", "--properties", "OtherIdentifyingInfo,IdentifyingDescriptions"})
            .status,
        0);
}

TEST_F(ProvidedTest, ReportsAnInstanceThatIsNotThere) {
    std::string other = _service;
    other.replace(other.find("blade1"), 6, "blade2");
    const Outcome outcome = orvcim({"get", other});
    EXPECT_EQ(outcome.err, "orvcim: " + other + ": CIM_ERR_NOT_FOUND (6): there is no such instance\n");
    EXPECT_EQ(outcome.status, 1);
}

TEST_F(ProvidedTest, RebootsAndShutsDownTheSimulatedMachine) {
    configure("reboot-time = 0\nshutdown-time = 0\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
    EXPECT_THAT(answerOf({"power", "reboot"}), StartsWith("Power request accepted: reboot of simulated node"));
    EXPECT_TRUE(std::filesystem::exists(_folder / "state.json"));
    EXPECT_THAT(answerOf({"power", "shutdown"}), StartsWith("Power request accepted: shutdown of simulated node"));
    EXPECT_EQ(answerOf({"invoke", _service, "RequestPowerStateChange", "PowerState=5", "ManagedElement=" + _system}),
              "RequestPowerStateChange\n    ReturnValue  0 (Completed with No Error)\n");
}

TEST_F(ProvidedTest, ShowsARefusedRequestAsRefused) {
    const std::string system = "ManagedElement=" + _system;
    const std::pair<std::vector<std::string>, std::string> requests[] = {
        {{"PowerState=2", system}, "Requested Power State change Not Supported"},
        {{"PowerState=5", system, "Time=00000000000100.000000:000"}, "Use Of Time Property Not Supported"},
        {{"PowerState=5", system, "TimeoutPeriod=00000000000100.000000:000"}, "Use Of Timeout Period Not Supported"}};
    for (const auto& [given, reason] : requests) {
        std::vector<std::string> arguments = {"invoke", _service, "RequestPowerStateChange"};
        arguments.insert(arguments.end(), given.begin(), given.end());
        const Outcome outcome = orvcim(arguments);
        EXPECT_EQ(outcome.err, "orvcim: RequestPowerStateChange was refused: " + reason + "\n");
        EXPECT_EQ(outcome.out, "");
        EXPECT_EQ(outcome.status, 1);
    }
    EXPECT_FALSE(std::filesystem::exists(_folder / "state.json"));
}

TEST_F(ProvidedTest, LogsWhatWasAskedForBesideWhyItWasRefused) {
    orvcim({"invoke", _service, "RequestPowerStateChange", "PowerState=2", "ManagedElement=" + _system});
    std::ifstream log(_folder / "log");
    std::vector<std::string> lines;
    for (std::string line; std::getline(log, line);) {
        lines.push_back(line);
    }
    EXPECT_THAT(lines,
                ElementsAre(HasSubstr(" log 4000 Corvane.PowerMgmtSvcProvider PowerManagementService_InvokeMethod "),
                            HasSubstr("]: Requested Power State change Not Supported")));
    EXPECT_THAT(lines.front(), HasSubstr(" VARIABLE: 'powerState' has Value '2' "));
}

TEST_F(ProvidedTest, ShowsThatTheMachineIsNeitherOnNorOffWhileItReboots) {
    const std::string heading = "SYSTEM           SERVICE                              POWER STATE\n"
                                "machine.example  PowerStateManagement_chassis/blade1  ";
    const auto rebootsIn = [this](const char* seconds) {
        configure(std::string("reboot-time = ") + seconds +
                  "\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
        answerOf({"power", "reboot"});
        return answerOf({"power", "status"});
    };
    EXPECT_EQ(answerOf({"power", "status"}), heading + "2 (On)\n");
    EXPECT_EQ(rebootsIn("0"), heading + "2 (On)\n");
    EXPECT_EQ(rebootsIn("3600"), heading + "1 (Other), as while it reboots or shuts down\n");
}

TEST_F(ProvidedTest, TakesBackWhatIsUnderWay) {
    EXPECT_THAT(orvcim({"power", "cancel"}).err, HasSubstr("no request is in progress"));
    configure("reboot-time = 3600\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
    answerOf({"power", "reboot"});
    EXPECT_THAT(answerOf({"power", "cancel"}), StartsWith("Power request accepted: cancellation of the request of "));
    EXPECT_THAT(answerOf({"power", "status"}), HasSubstr("2 (On)"));
    EXPECT_EQ(orvcim({"power", "cancel"}).status, 1);
}

TEST_F(ProvidedTest, WaitsForARebootUntilTheMachineIsOnAgain) {
    configure("reboot-time = 1\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
    EXPECT_THAT(answerOf({"power", "reboot", "--wait"}), HasSubstr("\nmachine.example: 2 (On)\n"));
}

TEST_F(ProvidedTest, WaitsForTheNodeThatWasSwitchedAndForNoOther) {
    configure("reboot-time = 2\n[[instrumentation.simulated.node]]\npath = \"z\"\n"
              "[[instrumentation.simulated.node]]\npath = \"a\"\npower-state = \"off\"\n");
    const std::string service = "TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\","
                                "Name=\"PowerStateManagement_z\",SystemCreationClassName=\"TALVO_ComputerSystem\","
                                "SystemName=\"machine.example\"";
    const auto start = std::chrono::steady_clock::now();
    EXPECT_THAT(answerOf({"power", "reboot", "--wait", "--service", service}),
                HasSubstr("\nmachine.example: 2 (On)\n"));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
}

TEST_F(ProvidedTest, ShowsTheStateWheneverItChanges) {
    configure("reboot-time = 3600\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
    const std::string on = answerOf({"power", "status"});
    const RunningProcess watch({ORVCIM_PROGRAM, "power", "status", "--watch"}, environment());
    EXPECT_EQ(watch.outputWith(on), on);
    answerOf({"power", "reboot"});
    const std::string rebooting = answerOf({"power", "status"});
    EXPECT_EQ(watch.outputWith(on + rebooting), on + rebooting);
    answerOf({"power", "cancel"});
    EXPECT_EQ(watch.outputWith(on + rebooting + on), on + rebooting + on);
}

TEST_F(ProvidedTest, NamesTheLibraryThatIsMissingWhereTheMachineIsNotKnown) {
    std::filesystem::create_directories(_folder / "bin");
    std::filesystem::copy_file(ORVCIM_PROGRAM, _folder / "bin" / "orvcim");
    const Outcome outcome = runProcess(
        {(_folder / "bin" / "orvcim").string(), "--schema", ORV_SCHEMA_FOLDER, "serve", "--port=0"}, environment());
    EXPECT_THAT(outcome.err, HasSubstr("the machine is not known to be a simulated one; provider library "
                                       "liborvpowerstatemanagementprovider.so.1 or "
                                       "liborvpowerstatemanagementprovider.so not found in " +
                                       _folder.string()));
    EXPECT_EQ(outcome.status, 1);
}

TEST_F(ProvidedTest, SwitchesNoOtherNodeThanTheOneThatIsNamed) {
    configure("[[instrumentation.simulated.node]]\npath = \"z\"\n"
              "[[instrumentation.simulated.node]]\npath = \"a\"\n");
    const auto service = [](const std::string& node) {
        return "TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\","
               "Name=\"PowerStateManagement_" +
               node + "\",SystemCreationClassName=\"TALVO_ComputerSystem\",SystemName=\"machine.example\"";
    };
    const std::vector<std::vector<std::string>> requests = {
        {"power", "reboot", "--service", service("a")},
        {"invoke", service("a"), "RequestPowerStateChange", "PowerState=5", "ManagedElement=" + _system}};
    for (const std::vector<std::string>& request : requests) {
        const Outcome outcome = orvcim(request);
        EXPECT_THAT(outcome.err, HasSubstr("found the service PowerStateManagement_a, expected PowerStateManagement_z: "
                                           "the agent's node z takes all power requests"));
        EXPECT_EQ(outcome.status, 1);
    }
    EXPECT_FALSE(std::filesystem::exists(_folder / "state.json"));
    EXPECT_THAT(answerOf({"power", "reboot", "--service", service("z")}), HasSubstr("node z"));
}

/** What is said of a configuration with the key "backend" of the simulated machine. */
class WrongConfigurationTest : public ProvidedTest {
protected:
    std::string mistake() const {
        return (_folder / "agent.toml").string() +
               ":8: instrumentation.simulated.backend: unknown key: expected one of state-file, reboot-time, "
               "shutdown-time, node ('orvcim check' says more)";
    }
};

TEST_F(WrongConfigurationTest, LeavesTheStateUnknown) {
    configure("backend = 5\n");
    const Outcome outcome = orvcim({"power", "status"});
    EXPECT_EQ(outcome.err, "orvcim: the power state is unknown: " + mistake() + '\n');
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, 1);
}

TEST_F(WrongConfigurationTest, OffersNoService) {
    configure("backend = 5\n");
    const Outcome outcome = orvcim({"power", "reboot", "--yes"});
    EXPECT_EQ(outcome.err, "orvcim: " + mistake() + '\n');
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, 1);
}

/* Every element that is not the machine: it stays as it is. */

TEST_F(ProvidedTest, MakesNoRequestForAnotherElementThanTheMachine) {
    std::string other = _system;
    other.replace(other.find("machine.example"), 15, "other.example");
    const std::pair<std::string, std::string> elements[] = {
        {"ManagedElement=root/cimv2:TALVO_ComputerSystem", "expected the path of an instance, with its keys"},
        {"ManagedElement=No_Such.Name=\"machine.example\"", "which is not declared, expected the path of an instance"},
        {"ManagedElement=machine.example, please", "object path machine.example, please"},
        {"ManagedElement=", "ManagedElement: object path , position 1: found the end, expected the name of a class"},
        {"ManagedElement=5", "ManagedElement: object path 5, position 1: found '5', expected the name of a class"},
        {"ManagedElement=root/interop" + _system.substr(_system.find(':')), "whose power the service manages"},
        {"ManagedElement=root/nowhere" + _system.substr(_system.find(':')), "there is no instance root/nowhere:"},
        {"ManagedElement=" + other, "there is no instance root/cimv2:TALVO_ComputerSystem"},
        {"ManagedElement=" + _capabilities, "whose power the service manages: root/cimv2:TALVO_ComputerSystem."},
        {"ManagedElement=" + _service, "whose power the service manages: root/cimv2:TALVO_ComputerSystem."},
    };
    for (const auto& [element, reason] : elements) {
        const Outcome outcome = orvcim({"invoke", _service, "RequestPowerStateChange", "PowerState=5", element});
        EXPECT_THAT(outcome.err, HasSubstr(reason)) << element;
        EXPECT_EQ(outcome.out, "") << element;
        EXPECT_EQ(outcome.status, 1) << element;
    }
    const Outcome missing = orvcim({"invoke", _service, "RequestPowerStateChange", "PowerState=5"});
    EXPECT_THAT(missing.err, HasSubstr("found no argument ManagedElement"));
    const Outcome twice = orvcim({"invoke", _service, "RequestPowerStateChange", "PowerState=5",
                                  "ManagedElement=" + _system, "ManagedElement=" + _system});
    EXPECT_THAT(twice.err, HasSubstr("ManagedElement: found 2 values, expected one"));
    EXPECT_FALSE(std::filesystem::exists(_folder / "state.json")) << "the machine moved";
}

TEST_F(ProvidedTest, FollowsAssociationsOfInstancesOnlyThatAreThere) {
    std::string other = _service;
    other.replace(other.find("blade1"), 6, "blade2");
    for (const char* command : {"associators", "associator-names", "references", "reference-names"}) {
        EXPECT_EQ(orvcim({command, other}).err,
                  "orvcim: " + other + ": CIM_ERR_NOT_FOUND (6): there is no such instance\n");
        EXPECT_THAT(orvcim({command, "No_Such.Name=\"x\""}).err, HasSubstr("CIM_ERR_INVALID_PARAMETER (4)"));
    }
}

} // namespace
} // namespace OrvcimTest

#include "Orvcim.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <map>
#include <string>

namespace OrvcimTest {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

using Environment = std::map<std::string, std::string>;

constexpr const char* unknownOutcome =
    "orvcim: the outcome is not known beyond the return value: the agent cannot be observed\n";
const Environment simulated = {};
const Environment real = {{"ORVCIM_TEST_MACHINE", "real"}};

TEST(Power, RebootsASimulatedMachineWithoutAsking) {
    const Outcome outcome = orvcim({"power", "reboot"}, simulated);
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(outcome.out, "Power request accepted: 5 for TALVO_ComputerSystem TALVO_ComputerSystem testhost\n");
}

TEST(Power, ShutsASimulatedMachineDownWithoutAsking) {
    const Outcome outcome = orvcim({"power", "shutdown"}, simulated);
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(outcome.out, "Power request accepted: 8 for TALVO_ComputerSystem TALVO_ComputerSystem testhost\n");
}

TEST(Power, AnswersProgramsWithTheResultOfTheMethod) {
    EXPECT_EQ(orvcim({"power", "reboot", "--format", "json"}, simulated).out,
              "{\n  \"method\": \"RequestPowerStateChange\",\n  \"returnValue\": 0,\n  \"outputs\": {}\n}\n");
    EXPECT_EQ(orvcim({"power", "reboot", "--format", "mof"}, simulated).out,
              "// RequestPowerStateChange\ninstance of __MethodParameters {\n    ReturnValue = 0;\n};\n");
}

TEST(Power, LeavesAMachineThatMayBeRealAloneWhereItCannotAsk) {
    for (const char* machine : {"real", "silent"}) {
        const Outcome outcome = orvcim({"power", "shutdown"}, {{"ORVCIM_TEST_MACHINE", machine}});
        EXPECT_EQ(outcome.err, "orvcim: testhost is not known to be a simulated machine: expected --yes, or a terminal "
                               "on which to ask for confirmation\n");
        EXPECT_EQ(outcome.out, "");
        EXPECT_EQ(outcome.status, 1);
    }
}

TEST(Power, AsksAtATerminalBeforeItActs) {
    const Outcome outcome = orvcim({"power", "reboot"}, real, "y\n");
    EXPECT_EQ(outcome.err, "Really reboot testhost? [y/N] ");
    EXPECT_THAT(outcome.out, StartsWith("Power request accepted: 5 "));
    EXPECT_EQ(outcome.status, 0);
}

TEST(Power, LeavesTheMachineAloneWithoutAYes) {
    for (const char* answer : {"n\n", "\n", "yesterday\n", "\x04"}) {
        const Outcome outcome = orvcim({"power", "reboot"}, real, answer);
        EXPECT_EQ(outcome.err, "Really reboot testhost? [y/N] orvcim: not confirmed: testhost was left alone\n");
        EXPECT_EQ(outcome.out, "");
        EXPECT_EQ(outcome.status, 1);
    }
}

TEST(Power, DoesNotAskWhereItWasToldNotTo) {
    const Outcome outcome = orvcim({"power", "reboot", "--yes"}, real);
    EXPECT_EQ(outcome.err, "");
    EXPECT_THAT(outcome.out, StartsWith("Power request accepted: 5 "));
    EXPECT_EQ(outcome.status, 0);
}

TEST(Power, FailsWhereTheAgentRefusedThoughTheMethodReturnedNothingWrong) {
    for (const char* format : {"table", "json", "mof"}) {
        const Outcome outcome = orvcim({"power", "reboot", "--format", format}, {{"ORVCIM_TEST_ANSWER", "refused"}});
        EXPECT_EQ(outcome.err,
                  "orvcim: Power request refused: 5 for TALVO_ComputerSystem TALVO_ComputerSystem testhost\n");
        EXPECT_EQ(outcome.out, "");
        EXPECT_EQ(outcome.status, 1);
    }
}

TEST(Power, FailsWhereTheAgentSaidNothingOfARequest) {
    const Outcome outcome = orvcim({"power", "reboot"}, {{"ORVCIM_TEST_ANSWER", "nothing"}});
    EXPECT_EQ(outcome.err,
              "orvcim: RequestPowerStateChange ended without a failure, but the agent accepted no power request\n");
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, 1);
}

TEST(Power, GivesTheResultOfTheMethodWhereTheAgentCannotBeHeard) {
    const Outcome outcome = orvcim({"power", "reboot", "--yes"}, {{"ORVCIM_TEST_MACHINE", "silent"}});
    EXPECT_EQ(outcome.err, unknownOutcome);
    EXPECT_EQ(outcome.out, "RequestPowerStateChange\n    ReturnValue  0 (Completed with No Error)\n");
    EXPECT_EQ(outcome.status, 0);
}

TEST(Power, FailsWithWhatTheReturnValueMeans) {
    const Outcome outcome = orvcim({"power", "reboot"}, {{"ORVCIM_TEST_ANSWER", "4"}});
    EXPECT_EQ(outcome.err, "orvcim: RequestPowerStateChange failed with 4 (Failed)\n");
    EXPECT_EQ(outcome.status, 1);
}

TEST(Power, WantsAServiceToBeChosenWhereThereAreSeveral) {
    const Environment three = {{"ORVCIM_TEST_SERVICES", "3"}};
    const Outcome undecided = orvcim({"power", "reboot"}, three);
    EXPECT_EQ(undecided.err, "orvcim: found 3 instances of TALVO_PowerManagementService, expected one, or --service "
                             "PATH to choose\n");
    EXPECT_EQ(undecided.status, 1);
    const std::string second = "TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\",Name="
                               "\"service2\",SystemCreationClassName=\"TALVO_ComputerSystem\",SystemName=\"testhost\"";
    EXPECT_EQ(orvcim({"power", "reboot", "--service", second}, three).status, 0);
}

TEST(Power, DoesNotTakeAServiceThatIsNotThere) {
    const Outcome none = orvcim({"power", "reboot"}, {{"ORVCIM_TEST_SERVICES", "0"}});
    EXPECT_EQ(none.err, "orvcim: found 0 instances of TALVO_PowerManagementService, expected one\n");
    EXPECT_EQ(none.status, 1);
    const std::string second = "TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\",Name="
                               "\"service2\",SystemCreationClassName=\"TALVO_ComputerSystem\",SystemName=\"testhost\"";
    const Outcome wrong = orvcim({"power", "reboot", "--service", second}, simulated);
    EXPECT_EQ(wrong.err, "orvcim: found no service root/cimv2:" + second +
                             ", expected one of those that 'orvcim names TALVO_PowerManagementService' lists\n");
    EXPECT_EQ(wrong.status, 1);
}

/* With what a request names, by the path of the service and of the element. */

const std::string service =
    "TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\",Name=\"service1\","
    "SystemCreationClassName=\"TALVO_ComputerSystem\",SystemName=\"testhost\"";

std::string system(const std::string& name) {
    return "TALVO_ComputerSystem.CreationClassName=\"TALVO_ComputerSystem\",Name=\"" + name + '"';
}

Outcome request(const std::vector<std::string>& arguments, const Environment& environment = simulated) {
    std::vector<std::string> command = {"invoke", service, "RequestPowerStateChange"};
    command.insert(command.end(), arguments.begin(), arguments.end());
    return orvcim(command, environment);
}

TEST(PowerRequest, IsMadeForTheSystemOfTheService) {
    for (const std::string& element :
         {system("testhost"), "//elsewhere.example/root/cimv2:" + system("testhost"),
          "ROOT/CIMV2:" + system("testhost"),
          std::string("talvo_computersystem.NAME=\"testhost\",creationCLASSname=\"TALVO_ComputerSystem\"")}) {
        const Outcome outcome = request({"PowerState=5", "ManagedElement=" + element});
        EXPECT_EQ(outcome.err, "") << element;
        EXPECT_EQ(outcome.status, 0) << element;
    }
}

TEST(PowerRequest, SaysThatItsOutcomeIsNotKnownWhereTheAgentCannotBeHeard) {
    const Outcome outcome =
        request({"PowerState=5", "ManagedElement=" + system("testhost")}, {{"ORVCIM_TEST_MACHINE", "silent"}});
    EXPECT_EQ(outcome.err, unknownOutcome);
    EXPECT_EQ(outcome.status, 0);
}

TEST(PowerRequest, IsNotMadeWhereNothingIsAssociatedWithTheService) {
    const Outcome outcome = orvcim({"invoke", "root/unassociated:" + service, "RequestPowerStateChange", "PowerState=5",
                                    "ManagedElement=" + system("testhost")},
                                   simulated);
    EXPECT_THAT(outcome.err, EndsWith("expected an element whose power the service manages: none: the service is "
                                      "associated with no system\n"));
    EXPECT_EQ(outcome.status, 1);
}

TEST(Power, WaitsUntilTheMachineIsThere) {
    const Outcome outcome = orvcim({"power", "reboot", "--wait"}, simulated);
    EXPECT_EQ(outcome.err, "");
    EXPECT_THAT(outcome.out, EndsWith("\ntesthost: 2 (On)\n"));
    EXPECT_EQ(outcome.status, 0);
}

TEST(Power, WaitsNoLongerThanItIsTold) {
    const Outcome outcome = orvcim({"power", "shutdown", "--wait=0.01"}, {{"ORVCIM_TEST_STATE", "1"}});
    EXPECT_EQ(outcome.err,
              "orvcim: the request is not done after 0.01 s: 'orvcim power status' shows how it goes on\n");
    EXPECT_THAT(outcome.out, StartsWith("Power request accepted: 8 "));
    EXPECT_EQ(outcome.status, 1);
}

TEST(Power, SaysThatItsAgentCannotTakeBackARequest) {
    const Outcome outcome = orvcim({"power", "cancel"}, simulated);
    EXPECT_EQ(outcome.err, "orvcim: power cancel: CIM_ERR_NOT_SUPPORTED (7): the agent cannot be asked to take back a "
                           "power request\n");
    EXPECT_EQ(outcome.status, 1);
}

TEST(PowerStatus, ShowsTheStatesWhereTheyAreServed) {
    const Outcome outcome = orvcim({"power", "status"}, simulated);
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.out, "SYSTEM    SERVICE   POWER STATE\n"
                           "testhost  service1  2 (On)\n");
    EXPECT_EQ(outcome.status, 0);
}

TEST(PowerStatus, GivesProgramsTheInstances) {
    const Outcome outcome = orvcim({"power", "status", "--format", "mof"}, simulated);
    EXPECT_THAT(outcome.out, StartsWith("instance of TALVO_AssociatedPowerManagementService {\n"
                                        "    ServiceProvided = \""));
    EXPECT_THAT(outcome.out, EndsWith("    PowerState = 2;\n};\n"));
    EXPECT_EQ(outcome.status, 0);
}

TEST(PowerStatus, FailsWhereTheStateIsNotKnown) {
    for (const char* state : {"0", "none"}) {
        const Outcome outcome = orvcim({"power", "status"}, {{"ORVCIM_TEST_STATE", state}});
        EXPECT_EQ(outcome.err, "orvcim: the power state is unknown: 'orvcim check' says what is wrong\n");
        EXPECT_EQ(outcome.out, "SYSTEM    SERVICE   POWER STATE\n"
                               "testhost  service1  unknown\n");
        EXPECT_EQ(outcome.status, 1);
    }
}

TEST(PowerStatus, ShowsWhatCanBeAskedForAndSaysThatTheStateIsNotServed) {
    const Outcome outcome = orvcim({"power", "status", "--namespace", "root/unassociated"}, simulated);
    EXPECT_EQ(outcome.err, "orvcim: no provider serves the power state: TALVO_AssociatedPowerManagementService is "
                           "not registered in root/unassociated\n"
                           "orvcim: the power state is unknown: no provider serves it\n");
    EXPECT_EQ(outcome.out, "SERVICE OR CAPABILITIES  POWER STATES THAT CAN BE REQUESTED\n"
                           "service1\n"
                           "capabilities1            5 (Power Cycle (Off - Soft)), 8 (Off - Soft)\n");
    EXPECT_EQ(outcome.status, 1);
}

} // namespace
} // namespace OrvcimTest

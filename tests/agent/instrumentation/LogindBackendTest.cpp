#include "LogindBackend.h"
#include "base/LockFile.h"

#include "LogindStandIn.h"
#include "PrivateBus.h"
#include "RecordedLog.h"
#include "TestSupport.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <chrono>
#include <regex>
#include <thread>

#include <sys/socket.h>
#include <sys/un.h>

namespace {

using namespace Norv::Agent;
using namespace std::chrono_literals;
using AgentTest::PrivateBus;
using AgentTest::requireBusIn;
using AgentTest::takeLog;
using AgentTest::TemporaryFolder;
using AgentTest::writeFile;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::Optional;
using testing::StartsWith;

// Even if a test forgets to set a bus, nothing here reaches the machine's own bus.
const bool systemBusIsForgotten = (AgentTest::forgetSystemBus(), true);

TEST(BusOfTheTests, IsNeverTheMachinesOwn) {
    const TemporaryFolder folder;
    for (const std::string& address :
         {std::string("unix:path=/run/dbus/system_bus_socket"),
          std::string("unix:path=/var/run/dbus/system_bus_socket"), std::string(""), std::string("unix:abstract=bus"),
          "unix:path=" + (folder / "bus").string() + ";unix:path=/run/dbus/system_bus_socket"}) {
        setenv("DBUS_SYSTEM_BUS_ADDRESS", address.c_str(), 1);
        EXPECT_THROW(requireBusIn(folder), std::runtime_error) << address;
    }
    unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
    EXPECT_THROW(requireBusIn(folder), std::runtime_error);
    AgentTest::forgetSystemBus();
    EXPECT_THROW(requireBusIn(folder), std::runtime_error);
}

/** A machine with a mock of systemd-logind. */
class Machine : public testing::Test {
protected:
    /** @param policy of the bus. */
    explicit Machine(const std::string& policy = "") : bus(policy) {}

    void SetUp() override {
        requireBusIn(bus.folder());
        takeLog();
    }

    /** Another process's view of the machine. */
    std::unique_ptr<LogindBackend> machine() const {
        return std::make_unique<LogindBackend>(LogindSettings{delay, timeout, lockFile});
    }

    std::optional<unsigned int> powerState() const { return machine()->selectPowerManagementNodes()->powerState(0); }

    std::vector<unsigned int> powerStates() const { return machine()->selectPowerManagementNodes()->powerStates(0); }

    PowerRequestOutcome request(unsigned int state) const {
        return machine()->selectPowerManagementNodes()->requestPowerState(0, state);
    }

    PrivateBus bus;
    const std::filesystem::path lockFile = bus.folder() / "lock";
    std::chrono::milliseconds delay = 1h;
    std::chrono::milliseconds timeout = 20s;
};

TEST_F(Machine, IsOneNodeThatRuns) {
    bus.startLogind();
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    ASSERT_EQ(nodes->size(), 1);
    EXPECT_EQ(nodes->path(0), "system");
    EXPECT_THAT(nodes->powerState(0), Optional(1));
    EXPECT_THAT(nodes->powerStates(0), ElementsAre(2, 4, 5, 7, 8));
    EXPECT_THAT(takeLog(), IsEmpty());
    EXPECT_THAT(bus.requests(), IsEmpty());
}

TEST_F(Machine, ListsWhatItCanDoWithoutFurtherAdo) {
    bus.startLogind(R"({"CanReboot": "yes", "CanPowerOff": "challenge", "CanSuspend": "no", "CanHibernate": "na"})");
    EXPECT_THAT(powerStates(), ElementsAre(2, 5));
}

TEST_F(Machine, ListsNeitherRebootNorShutdownWhereItCanDoNeither) {
    bus.startLogind(R"({"CanReboot": "na", "CanPowerOff": "inhibited"})");
    EXPECT_THAT(powerStates(), ElementsAre(2, 4, 7));
}

struct UnderWay {
    const char* name;
    const char* parameters;
    unsigned int state;
    const char* description;
};

void PrintTo(const UnderWay& given, std::ostream* stream) {
    *stream << given.name;
}

class MachineUnderWay : public Machine, public testing::WithParamInterface<UnderWay> {};

TEST_P(MachineUnderWay, TellsSoAndRefusesAnotherRequest) {
    bus.startLogind(GetParam().parameters);
    EXPECT_THAT(powerState(), Optional(GetParam().state));
    const PowerRequestOutcome outcome = request(9);
    EXPECT_FALSE(outcome.accepted);
    EXPECT_EQ(outcome.description,
              std::string("reboot of this machine, node system: another request is in progress: ") +
                  GetParam().description);
    EXPECT_THAT(bus.requests(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    All, MachineUnderWay,
    testing::Values(
        UnderWay{"RebootIsScheduled", R"({"ScheduledShutdown": ["reboot", 1795177867000000]})", 9,
                 "reboot is scheduled for 2026-11-20T12:31:07Z"},
        UnderWay{"ShutdownIsScheduled", R"({"ScheduledShutdown": ["poweroff", 1795177867000000]})", 12,
                 "poweroff is scheduled for 2026-11-20T12:31:07Z"},
        UnderWay{"SomethingElseIsScheduled", R"({"ScheduledShutdown": ["halt", 1795177867000000]})", 12,
                 "halt is scheduled for 2026-11-20T12:31:07Z"},
        UnderWay{"ItIsScheduledForAnotherAge", R"({"ScheduledShutdown": ["reboot", 253402300799000000]})", 9,
                 "reboot is scheduled for 9999-12-31T23:59:59Z"},
        UnderWay{"ItIsScheduledForTheEndOfTime", R"({"ScheduledShutdown": ["reboot", 18446744073709551615]})", 9,
                 "reboot is scheduled for 9999-12-31T23:59:59Z"},
        UnderWay{"RebootHasBegun",
                 R"({"ScheduledShutdown": ["reboot", 1795177867000000], "PreparingForShutdown": true})", 9,
                 "reboot is under way"},
        UnderWay{"NobodyKnowsWhatHasBegun", R"({"PreparingForShutdown": true})", 12, "the machine is going down"}),
    [](const auto& each) { return std::string(each.param.name); });

struct Request {
    unsigned int state;
    const char* name;
    const char* scheduledType;
    const char* method;
};

void PrintTo(const Request& request, std::ostream* stream) {
    *stream << request.name;
}

class MachineRequest : public Machine, public testing::WithParamInterface<Request> {
protected:
    /** The end of an accepted request's description. */
    const std::string where = std::string(GetParam().name) + " of this machine, node system, ";
};

INSTANTIATE_TEST_SUITE_P(All, MachineRequest,
                         testing::Values(Request{9, "reboot", "reboot", "Reboot"},
                                         Request{12, "shutdown", "poweroff", "PowerOff"}),
                         [](const auto& each) { return std::string(each.param.name); });

TEST_P(MachineRequest, IsScheduledBySystemdLogindWithTheDelay) {
    bus.startLogind();
    delay = 3600500ms;
    const auto microseconds = [](auto time) {
        return std::chrono::duration_cast<std::chrono::microseconds>(time.time_since_epoch()).count();
    };
    const auto earliest = microseconds(std::chrono::system_clock::now() + delay);
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    const PowerRequestOutcome outcome = nodes->requestPowerState(0, GetParam().state);
    const auto latest = microseconds(std::chrono::system_clock::now() + delay);

    EXPECT_TRUE(outcome.accepted);
    EXPECT_THAT(outcome.description, MatchesRegex(where + "at 20[0-9-]+T[0-9:]+Z, in 3600\\.5 s"));
    const auto requests = bus.requests();
    ASSERT_EQ(requests.size(), 1U);
    const std::string call = std::string("ScheduleShutdown \"") + GetParam().scheduledType + "\" ";
    ASSERT_THAT(requests[0], StartsWith(call));
    const auto time = std::stoll(requests[0].substr(call.size()));
    EXPECT_GE(time, earliest);
    EXPECT_LE(time, latest);
    EXPECT_THAT(nodes->powerState(0), Optional(GetParam().state));
    EXPECT_THAT(powerState(), Optional(GetParam().state)) << "as another process sees it";
}

TEST_P(MachineRequest, IsCarriedOutAtOnceWithoutADelay) {
    bus.startLogind();
    delay = 0ms;
    const PowerRequestOutcome outcome = request(GetParam().state);
    EXPECT_TRUE(outcome.accepted);
    EXPECT_EQ(outcome.description, where + "at once");
    EXPECT_THAT(bus.requests(), ElementsAre(GetParam().method + std::string(" False")));
}

TEST_P(MachineRequest, IsRefusedWhileAnotherIsInProgress) {
    bus.startLogind();
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    ASSERT_TRUE(nodes->requestPowerState(0, GetParam().state).accepted);
    for (const unsigned int state : {9U, 12U}) {
        EXPECT_THAT(nodes->requestPowerState(0, state).description, HasSubstr(": another request is in progress: "));
        EXPECT_THAT(request(state).description, HasSubstr(": another request is in progress: "));
    }
    EXPECT_THAT(bus.requests(), testing::SizeIs(1));
}

TEST_F(Machine, RefusesEveryOtherState) {
    bus.startLogind();
    for (const unsigned int state : {0U, 1U, 2U, 5U, 8U, 10U}) {
        const PowerRequestOutcome outcome = request(state);
        EXPECT_FALSE(outcome.accepted);
        EXPECT_EQ(outcome.description, "power state " + std::to_string(state) +
                                           " of this machine, node system: expected 9 (reboot) or 12 (shutdown)");
    }
    EXPECT_THAT(bus.requests(), IsEmpty());
}

TEST_F(Machine, TakesOneOfManyRequestsThatAreMadeAtOnce) {
    bus.startLogind();
    std::vector<std::thread> threads;
    std::atomic<int> accepted = 0;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&, i] { accepted += request(i % 2 == 0 ? 9 : 12).accepted ? 1 : 0; });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(accepted, 1);
    EXPECT_THAT(bus.requests(), testing::SizeIs(1));
}

TEST_F(Machine, IsNotHeldUpByInhibitorsThatMerelyDelayOrForbidSomethingElse) {
    bus.startLogind(R"({"Inhibitors": [["shutdown:sleep", "editor", "saving", "delay", 1000, 77],
                                       ["sleep:idle", "player", "playing", "block", 1000, 78]]})");
    EXPECT_TRUE(request(9).accepted);
}

TEST_F(Machine, TakesBackARequestThatFoundNoAnswer) {
    timeout = 5s;
    bus.startLogind(R"({"Calls": {"ScheduleShutdown": {"delay": 6}}})");
    EXPECT_FALSE(request(9).accepted);
    timeout = 20s;
    EXPECT_THAT(powerState(), Optional(1)) << "once systemd-logind answers again";
    EXPECT_THAT(bus.requests(), ElementsAre(StartsWith("ScheduleShutdown \"reboot\" "), "CancelScheduledShutdown"));
}

TEST_F(Machine, TellsWhatItFindsToWhoeverExaminesIt) {
    bus.startLogind(R"({"CanSuspend": "na"})");
    const MachineReport report = machine()->examine();
    std::vector<std::string> facts;
    for (const auto& [name, value] : report.facts) {
        facts.push_back(name + ": " + value);
    }
    EXPECT_THAT(facts,
                ElementsAre("under way: nothing", "reboot: yes", "shutdown: yes", "sleep: na", "hibernation: yes"));
    EXPECT_THAT(report.problems, IsEmpty());
    EXPECT_EQ(machine()->machine(), "this machine through systemd-logind (requests take effect after 3600 s)");
    EXPECT_THAT(bus.requests(), IsEmpty());
}

TEST_F(Machine, TellsWhatIsMissingToWhoeverExaminesIt) {
    bus.startLogind(R"({"CanReboot": "challenge", "CanPowerOff": "na", "Inhibitors":
                        [["shutdown", "apt", "upgrade", "block", 0, 78]]})");
    EXPECT_THAT(machine()->examine().problems,
                ElementsAre(AllOf(StartsWith("CanReboot answers \"challenge\": uid "),
                                  HasSubstr("it needs the rights org.freedesktop.login1.reboot and ")),
                            "CanPowerOff answers \"na\": this machine cannot do it",
                            "requests are refused for now: inhibited by apt (upgrade; process 78, uid 0): wait for it, "
                            "or end it"));
}

/**
 * The calls of each round trip to the bus, where none of them is answered before all of them have come: whoever waits
 * for an answer in between gets none.
 */
class MachineFarAway : public Machine {
protected:
    MachineFarAway() { timeout = 10s; }

    void expectAll(std::size_t calls, std::size_t connections) const {
        const auto asked = logind.asked();
        EXPECT_EQ(asked.calls, calls);
        EXPECT_EQ(asked.connections, connections);
        EXPECT_THAT(takeLog(), IsEmpty());
    }

    AgentTest::LogindStandIn logind;
};

TEST_F(MachineFarAway, IsReadInOneRoundTrip) {
    logind.expect({6});
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    EXPECT_THAT(nodes->powerState(0), Optional(1));
    EXPECT_THAT(nodes->powerStates(0), ElementsAre(2, 4, 5, 7, 8));
    expectAll(6, 1);
}

TEST_F(MachineFarAway, IsNotReadByWhoeverDoesNotAskForItsState) {
    logind.expect();
    const auto backend = machine();
    EXPECT_EQ(backend->selectPowerManagementNodes()->path(0), "system");
    expectAll(0, 0);
}

TEST_F(MachineFarAway, IsSwitchedInTwoRoundTrips) {
    logind.expect({7, 1});
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    const PowerRequestOutcome outcome = nodes->requestPowerState(0, 9);
    EXPECT_TRUE(outcome.accepted) << outcome.description;
    EXPECT_THAT(nodes->powerState(0), Optional(9));
    EXPECT_THAT(nodes->powerStates(0), ElementsAre(2, 4, 5, 7, 8));
    expectAll(8, 1);
}

TEST_F(MachineFarAway, CancelsARequestInTwoRoundTrips) {
    logind.expect({7, 1, 2, 1});
    ASSERT_TRUE(request(9).accepted);
    const PowerRequestOutcome outcome = machine()->selectPowerManagementNodes()->cancelRequest(0);
    EXPECT_TRUE(outcome.accepted) << outcome.description;
    expectAll(11, 2);
}

TEST_F(MachineFarAway, IsExaminedInOneRoundTrip) {
    logind.expect({7});
    EXPECT_THAT(machine()->examine().problems, IsEmpty());
    expectAll(7, 1);
}

/** Tests with separate processes that use the library: their output, and the log lines behind it. */
class Processes : public Machine {
protected:
    using Machine::Machine;

    void configure(const std::string& more) const {
        writeFile(bus.folder() / "agent.toml", "[instrumentation]\nbackend = \"logind\"\n"
                                               "[instrumentation.logind]\nlock-file = \"" +
                                                   lockFile.string() + "\"\n" + more);
    }

    /** The output of a process that runs commands of probe.cpp. */
    std::vector<std::string> run(const std::string& commands) const {
        requireBusIn(bus.folder());
        std::vector<std::string> lines =
            AgentTest::linesOf("ORV_AGENT_CONFIG='" + (bus.folder() / "agent.toml").string() +
                               "' " ORV_INSTRUMENTATION_PROBE " " + commands);
        AgentTest::maskRequester(lines);
        return lines;
    }

    /** The output for a refused request. */
    testing::Matcher<std::vector<std::string>> refusal(const std::string& reason) const {
        return ElementsAre("refused", StartsWith(notice),
                           MatchesRegex("log 10000 Corvane\\.Instrumentation Power request refused: reboot of this "
                                        "machine, node system: " +
                                        reason + " \\[asked by instrumentation_probe, process N, uid N\\]"));
    }

    const std::string notice = "log 5000 Corvane.Instrumentation Power management of this machine through "
                               "systemd-logind (requests take effect after ";
};

TEST_F(Processes, SeeEachOthersRequests) {
    configure("delay = 3600\n");
    bus.startLogind();
    EXPECT_THAT(run("list write system 12 list"),
                ElementsAre("system 1 2 4 5 7 8", "accepted", "system 12 2 4 5 7 8", StartsWith(notice),
                            MatchesRegex("log 10000 Corvane.Instrumentation Power request accepted: shutdown of this "
                                         "machine, node system, at 20[0-9-]+T[0-9:]+Z, in 3600 s \\[asked by "
                                         "instrumentation_probe, process N, uid N\\]")));
    EXPECT_THAT(run("list write system 9"),
                ElementsAre("system 12 2 4 5 7 8", "refused", StartsWith(notice),
                            AllOf(StartsWith("log 10000 Corvane.Instrumentation Power request refused: reboot of this "
                                             "machine, node system: another request is in progress: poweroff is "
                                             "scheduled for "),
                                  testing::EndsWith(" [asked by instrumentation_probe, process N, uid N]"))));
}

TEST_F(Processes, TellThatTheMachineIsRealWithoutAskingTheBus) {
    configure("");
    EXPECT_THAT(run("machine"), ElementsAre("real", StartsWith(notice)));
}

struct Failure {
    const char* name;
    /** The mock's parameters; null for no systemd-logind. "BUS" is the number of the bus's process. */
    const char* parameters;
    /** The reason in the log, as a regular expression. */
    const char* reason;
    const char* settings = "delay = 3600\n";
    /** The policy of the bus. */
    const char* policy = "";
};

void PrintTo(const Failure& failure, std::ostream* stream) {
    *stream << failure.name;
}

class ProcessesRefused : public Processes, public testing::WithParamInterface<Failure> {
protected:
    ProcessesRefused() : Processes(GetParam().policy) {}
};

TEST_P(ProcessesRefused, SayWhyAndAreToldFalse) {
    const Failure& failure = GetParam();
    configure(failure.settings);
    if (failure.parameters != nullptr) {
        bus.startLogind(std::regex_replace(failure.parameters, std::regex("BUS"), std::to_string(bus.daemon())));
    }
    EXPECT_THAT(run("write system 9"), refusal(failure.reason));
}

constexpr const char* atOnce = "delay = 0\n";
constexpr const char* impatient = "delay = 3600\ntimeout = 2.5\n";

INSTANTIATE_TEST_SUITE_P(
    All, ProcessesRefused,
    testing::Values(
        Failure{
            "WithoutTheRight", R"({"CanReboot": "no"})",
            R"(CanReboot answers "no": uid [0-9]+ may not do it: it needs the rights org\.freedesktop\.login1\.reboot )"
            R"(and org\.freedesktop\.login1\.reboot-multiple-sessions)"},
        Failure{"WhereAuthenticationIsNeeded", R"({"CanReboot": "challenge"})",
                R"(CanReboot answers "challenge": uid [0-9]+ could do it only after authentication, which nobody is )"
                R"(asked for here: it needs the rights org\.freedesktop\.login1\.reboot and .*)"},
        Failure{"WhereTheMachineCannotDoIt", R"({"CanReboot": "na"})",
                R"(CanReboot answers "na": this machine cannot do it)"},
        Failure{"ForAReasonThatIsNotKnown", R"({"CanReboot": "tomorrow"})",
                R"(CanReboot answers "tomorrow": expected "yes")"},
        Failure{"BecauseOfInhibitors",
                R"({"Inhibitors": [["shutdown", "apt", "upgrade\nin progress", "block", 0, 77],
                                   ["sleep", "player", "playing", "block", 1000, 78],
                                   ["idle:shutdown", "backup", "tape", "block-weak", 1000, 79]]})",
                R"(inhibited by apt \(upgrade in progress; process 77, uid 0\), by backup \(tape; process 79, uid )"
                R"(1000\))"},
        Failure{"BySystemdLogind",
                R"({"Calls": {"ScheduleShutdown": {"error": ["org.freedesktop.DBus.Error.AccessDenied", "No\nway"]}}})",
                R"(ScheduleShutdown: org\.freedesktop\.DBus\.Error\.AccessDenied: No way)"},
        Failure{"BySystemdLogindAtOnce",
                R"({"Calls": {"Reboot": {"error": ["org.freedesktop.login1.OperationInProgress", "Already"]}}})",
                R"(Reboot: org\.freedesktop\.login1\.OperationInProgress: Already)", atOnce},
        Failure{"WithoutAnybodyBeingAsked",
                R"({"Calls": {"Reboot": {"error": ["org.freedesktop.DBus.Error.InteractiveAuthorizationRequired",
                                                   "Interactive authentication required."]}}})",
                R"(Reboot: org\.freedesktop\.DBus\.Error\.InteractiveAuthorizationRequired: Interactive )"
                R"(authentication required\.)",
                atOnce},
        Failure{"ByThePolicyOfTheBus", "{}",
                R"(ScheduleShutdown: org\.freedesktop\.DBus\.Error\.AccessDenied: Rejected send message.*)",
                "delay = 3600\n",
                R"(<deny send_interface="org.freedesktop.login1.Manager" send_member="ScheduleShutdown"/>)"},
        Failure{
            "WhereTheBusLetsNobodyAskAnything", "{}",
            R"(PreparingForShutdown: org\.freedesktop\.DBus\.Error\.AccessDenied: Rejected send message.*)",
            "delay = 3600\n",
            R"(<deny send_destination="org.freedesktop.login1" send_interface="org.freedesktop.DBus.Properties"/>)"},
        Failure{"WhereSystemdLogindIsMasked",
                R"({"PropertiesError": ["org.freedesktop.systemd1.UnitMasked", "Unit is masked."]})",
                R"(systemd-logind is masked: org\.freedesktop\.systemd1\.UnitMasked: Unit is masked\.: let it be )"
                R"(started again \(systemctl unmask systemd-logind\.service\))"},
        Failure{"WhereSystemdLogindWasMaskedWhileItRan",
                R"({"PropertiesError": ["org.freedesktop.DBus.Error.FileExists", "Unit failed to load properly"]})",
                R"(systemd-logind is masked: org\.freedesktop\.DBus\.Error\.FileExists: Unit failed to load properly: )"
                R"(let it be started again \(systemctl unmask systemd-logind\.service\))"},
        Failure{"WherePolkitIsMasked",
                R"({"Calls": {"ScheduleShutdown": {"error": ["org.freedesktop.systemd1.UnitMasked", "Unit"]}}})",
                R"(ScheduleShutdown: polkit is masked, which systemd-logind has to ask: org\.freedesktop\.systemd1\.)"
                R"(UnitMasked: Unit: let polkit be started again \(systemctl unmask polkit\.service\), or have root )"
                R"(make the requests: uid [0-9]+ needs polkit's leave)"},
        Failure{"WithoutSystemdLogind", nullptr,
                R"(systemd-logind is not on the system bus: org\.freedesktop\.DBus\.Error\.ServiceUnknown: The name )"
                R"(org\.freedesktop\.login1 was not provided by any \.service files)"},
        Failure{"WhenSystemdLogindIsSlow", R"({"Calls": {"CanReboot": {"delay": 30}}})",
                R"((CanReboot|PreparingForShutdown): systemd-logind does not answer within 2\.5 s)", impatient},
        Failure{"WhenTheRequestTakesTooLong", R"({"Calls": {"ScheduleShutdown": {"delay": 30}}})",
                R"(ScheduleShutdown: systemd-logind does not answer within 2\.5 s)", impatient},
        Failure{"WhenSystemdLogindEndsMeanwhile", R"({"Calls": {"Reboot": {"exit": true}}})",
                R"(Reboot: systemd-logind ended without an answer: org\.freedesktop\.DBus\.Error\.NoReply: .*)",
                atOnce},
        Failure{"WhenTheBusEndsMeanwhile", R"({"Calls": {"Reboot": {"kill": BUS}}})",
                R"(Reboot: the connection to the system bus was lost: Connection reset by peer)", atOnce}),
    [](const auto& each) { return std::string(each.param.name); });

TEST_F(Processes, AreRefusedWithoutABus) {
    configure("");
    setenv("DBUS_SYSTEM_BUS_ADDRESS", ("unix:path=" + (bus.folder() / "nothing").string()).c_str(), 1);
    EXPECT_THAT(run("write system 9"),
                refusal("the system bus at unix:path=.*/nothing cannot be reached: No such file or directory"));
}

TEST_F(Processes, AreRefusedByABusThatSaysNothing) {
    configure("timeout = 0.3\n");
    const std::string path = bus.folder() / "silent";
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    path.copy(static_cast<char*>(address.sun_path), sizeof address.sun_path - 1);
    const int listener = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    ASSERT_EQ(bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
    ASSERT_EQ(listen(listener, 10), 0);
    setenv("DBUS_SYSTEM_BUS_ADDRESS", ("unix:path=" + path).c_str(), 1);
    EXPECT_THAT(run("write system 9"),
                refusal("the system bus at .*/silent cannot be reached: it does not answer within 0\\.3 s"));
    close(listener);
}

TEST_F(Machine, RefusesARequestWhileAnotherIsBeingMade) {
    bus.startLogind();
    timeout = 300ms;
    auto held = std::make_unique<LockFile>(lockFile, Deadline(0ms));
    const PowerRequestOutcome outcome = request(9);
    EXPECT_FALSE(outcome.accepted);
    EXPECT_EQ(outcome.description, "reboot of this machine, node system: " + lockFile.string() +
                                       ": locked by instrumentation_logind_test, process " + std::to_string(getpid()) +
                                       ": Resource temporarily unavailable");
    held.reset();
    timeout = 20s;
    EXPECT_TRUE(request(9).accepted);
}

TEST_F(Machine, RefusesARequestThatItCannotKeepApartFromOthers) {
    bus.startLogind();
    std::filesystem::create_directory(lockFile);
    EXPECT_THAT(request(9).description,
                StartsWith("reboot of this machine, node system: " + lockFile.string() + ": cannot be opened: "));
    EXPECT_THAT(bus.requests(), IsEmpty());
}

TEST_F(Machine, RunsOnOnceARequestIsCancelled) {
    bus.startLogind();
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    ASSERT_TRUE(nodes->requestPowerState(0, 9).accepted);
    const PowerRequestOutcome outcome = machine()->selectPowerManagementNodes()->cancelRequest(0);
    EXPECT_TRUE(outcome.accepted);
    EXPECT_THAT(outcome.description, MatchesRegex("cancellation of the request of this machine, node system \\(reboot "
                                                  "is scheduled for 20[0-9-]+T[0-9:]+Z\\)"));
    EXPECT_THAT(bus.requests(), ElementsAre(StartsWith("ScheduleShutdown \"reboot\" "), "CancelScheduledShutdown"));
    EXPECT_THAT(powerState(), Optional(1));
    EXPECT_TRUE(nodes->requestPowerState(0, 12).accepted);
}

TEST_F(Machine, HasNothingToCancelWhereNothingIsScheduled) {
    bus.startLogind();
    const auto cancel = [this] { return machine()->selectPowerManagementNodes()->cancelRequest(0).description; };
    const std::string what = "cancellation of the request of this machine, node system: ";
    EXPECT_EQ(cancel(), what + "no request is in progress");
    bus.startLogind(R"({"PreparingForShutdown": true, "ScheduledShutdown": ["reboot", 1795177867000000]})");
    EXPECT_EQ(cancel(), what + "it is too late: reboot is under way");
    EXPECT_THAT(bus.requests(), IsEmpty());
}

/** What still answers while the machine goes down. */
struct Ending {
    const char* name;
    /** The parameters of the mock that runs then; null if none runs. */
    const char* parameters;
};

void PrintTo(const Ending& given, std::ostream* stream) {
    *stream << given.name;
}

class MachineEnding : public Machine, public testing::WithParamInterface<Ending> {
protected:
    void leave() {
        bus.endLogind();
        if (GetParam().parameters != nullptr) {
            bus.startLogind(GetParam().parameters);
        }
        takeLog();
    }
};

INSTANTIATE_TEST_SUITE_P(All, MachineEnding,
                         testing::Values(Ending{"WithoutSystemdLogind", nullptr},
                                         Ending{"WithOneThatCannotAnswer",
                                                R"({"PropertiesError": ["org.freedesktop.DBus.Error.Failed", "no"]})"},
                                         Ending{"WithOneThatHasForgotten", "{}"}),
                         [](const auto& each) { return std::string(each.param.name); });

TEST_P(MachineEnding, GoesDownWhateverCanStillBeAskedOnceItWasSeenTo) {
    bus.startLogind(R"({"ScheduledShutdown": ["reboot", 1795177867000000], "PreparingForShutdown": true})");
    const auto backend = machine();
    ASSERT_THAT(backend->selectPowerManagementNodes()->powerState(0), Optional(9));
    leave();
    const auto nodes = backend->selectPowerManagementNodes();
    EXPECT_THAT(nodes->powerState(0), Optional(9));
    EXPECT_THAT(nodes->powerStates(0), ElementsAre(2, 4, 5, 7, 8));
    EXPECT_THAT(takeLog(), IsEmpty());
}

TEST_P(MachineEnding, GoesDownOnceItDidWhatItWasAskedToDoAtOnce) {
    bus.startLogind();
    delay = 0ms;
    const auto backend = machine();
    ASSERT_TRUE(backend->selectPowerManagementNodes()->requestPowerState(0, 12).accepted);
    leave();
    EXPECT_THAT(backend->selectPowerManagementNodes()->powerState(0), Optional(12));
    EXPECT_THAT(takeLog(), IsEmpty());
}

TEST_F(Machine, GoesDownAtItsTimeWhereNobodyCanBeAskedAnyMore) {
    bus.startLogind();
    delay = 1ms;
    const auto backend = machine();
    ASSERT_TRUE(backend->selectPowerManagementNodes()->requestPowerState(0, 9).accepted);
    bus.endLogind();
    EXPECT_THAT(backend->selectPowerManagementNodes()->powerState(0), Optional(9));
    EXPECT_THAT(takeLog(), IsEmpty());
    bus.startLogind();
    EXPECT_THAT(backend->selectPowerManagementNodes()->powerState(0), Optional(1)) << "cancelled meanwhile";
    bus.endLogind();
    EXPECT_EQ(backend->selectPowerManagementNodes()->powerState(0), std::nullopt);
}

TEST_F(Machine, IsNotTakenForGoingDownBeforeItsTime) {
    bus.startLogind();
    const auto backend = machine();
    ASSERT_TRUE(backend->selectPowerManagementNodes()->requestPowerState(0, 9).accepted);
    bus.endLogind();
    EXPECT_EQ(backend->selectPowerManagementNodes()->powerState(0), std::nullopt);
}

TEST_F(Machine, TellsItsStateThoughPolkitIsMasked) {
    bus.startLogind(R"({"Calls": {"CanSuspend": {"error": ["org.freedesktop.systemd1.UnitMasked", "polkit"]}}})");
    const auto backend = machine();
    const auto nodes = backend->selectPowerManagementNodes();
    EXPECT_THAT(nodes->powerState(0), Optional(1));
    EXPECT_THAT(nodes->powerStates(0), ElementsAre(2));
    EXPECT_THAT(takeLog(), ElementsAre(HasSubstr("CanSuspend: polkit is masked")));
}

TEST_F(Processes, WaitOnceForASystemdLogindThatDoesNotAnswer) {
    configure("timeout = 3\n");
    bus.startLogind(R"({"Calls": {"CanReboot": {"delay": 60}}})");
    const std::string untold = "log 6000 Corvane.Instrumentation The power state of this machine cannot be told: ";
    const auto inTheSameRequest = untold + "there was no answer within 3 s, a moment ago";
    EXPECT_THAT(run("list list list list"),
                ElementsAre("system unknown", "system unknown", "system unknown", "system unknown", StartsWith(notice),
                            MatchesRegex(untold + ".*: systemd-logind does not answer within 3 s"), inTheSameRequest,
                            inTheSameRequest, inTheSameRequest));
}

} // namespace

#include "SimulatedBackend.h"

#include "FailingCalls.h"
#include "RecordedLog.h"
#include "TestSupport.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cerrno>
#include <csignal>
#include <functional>
#include <limits>
#include <thread>

#include <sys/ptrace.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace Norv::Agent;
using namespace std::chrono_literals;
using AgentTest::contentOf;
using AgentTest::takeLog;
using AgentTest::TemporaryFolder;
using AgentTest::writeFile;
using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::Optional;
using testing::SizeIs;
using testing::StartsWith;

/** A simulated machine of three nodes, with a clock that the test sets. */
class Simulated : public testing::Test {
protected:
    enum Node : std::size_t { system, blade1, blade2 };

    Simulated() { takeLog(); }

    SimulatedSettings settings() const {
        SimulatedSettings settings;
        settings.stateFile = stateFile;
        settings.rebootTime = 10s;
        settings.shutdownTime = 2500ms;
        settings.nodes = {{"system"}, {"chassis/blade1", 12, {2, 8}}, {"chassis/blade2", 6, {}}};
        return settings;
    }

    /** Another process's view of the machine. */
    std::unique_ptr<SimulatedBackend> machine() {
        return std::make_unique<SimulatedBackend>(settings(), [this] { return now; });
    }

    std::unique_ptr<NodeSelection> select() { return backend->selectPowerManagementNodes(); }

    std::optional<unsigned int> powerState(std::size_t node) { return select()->powerState(node); }

    const TemporaryFolder folder;
    std::filesystem::path stateFile = folder / "state.json";
    TimePoint now{1'795'177'867'123ms};
    std::unique_ptr<SimulatedBackend> backend = machine();
};

TEST_F(Simulated, HasTheConfiguredNodesInTheirOrder) {
    const auto nodes = select();
    ASSERT_EQ(nodes->size(), 3);
    EXPECT_EQ(nodes->path(system), "system");
    EXPECT_EQ(nodes->path(blade1), "chassis/blade1");
    EXPECT_EQ(nodes->path(blade2), "chassis/blade2");
    EXPECT_THAT(nodes->powerStates(system), ElementsAre(2, 5, 8));
    EXPECT_THAT(nodes->powerStates(blade1), ElementsAre(2, 8));
    EXPECT_THAT(nodes->powerStates(blade2), IsEmpty());
}

TEST_F(Simulated, IsInTheConfiguredStatesUntilTheFirstRequest) {
    const auto nodes = select();
    EXPECT_THAT(nodes->powerState(system), Optional(1));
    EXPECT_THAT(nodes->powerState(blade1), Optional(12));
    EXPECT_THAT(nodes->powerState(blade2), Optional(6));
    EXPECT_FALSE(std::filesystem::exists(stateFile));
}

struct Transition {
    unsigned int state;
    std::chrono::milliseconds duration;
    unsigned int stateAfterwards;
    const char* description;
};

class SimulatedTransition : public Simulated, public testing::WithParamInterface<Transition> {};

TEST_P(SimulatedTransition, LastsForItsTimeAndLeavesTheOtherNodesAlone) {
    const auto [state, duration, stateAfterwards, description] = GetParam();
    const auto nodes = select();
    const PowerRequestOutcome outcome = nodes->requestPowerState(system, state);
    EXPECT_TRUE(outcome.accepted);
    EXPECT_EQ(outcome.description, description);

    EXPECT_THAT(nodes->powerState(system), Optional(state));
    now += duration - 1ms;
    EXPECT_THAT(nodes->powerState(system), Optional(state));
    now += 1ms;
    EXPECT_THAT(nodes->powerState(system), Optional(stateAfterwards));
    EXPECT_THAT(powerState(system), Optional(stateAfterwards));
    EXPECT_THAT(powerState(blade1), Optional(12));
}

TEST_P(SimulatedTransition, IsOverWhereTheClockWasSetBackBehindItsBeginning) {
    const auto [state, duration, stateAfterwards, description] = GetParam();
    select()->requestPowerState(system, state);
    now -= 1ms;
    EXPECT_THAT(powerState(system), Optional(stateAfterwards));
    now -= 24h;
    EXPECT_THAT(powerState(system), Optional(stateAfterwards));
}

INSTANTIATE_TEST_SUITE_P(All, SimulatedTransition,
                         testing::Values(Transition{9, 10s, 1, "reboot of simulated node system, over in 10 s"},
                                         Transition{12, 2500ms, 10,
                                                    "shutdown of simulated node system, over in 2.5 s"}),
                         [](const auto& each) { return std::to_string(each.param.state); });

TEST_F(Simulated, RefusesAnotherRequestUntilTheOneBeforeIsOver) {
    const auto nodes = select();
    EXPECT_TRUE(nodes->requestPowerState(system, 9).accepted);
    now += 9500ms;
    for (const unsigned int state : {9U, 12U}) {
        const PowerRequestOutcome outcome = machine()->selectPowerManagementNodes()->requestPowerState(system, state);
        EXPECT_FALSE(outcome.accepted);
        EXPECT_THAT(outcome.description, EndsWith(" of simulated node system: another request is in progress: reboot "
                                                  "is over at 2026-11-20T12:31:18Z, in 0.5 s"));
    }
    EXPECT_TRUE(nodes->requestPowerState(blade1, 12).accepted) << "of another node";
    now += 500ms;
    EXPECT_TRUE(nodes->requestPowerState(system, 12).accepted);
    EXPECT_THAT(nodes->powerState(system), Optional(12));
}

TEST_F(Simulated, IsAsBeforeOnceARequestIsCancelled) {
    const auto nodes = select();
    nodes->requestPowerState(blade2, 9);
    const PowerRequestOutcome outcome = machine()->selectPowerManagementNodes()->cancelRequest(blade2);
    EXPECT_TRUE(outcome.accepted);
    EXPECT_EQ(outcome.description, "cancellation of the request of simulated node chassis/blade2 (reboot)");
    EXPECT_THAT(powerState(blade2), Optional(6)) << "as it is configured";

    nodes->requestPowerState(system, 12);
    now += 1h;
    nodes->requestPowerState(system, 9);
    EXPECT_TRUE(nodes->cancelRequest(system).accepted);
    EXPECT_THAT(nodes->powerState(system), Optional(10)) << "off, as the shutdown before has left it";
    EXPECT_TRUE(nodes->requestPowerState(system, 9).accepted);
}

TEST_F(Simulated, HasNothingToCancelWhereNothingIsInProgress) {
    const auto nodes = select();
    const char* const refusal = "cancellation of the request of simulated node system: no request is in progress";
    EXPECT_EQ(nodes->cancelRequest(system).description, refusal);
    EXPECT_FALSE(std::filesystem::exists(stateFile) && contentOf(stateFile).find("system") != std::string::npos);
    nodes->requestPowerState(system, 9);
    now += 10s;
    const PowerRequestOutcome outcome = nodes->cancelRequest(system);
    EXPECT_FALSE(outcome.accepted);
    EXPECT_EQ(outcome.description, refusal);
    EXPECT_THAT(powerState(system), Optional(1));
}

TEST_F(Simulated, ComesBackFromOffByAReboot) {
    const auto nodes = select();
    nodes->requestPowerState(system, 12);
    now += 1h;
    EXPECT_TRUE(nodes->requestPowerState(system, 9).accepted);
    EXPECT_THAT(nodes->powerState(system), Optional(9));
    now += 10s;
    EXPECT_THAT(nodes->powerState(system), Optional(1));
}

TEST_F(Simulated, RefusesEveryOtherState) {
    for (const unsigned int state : {0U, 1U, 2U, 5U, 8U, 10U, 11U, 13U, std::numeric_limits<unsigned int>::max()}) {
        const PowerRequestOutcome outcome = select()->requestPowerState(blade1, state);
        EXPECT_FALSE(outcome.accepted) << state;
        EXPECT_EQ(outcome.description, "power state " + std::to_string(state) +
                                           " of simulated node chassis/blade1: expected 9 (reboot) or 12 (shutdown)");
    }
    EXPECT_THAT(powerState(blade1), Optional(12));
    EXPECT_FALSE(std::filesystem::exists(stateFile));
}

TEST_F(Simulated, ShowsTheRequestsOfOthersFromTheNextSelectionOn) {
    const auto before = select();
    machine()->selectPowerManagementNodes()->requestPowerState(blade1, 9);
    EXPECT_THAT(before->powerState(blade1), Optional(12));
    EXPECT_THAT(powerState(blade1), Optional(9));
}

TEST_F(Simulated, GivesEachFileALaterTimeThanTheOneBefore) {
    // Size and inode number may be those of a former file: the time tells a reader that the content is another one.
    select()->requestPowerState(system, 9);
    std::filesystem::last_write_time(stateFile, std::filesystem::file_time_type::clock::now() + 1h);
    for (int i = 0; i < 10; ++i) {
        const auto before = std::filesystem::last_write_time(stateFile);
        now += 10s;
        ASSERT_TRUE(select()->requestPowerState(system, 9).accepted);
        ASSERT_GT(std::filesystem::last_write_time(stateFile), before);
    }
}

TEST_F(Simulated, IsInTheConfiguredStatesAgainOnceTheFileIsRemoved) {
    select()->requestPowerState(blade1, 9);
    ASSERT_THAT(powerState(blade1), Optional(9));
    std::filesystem::remove(stateFile);
    EXPECT_THAT(powerState(blade1), Optional(12));
}

TEST_F(Simulated, IgnoresWhatElseIsInItsFile) {
    writeFile(stateFile, R"({"version": [1, {"nodes": 2}], "nodes": {"system": {"by": ["a", {"over": -1}],
        "request": "shutdown", "more": {"request": "sleep", "over": null}, "over": 5}}, "comment": {"system": true}})");
    EXPECT_THAT(powerState(system), Optional(10));
    EXPECT_THAT(folder.filesThatBegin("state.json."), IsEmpty());
}

TEST_F(Simulated, WritesItsFileForPeopleAndOtherPrograms) {
    ASSERT_TRUE(select()->requestPowerState(blade1, 12).accepted);
    now += 1min;
    ASSERT_TRUE(select()->requestPowerState(system, 9).accepted);
    const auto over = [this](std::chrono::milliseconds duration) {
        return std::to_string((now + duration).time_since_epoch().count());
    };
    EXPECT_EQ(contentOf(stateFile),
              "{\n  \"nodes\": {\n    \"chassis/blade1\": {\n      \"over\": " + over(settings().shutdownTime - 1min) +
                  ",\n      \"request\": \"shutdown\"\n    },\n    \"system\": {\n      \"over\": " +
                  over(settings().rebootTime) + ",\n      \"request\": \"reboot\"\n    }\n  }\n}\n");
}

TEST_F(Simulated, KeepsTheRequestsOfNodesThatItDoesNotHave) {
    writeFile(stateFile, R"({"nodes": {"rack/old": {"request": "shutdown", "over": 5}}})");
    select()->requestPowerState(system, 9);
    EXPECT_THAT(contentOf(stateFile), AllOf(HasSubstr("\"rack/old\""), HasSubstr("\"system\"")));
}

TEST_F(Simulated, MakesTheFoldersOfItsFile) {
    stateFile = folder / "a/b/state.json";
    backend = machine();
    const mode_t mask = umask(0);
    EXPECT_TRUE(select()->requestPowerState(system, 9).accepted);
    umask(mask);
    struct stat status {};
    ASSERT_EQ(stat((folder / "a/b").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0755);
    ASSERT_EQ(stat(stateFile.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0644);
}

TEST_F(Simulated, ReplacesWhatAKilledProcessLeftHalfWritten) {
    writeFile(stateFile.string() + ".new", "{\"nodes\": {\"sys");
    EXPECT_TRUE(select()->requestPowerState(system, 9).accepted);
    EXPECT_THAT(powerState(system), Optional(9));
    EXPECT_THAT(folder.filesThatBegin("state.json.new"), IsEmpty());
}

struct Damage {
    const char* name;
    const char* content;
    const char* reason;
};

class SimulatedDamaged : public Simulated, public testing::WithParamInterface<Damage> {};

TEST_P(SimulatedDamaged, FileIsReportedOnceAndSetAside) {
    writeFile(stateFile, GetParam().content);
    EXPECT_THAT(powerState(blade1), Optional(12));
    EXPECT_THAT(powerState(blade1), Optional(12));

    const auto aside = folder.filesThatBegin("state.json.damaged-");
    ASSERT_THAT(aside, ElementsAre(MatchesRegex("state\\.json\\.damaged-[0-9]{8}T[0-9]{6}Z-1")));
    EXPECT_EQ(contentOf(folder / aside.front()), GetParam().content);
    EXPECT_FALSE(std::filesystem::exists(stateFile));
    EXPECT_THAT(takeLog(), ElementsAre(AllOf(StartsWith("log 10000 Corvane.Instrumentation The state file " +
                                                        stateFile.string() + " is damaged ("),
                                             HasSubstr(GetParam().reason),
                                             EndsWith(") and was set aside as " + (folder / aside.front()).string() +
                                                      ": the simulated machine starts from its configured states"))));
}

TEST_P(SimulatedDamaged, FileIsSetAsideBeforeARequestIsWritten) {
    const auto nodes = select();
    writeFile(stateFile, GetParam().content);
    EXPECT_TRUE(nodes->requestPowerState(system, 9).accepted);
    EXPECT_THAT(powerState(system), Optional(9));
    const auto aside = folder.filesThatBegin("state.json.damaged-");
    ASSERT_THAT(aside, SizeIs(1));
    EXPECT_EQ(contentOf(folder / aside.front()), GetParam().content);
    EXPECT_THAT(takeLog(), SizeIs(1));
}

INSTANTIATE_TEST_SUITE_P(
    All, SimulatedDamaged,
    testing::Values(
        Damage{"Empty", "", "parse error"}, Damage{"Torn", R"({"nodes": {"sys)", "parse error"},
        Damage{"NoText", "\xff\xfe", "parse error"}, Damage{"NumberTooLarge", R"({"nodes": 1e999})", "number overflow"},
        Damage{"OtherType", "[]", "nodes is missing"}, Damage{"NoNodes", "{}", "nodes is missing"},
        Damage{"NodesElsewhere", R"([{"nodes": {}}])", "nodes is missing"},
        Damage{"NodesNoObject", R"({"nodes": []})", "nodes is no object"},
        Damage{"NodeNoObject", R"({"nodes": {"system": 9}})", "node system is no object"},
        Damage{"NoRequest", R"({"nodes": {"system": {"over": 5}}})", "node system lacks request"},
        Damage{"UnknownRequestBefore", R"({"nodes": {"system": {"request": "reboot", "over": 5, "after": "sleep"}}})",
               "unknown request \"sleep\" of node system"},
        Damage{"UnknownRequest", R"({"nodes": {"system": {"request": "sleep", "over": 5}}})",
               "unknown request \"sleep\" of node system"},
        Damage{"NoTime", R"({"nodes": {"system": {"request": "reboot"}}})", "node system lacks over"},
        Damage{"NegativeTime", R"({"nodes": {"system": {"request": "reboot", "over": -1}}})",
               "time -1 of node system is not in milliseconds since 1970"},
        Damage{"FractionOfTime", R"({"nodes": {"system": {"request": "reboot", "over": 0.5}}})",
               "time 0.5 of node system is not in milliseconds since 1970"},
        Damage{"TimeTooLarge", R"({"nodes": {"system": {"request": "reboot", "over": 9223372036854775808}}})",
               "time 9223372036854775808 of node system is not in milliseconds since 1970"}),
    [](const auto& each) { return each.param.name; });

TEST_F(Simulated, GivesEveryDamagedFileItsOwnName) {
    for (const std::size_t count : {1U, 2U, 3U}) {
        writeFile(stateFile, "damage " + std::to_string(count));
        powerState(system);
        EXPECT_THAT(folder.filesThatBegin("state.json.damaged-"), SizeIs(count));
    }
}

TEST_F(Simulated, LeavesADamagedFileAloneThatCannotBeSetAside) {
    std::filesystem::create_directory(stateFile.string() + ".lock");
    writeFile(stateFile, "damage");
    EXPECT_THAT(powerState(system), Optional(1));
    EXPECT_THAT(powerState(system), Optional(1));
    EXPECT_THAT(
        takeLog(),
        ElementsAre(AllOf(
            StartsWith("log 10000 Corvane.Instrumentation The state file " + stateFile.string() + " is damaged ("),
            HasSubstr("The file cannot be set aside: " + stateFile.string() + ".lock: cannot be opened: "))));
    EXPECT_FALSE(select()->requestPowerState(system, 9).accepted);
    EXPECT_EQ(contentOf(stateFile), "damage");
}

struct Obstacle {
    const char* name;
    /** Makes the obstacle at the path of a state file. */
    std::function<void(const std::filesystem::path&)> put;
    /** The refusal's message behind the state file's name. */
    const char* problem;
};

class SimulatedUnwritable : public Simulated, public testing::WithParamInterface<Obstacle> {};

TEST_P(SimulatedUnwritable, FileRefusesTheRequestWithItsReason) {
    GetParam().put(stateFile);
    const PowerRequestOutcome outcome = select()->requestPowerState(system, 9);
    EXPECT_FALSE(outcome.accepted);
    EXPECT_THAT(outcome.description,
                StartsWith("reboot of simulated node system: " + stateFile.string() + GetParam().problem));
}

INSTANTIATE_TEST_SUITE_P(
    All, SimulatedUnwritable,
    testing::Values(Obstacle{"LockIsAFolder",
                             [](const auto& file) { std::filesystem::create_directory(file.string() + ".lock"); },
                             ".lock: cannot be opened: "},
                    Obstacle{"ReplacementIsAFolder",
                             [](const auto& file) { std::filesystem::create_directory(file.string() + ".new"); },
                             ".new: cannot be removed: "},
                    Obstacle{"IsAFolder", [](const auto& file) { std::filesystem::create_directory(file); },
                             ": is not a regular file: "}),
    [](const auto& each) { return each.param.name; });

TEST_F(Simulated, CannotTellItsStatesWhereTheFileCannotBeRead) {
    std::filesystem::create_directory(stateFile);
    EXPECT_EQ(powerState(system), std::nullopt);
    EXPECT_THAT(takeLog(),
                ElementsAre(StartsWith("log 6000 Corvane.Instrumentation The power states of the simulated machine "
                                       "cannot be told: " +
                                       stateFile.string() + ": is not a regular file")));
    EXPECT_EQ(select()->size(), 3);
}

/** A call that fails while the state is stored, and the refusal's message behind the state file's name. */
struct FailingCall {
    const char* call;
    int error;
    const char* problem;
};

void PrintTo(const FailingCall& given, std::ostream* stream) {
    *stream << given.call << " with error " << given.error;
}

class SimulatedStoring : public Simulated, public testing::WithParamInterface<FailingCall> {};

TEST_P(SimulatedStoring, RefusesTheRequestWhereACallFailsAndLeavesTheFileAsItWas) {
    ASSERT_TRUE(select()->requestPowerState(blade1, 9).accepted);
    const std::string before = contentOf(stateFile);
    const auto nodes = select();
    AgentTest::failNext(GetParam().call, GetParam().error);
    const PowerRequestOutcome outcome = nodes->requestPowerState(system, 9);
    EXPECT_TRUE(AgentTest::hasFailed());
    EXPECT_FALSE(outcome.accepted);
    EXPECT_EQ(outcome.description, "reboot of simulated node system: " + stateFile.string() + GetParam().problem);
    EXPECT_EQ(contentOf(stateFile), before);
    EXPECT_THAT(folder.filesThatBegin("state.json.new"), IsEmpty());
    EXPECT_THAT(nodes->powerState(system), Optional(1));
    EXPECT_TRUE(nodes->requestPowerState(system, 9).accepted) << "once the call succeeds again";
}

INSTANTIATE_TEST_SUITE_P(
    All, SimulatedStoring,
    testing::Values(FailingCall{"write", ENOSPC, ".new: cannot be written: No space left on device"},
                    FailingCall{"write", 0, ".new: cannot be written: No space left on device"},
                    FailingCall{"write", EIO, ".new: cannot be written: Input/output error"},
                    FailingCall{"futimens", EPERM, ".new: cannot be put in place: Operation not permitted"},
                    FailingCall{"fsync", EIO, ".new: cannot be put in place: Input/output error"},
                    FailingCall{"rename", EACCES, ".new: cannot be put in place: Permission denied"}));

/**
 * Stores a request in a process of its own, which is killed after so many entries into system calls and returns from
 * them. @return whether it was killed; false if it ended before.
 */
bool killWhileStoring(const std::filesystem::path& file, const PowerRequest& request, int stops) {
    const pid_t child = fork();
    if (child == 0) {
        ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
        raise(SIGSTOP);
        StateFile(file).update([&](PowerRequests& requests) { requests.insert_or_assign("system", request); });
        _exit(0);
    }
    int status = 0;
    for (waitpid(child, &status, 0); WIFSTOPPED(status) && stops > 0; --stops) {
        ptrace(PTRACE_SYSCALL, child, nullptr, nullptr);
        waitpid(child, &status, 0);
    }
    if (!WIFSTOPPED(status)) {
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
        return false;
    }
    kill(child, SIGKILL);
    waitpid(child, &status, 0);
    return true;
}

TEST_F(Simulated, IsWholeWheneverAProcessIsKilledWhileItStoresARequest) {
    const auto requestOver = [](int time) {
        return PowerRequest{powerTransitions.begin(), TimePoint(std::chrono::milliseconds(time))};
    };
    const auto over = [&] { return StateFile(stateFile).read()->at("system").over; };
    int stops = 0;
    bool killed = true;
    bool wasStored = false;
    while (killed) {
        const PowerRequest before = requestOver(2 * stops);
        const PowerRequest after = requestOver(2 * stops + 1);
        StateFile(stateFile).update([&](PowerRequests& requests) { requests.insert_or_assign("system", before); });
        killed = killWhileStoring(stateFile, after, stops);
        ASSERT_THAT(over(), testing::AnyOf(before.over, after.over)) << "killed after " << stops << " stops";
        ASSERT_THAT(folder.filesThatBegin("state.json.damaged"), IsEmpty()) << "killed after " << stops << " stops";
        wasStored = wasStored || (killed && over() == after.over);
        ++stops;
    }
    EXPECT_EQ(over(), requestOver(2 * (stops - 1) + 1).over);
    EXPECT_GT(stops, 20);
    EXPECT_TRUE(wasStored) << "by a process that was killed before its end";
}

TEST_F(Simulated, IsWrittenOnWhereASignalInterrupts) {
    AgentTest::failNext("write", EINTR);
    EXPECT_TRUE(select()->requestPowerState(system, 9).accepted);
    EXPECT_TRUE(AgentTest::hasFailed());
    EXPECT_THAT(powerState(system), Optional(9));
}

TEST_F(Simulated, WarnsOfMoreNodesThanCanBeCounted) {
    SimulatedSettings many = settings();
    many.nodes.assign(255, {"node"});
    EXPECT_EQ(SimulatedBackend(many).warning(), "");
    many.nodes.emplace_back();
    SimulatedBackend machine(many);
    EXPECT_EQ(machine.warning(),
              "256 nodes: clients see too few instances of TALVO_PowerManagementElementCapabilities, or none, since "
              "their 65536 pairs of service and capabilities are counted with 16 bits: expected 255 nodes at most");
    const auto facts = machine.examine().facts;
    EXPECT_EQ(facts.back().name, "warning");
    EXPECT_EQ(facts.back().value, machine.warning());
}

TEST_F(Simulated, TellsItsStatesAsClientsSeeThemToWhoeverExaminesIt) {
    select()->requestPowerState(system, 12);
    std::vector<std::string> facts;
    for (const auto& [name, value] : backend->examine().facts) {
        facts.push_back(name + ": " + value);
    }
    EXPECT_THAT(facts, ElementsAre("node system: 1 (Other), as while it reboots or shuts down",
                                   "node chassis/blade1: 1 (Other), as while it reboots or shuts down",
                                   "node chassis/blade2: 1 (Other), as while it reboots or shuts down"));
}

TEST_F(Simulated, NeitherReadsNorReplacesAFileThatIsLargerThanAnyOfItsOwn) {
    writeFile(stateFile, "");
    std::filesystem::resize_file(stateFile, 2'000'000'000);
    EXPECT_EQ(powerState(system), std::nullopt);
    EXPECT_THAT(takeLog(),
                ElementsAre(AllOf(HasSubstr(stateFile.string()), HasSubstr("is larger than 16777216 bytes"))));
    EXPECT_FALSE(select()->requestPowerState(system, 9).accepted);
    EXPECT_EQ(std::filesystem::file_size(stateFile), 2'000'000'000U);
}

TEST_F(Simulated, DoesNotWaitForAPipeInPlaceOfItsFile) {
    ASSERT_EQ(mkfifo(stateFile.c_str(), 0666), 0);
    EXPECT_EQ(powerState(system), std::nullopt);
    EXPECT_FALSE(select()->requestPowerState(system, 9).accepted);
}

TEST_F(Simulated, RefusesRequestsWhereTheFolderIsAFile) {
    writeFile(folder / "file", "");
    stateFile = folder / "file/state.json";
    backend = machine();
    EXPECT_EQ(powerState(system), std::nullopt);
    EXPECT_FALSE(select()->requestPowerState(system, 9).accepted);
}

/** Runs `work` in a child process, whose exit status is 0, or 1 if `work` throws. */
template <typename Work>
pid_t inProcess(Work work) {
    const pid_t child = fork();
    if (child == 0) {
        try {
            work();
        } catch (...) {
            _exit(1);
        }
        _exit(0);
    }
    return child;
}

TEST_F(Simulated, FileIsWholeWheneverAProcessIsKilled) {
    int pipe[2];
    ASSERT_EQ(::pipe(pipe), 0);
    for (int round = 0; round < 60; ++round) {
        const pid_t child = inProcess([&] {
            for (unsigned int i = 0;; ++i) {
                now += 10s; // so that the one before is over
                machine()->selectPowerManagementNodes()->requestPowerState(i % 3, i % 2 == 0 ? 9 : 12);
                const char written = 1;
                if (i == 0 && write(pipe[1], &written, 1) != 1) {
                    _exit(1);
                }
            }
        });
        char written = 0;
        ASSERT_EQ(read(pipe[0], &written, 1), 1);
        std::this_thread::sleep_for(std::chrono::microseconds(137 * round));
        kill(child, SIGKILL);
        ASSERT_EQ(waitpid(child, nullptr, 0), child);

        StateFile file(stateFile);
        EXPECT_EQ(file.read()->count("system"), 1);
        ASSERT_THAT(takeLog(), IsEmpty());
        now += 24h * 365; // whatever the child has asked for is over
        ASSERT_TRUE(select()->requestPowerState(system, 9).accepted);
    }
    close(pipe[0]);
    close(pipe[1]);
    EXPECT_THAT(folder.filesThatBegin("state.json.damaged-"), IsEmpty());
}

TEST_F(Simulated, LosesNoRequestAmongProcesses) {
    constexpr int processes = 4;
    constexpr int requests = 25;
    std::vector<pid_t> children;
    for (int process = 0; process < processes; ++process) {
        children.push_back(inProcess([&] {
            StateFile file(stateFile);
            for (int i = 0; i < requests; ++i) {
                file.update([&](PowerRequests& content) {
                    content[std::to_string(process) + '/' + std::to_string(i)] = {&powerTransitions.front(), now};
                });
            }
        }));
    }
    for (const pid_t child : children) {
        int status = -1;
        waitpid(child, &status, 0);
        EXPECT_EQ(status, 0);
    }
    EXPECT_THAT(*StateFile(stateFile).read(), SizeIs(processes * requests));
}

TEST_F(Simulated, ServesManyThreadsAtOnce) {
    std::vector<std::thread> threads;
    std::atomic<int> wrong = 0;
    for (std::size_t i = 0; i < 4; ++i) {
        threads.emplace_back([&, i] {
            for (int round = 0; round < 50; ++round) {
                const auto nodes = select();
                if (i < 2 && !nodes->requestPowerState(i, 9).accepted) {
                    ++wrong;
                }
                if (i < 2 && (nodes->powerState(i) != 9 || !nodes->cancelRequest(i).accepted)) {
                    ++wrong;
                }
                if (nodes->powerState(blade2) != 6) {
                    ++wrong;
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
}

} // namespace

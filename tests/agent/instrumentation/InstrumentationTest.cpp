#include "Norv/Instrumentation.h"
#include "Norv/Machine.h"
#include "OrvLog/Observer.h"

#include "RecordedLog.h"
#include "TestSupport.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <thread>
#include <type_traits>

#include <dlfcn.h>
#include <unistd.h>

namespace {

using namespace Norv;
using AgentTest::takeLog;
using AgentTest::TemporaryFolder;
using AgentTest::writeFile;
using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;
using testing::StartsWith;
using testing::UnorderedElementsAre;

static_assert(sizeof(Instrumentation) == sizeof(void*));
static_assert(!std::is_polymorphic_v<Instrumentation>);
static_assert(!std::is_copy_constructible_v<Instrumentation> && !std::is_copy_assignable_v<Instrumentation>);

constexpr auto powerNodes = NodeLexicon::POWER_MANAGEMENT_NODE;
constexpr auto powerState = NodeLexicon::POWER_STATE;
constexpr auto powerStateList = NodeLexicon::POWER_STATE_LIST;

TEST(InstrumentationLibrary, ExportsItsMembersTheOptionalFunctionsAndNothingElse) {
    EXPECT_THAT(
        AgentTest::exportedSymbols(ORV_INSTRUMENTATION_LIBRARY),
        UnorderedElementsAre(
            "orvInstrumentationMachine1", "orvInstrumentationOnBehalfOf1", "orvInstrumentationPowerNode1",
            "orvInstrumentationPowerState1", "orvInstrumentationCancelRequest1", "_ZN4Norv15InstrumentationC1Ev",
            "_ZN4Norv15InstrumentationC2Ev", "_ZN4Norv15InstrumentationD1Ev", "_ZN4Norv15InstrumentationD2Ev",
            "_ZN4Norv15Instrumentation10selectNodeENS_11NodeLexicon8NodeTypeE", "_ZN4Norv15InstrumentationcvbEv",
            "_ZN4Norv15InstrumentationppEv", "_ZN4Norv15Instrumentation13getPathToNodeB5cxx11Ev",
            "_ZN4Norv15Instrumentation19convertPathToStringERKNSt7__cxx1112basic_stringIcSt11char_traitsIcESaIcEEE",
            "_ZN4Norv15Instrumentation11getPropertyENS_11NodeLexicon10PropertiesERSt6vectorIjSaIjEE",
            "_ZN4Norv15Instrumentation11getPropertyENS_11NodeLexicon10PropertiesERj",
            "_ZN4Norv15Instrumentation11setPropertyENS_11NodeLexicon10PropertiesERj"));
}

TEST(InstrumentationLibrary, HasTheOptionalFunctionsUnderTheNamesThatTheHeaderGives) {
    EXPECT_EQ(dlsym(RTLD_DEFAULT, machine1Name), reinterpret_cast<void*>(&orvInstrumentationMachine1));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, onBehalfOf1Name), reinterpret_cast<void*>(&orvInstrumentationOnBehalfOf1));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, powerNode1Name), reinterpret_cast<void*>(&orvInstrumentationPowerNode1));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, powerState1Name), reinterpret_cast<void*>(&orvInstrumentationPowerState1));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, cancelRequest1Name), reinterpret_cast<void*>(&orvInstrumentationCancelRequest1));
}

/** The requester in log records of requests that this process makes. */
const std::string askedByThis =
    " [asked by instrumentation_test, process " + std::to_string(getpid()) + ", uid " + std::to_string(geteuid()) + ']';

/** Tests of a cursor in this process. The configuration is read once, so they share one machine. */
class Cursor : public testing::Test {
protected:
    static void SetUpTestSuite() {
        writeFile(folder() / "agent.toml", R"(
            [instrumentation.simulated]
            state-file = ")" + (folder() / "state.json").string() +
                                               R"("
            reboot-time = 3600
            [[instrumentation.simulated.node]]
            path = "system"
            [[instrumentation.simulated.node]]
            path = "chassis/blade1"
            power-state = 12
            power-states = [2, 8]
            [[instrumentation.simulated.node]]
            path = "chassis/blade2"
            power-states = []
        )");
        setenv("ORV_AGENT_CONFIG", (folder() / "agent.toml").c_str(), 1);
        Instrumentation firstUse;
        takeLog();
    }

    /** Each test begins without former requests. */
    void SetUp() override { std::filesystem::remove(folder() / "state.json"); }

    Instrumentation cursor;

private:
    static const TemporaryFolder& folder() {
        static const TemporaryFolder only;
        return only;
    }
};

/** Expects that every member returns nothing, and leaves its arguments unchanged. */
void expectStandsOnNoNode(Instrumentation& cursor) {
    EXPECT_FALSE(bool(cursor));
    EXPECT_EQ(cursor.getPathToNode(), "");
    unsigned int number = 77;
    EXPECT_FALSE(cursor.getProperty(powerState, number));
    EXPECT_EQ(number, 77);
    std::vector<unsigned int> list = {7, 7};
    EXPECT_FALSE(cursor.getProperty(powerStateList, list));
    EXPECT_THAT(list, ElementsAre(7, 7));

    number = 9;
    EXPECT_FALSE(cursor.setProperty(powerState, number));
    EXPECT_EQ(number, 9);
    EXPECT_THAT(takeLog(), ElementsAre("log 10000 Corvane.Instrumentation Power request refused: write of 9 to "
                                       "property 123: expected a cursor that stands on a node" +
                                       askedByThis));
}

TEST_F(Cursor, StandsOnNoNodeBeforeTheFirstSelection) {
    expectStandsOnNoNode(cursor);
    ++cursor;
    expectStandsOnNoNode(cursor);
}

TEST_F(Cursor, FindsNoNodeOfAnyOtherType) {
    for (const int type : {0, 39, 41}) {
        ASSERT_TRUE(cursor.selectNode(powerNodes));
        EXPECT_FALSE(cursor.selectNode(static_cast<NodeLexicon::NodeType>(type))) << type;
        expectStandsOnNoNode(cursor);
    }
}

TEST_F(Cursor, WalksTheNodesInTheirOrder) {
    ASSERT_TRUE(cursor.selectNode(powerNodes));
    EXPECT_TRUE(bool(cursor));
    EXPECT_EQ(cursor.getPathToNode(), "/system");
    EXPECT_EQ(&++cursor, &cursor);
    EXPECT_EQ(cursor.getPathToNode(), "/chassis/blade1");
    ++cursor;
    EXPECT_TRUE(bool(cursor));
    EXPECT_EQ(cursor.getPathToNode(), "/chassis/blade2");
    ++cursor;
    expectStandsOnNoNode(cursor);
    ++cursor;
    expectStandsOnNoNode(cursor);
}

TEST_F(Cursor, BeginsAgainAtTheFirstNodeWithEverySelection) {
    for (int i = 0; i < 2; ++i) {
        ASSERT_TRUE(cursor.selectNode(powerNodes));
        EXPECT_EQ(cursor.getPathToNode(), "/system");
        ++cursor;
    }
}

TEST_F(Cursor, ConvertsPathsToTextWhereverItStands) {
    EXPECT_EQ(cursor.convertPathToString("/chassis/blade1"), "chassis/blade1");
    EXPECT_EQ(cursor.convertPathToString("chassis/blade1"), "chassis/blade1");
    EXPECT_EQ(cursor.convertPathToString("/"), "");
    EXPECT_EQ(cursor.convertPathToString(""), "");
}

TEST_F(Cursor, ReadsTheStateAndTheListOfStates) {
    cursor.selectNode(powerNodes);
    ++cursor;
    unsigned int state = 0;
    EXPECT_TRUE(cursor.getProperty(powerState, state));
    EXPECT_EQ(state, 12);
    std::vector<unsigned int> list = {7};
    EXPECT_TRUE(cursor.getProperty(powerStateList, list));
    EXPECT_THAT(list, ElementsAre(2, 8));
    ++cursor;
    EXPECT_TRUE(cursor.getProperty(powerStateList, list));
    EXPECT_THAT(list, IsEmpty());
}

TEST_F(Cursor, HasNoOtherPropertyAndNoneOfTheOtherKind) {
    cursor.selectNode(powerNodes);
    unsigned int number = 77;
    std::vector<unsigned int> list = {7, 7};
    for (const int property : {0, 122, 124, 125, 126}) {
        EXPECT_FALSE(cursor.getProperty(static_cast<NodeLexicon::Properties>(property), number)) << property;
    }
    for (const int property : {0, 122, 123, 124, 126}) {
        EXPECT_FALSE(cursor.getProperty(static_cast<NodeLexicon::Properties>(property), list)) << property;
    }
    EXPECT_EQ(number, 77);
    EXPECT_THAT(list, ElementsAre(7, 7));
}

TEST_F(Cursor, WritesThePowerStateAndReadsItBack) {
    cursor.selectNode(powerNodes);
    unsigned int state = 9;
    EXPECT_TRUE(cursor.setProperty(powerState, state));
    EXPECT_EQ(state, 9);
    EXPECT_TRUE(cursor.getProperty(powerState, state));
    EXPECT_EQ(state, 9);
    EXPECT_EQ(orvInstrumentationPowerState1(), 9);
    EXPECT_THAT(takeLog(), ElementsAre("log 10000 Corvane.Instrumentation Power request accepted: reboot of simulated "
                                       "node system, over in 3600 s" +
                                       askedByThis));
}

TEST_F(Cursor, TellsRefusalAndAcceptanceByTheKindOfTheirRecords) {
    cursor.selectNode(powerNodes);
    AgentTest::takeRecordKinds();
    for (unsigned int state : {12U, 5U}) {
        cursor.setProperty(powerState, state);
    }
    takeLog();
    EXPECT_THAT(AgentTest::takeRecordKinds(),
                ElementsAre(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, OrvLog::POWER_REQUEST_REFUSED_RECORD));
}

TEST_F(Cursor, NamesOnWhoseBehalfTheThreadActs) {
    cursor.selectNode(powerNodes);
    unsigned int state = 5;
    const std::string whom = "alice from 192.0.2.7";
    orvInstrumentationOnBehalfOf1(whom.c_str());
    cursor.setProperty(powerState, state);
    std::thread([&] {
        Instrumentation own;
        own.setProperty(powerState, state);
    }).join();
    orvInstrumentationOnBehalfOf1(nullptr);
    cursor.setProperty(powerState, state);
    const std::string askedForAlice = askedByThis.substr(0, askedByThis.size() - 1) + ", on behalf of " + whom + ']';
    EXPECT_THAT(takeLog(), ElementsAre(EndsWith(askedForAlice), EndsWith(askedByThis), EndsWith(askedByThis)));
}

TEST_F(Cursor, IsOneOfASimulatedMachine) {
    EXPECT_EQ(orvInstrumentationMachine1(), SIMULATED_MACHINE);
}

TEST_F(Cursor, RefusesWhatIsNoPowerRequest) {
    cursor.selectNode(powerNodes);
    unsigned int value = 5;
    EXPECT_FALSE(cursor.setProperty(powerState, value));
    EXPECT_FALSE(cursor.setProperty(powerStateList, value));
    EXPECT_EQ(value, 5);
    EXPECT_THAT(takeLog(), ElementsAre("log 10000 Corvane.Instrumentation Power request refused: power state 5 of "
                                       "simulated node system: expected 9 (reboot) or 12 (shutdown)" +
                                           askedByThis,
                                       "log 10000 Corvane.Instrumentation Power request refused: write of 5 to "
                                       "property 125 of node system: expected property 123" +
                                           askedByThis));
}

TEST_F(Cursor, MayBeUsedBesideOthersInOtherThreads) {
    std::vector<std::thread> threads;
    std::atomic<int> visited = 0;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 50; ++round) {
                Instrumentation own;
                unsigned int state = 0;
                for (own.selectNode(powerNodes); own; ++own) {
                    visited += own.getProperty(powerState, state) ? 1 : 0;
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(visited, 4 * 50 * 3);
}

/** Tests with separate processes that use the library, since the configuration is read once in a process. */
class Processes : public testing::Test {
protected:
    void configure(const std::string& text) const { writeFile(folder / "agent.toml", text); }

    void configureSimulated(const std::string& nodes, const std::string& rebootTime) const {
        configure("[instrumentation.simulated]\nstate-file = \"" + stateFile + "\"\nreboot-time = " + rebootTime +
                  '\n' + nodes);
    }

    /** The output of a process that runs commands of probe.cpp. */
    std::vector<std::string> run(const std::string& commands) const {
        std::vector<std::string> lines = AgentTest::linesOf("ORV_AGENT_CONFIG='" + (folder / "agent.toml").string() +
                                                            "' " + ORV_INSTRUMENTATION_PROBE + ' ' + commands);
        AgentTest::maskRequester(lines);
        return lines;
    }

    const TemporaryFolder folder;
    const std::string stateFile = folder / "state.json";
    const std::string firstUse = "log 5000 Corvane.Instrumentation Power management of a simulated machine (";
    const std::string askedByProbe = " [asked by instrumentation_probe, process N, uid N]";
    const std::string twoNodes = "[[instrumentation.simulated.node]]\npath = \"a\"\n"
                                 "[[instrumentation.simulated.node]]\npath = \"b/c\"\n";
};

TEST_F(Processes, SayOnceWhichMachineIsManaged) {
    configureSimulated(twoNodes, "10");
    EXPECT_THAT(run("list list"), ElementsAre("a 1 2 5 8", "b/c 1 2 5 8", "a 1 2 5 8", "b/c 1 2 5 8",
                                              firstUse + "2 nodes, state in " + stateFile + ")"));
    configureSimulated("", "10");
    EXPECT_THAT(run("list"), ElementsAre("system 1 2 5 8", firstUse + "1 node, state in " + stateFile + ")"));
}

TEST_F(Processes, TellWhichMachineIsManagedBeforeAnythingElse) {
    configureSimulated(twoNodes, "10");
    EXPECT_THAT(run("machine"), ElementsAre("simulated", StartsWith(firstUse)));
    configure("[instrumentation]\nbackend = \"abacus\"\n");
    EXPECT_THAT(run("machine"), ElementsAre("none", StartsWith("trace 6000")));
}

TEST_F(Processes, WarnOnceOfMoreNodesThanCanBeCounted) {
    std::string nodes;
    for (int number = 0; number < 256; ++number) {
        nodes += "[[instrumentation.simulated.node]]\npath = \"" + std::to_string(number) + "\"\n";
    }
    configureSimulated(nodes, "10");
    EXPECT_THAT(
        run("machine machine"),
        ElementsAre("simulated", "simulated", StartsWith(firstUse),
                    StartsWith("log 6000 Corvane.Instrumentation 256 nodes: clients see too few instances of ")));
}

TEST_F(Processes, MayEndWhileCursorsAreInUse) {
    configureSimulated("", "10");
    for (int round = 0; round < 20; ++round) {
        EXPECT_THAT(run("stay"), ElementsAre(StartsWith(firstUse), "at the end /system 1"));
    }
}

TEST_F(Processes, SeeEachOthersRequests) {
    configureSimulated(twoNodes, "3600");
    EXPECT_THAT(run("write b/c 9"), ElementsAre("accepted", StartsWith(firstUse),
                                                "log 10000 Corvane.Instrumentation Power request accepted: reboot of "
                                                "simulated node b/c, over in 3600 s" +
                                                    askedByProbe));
    EXPECT_THAT(run("list write a 12 list"),
                ElementsAre("a 1 2 5 8", "b/c 9 2 5 8", "accepted", "a 12 2 5 8", "b/c 9 2 5 8", StartsWith(firstUse),
                            StartsWith("log 10000 Corvane.Instrumentation Power request accepted: shutdown")));
    configureSimulated(twoNodes, "0");
    EXPECT_THAT(run("list"), ElementsAre("a 12 2 5 8", "b/c 1 2 5 8", StartsWith(firstUse)));
}

TEST_F(Processes, OfferNoNodeWhereTheConfigurationCannotBeUsed) {
    configure("[instrumentation]\nbackend = \"abacus\"\n");
    EXPECT_THAT(run("list list write system 9"),
                ElementsAre("refused",
                            "trace 6000 Corvane.Instrumentation No power-management node is offered: the configuration "
                            "cannot be used",
                            "log 10000 Corvane.Instrumentation Power request refused: write of 9 to property 123: no "
                            "node is offered, the configuration cannot be used" +
                                askedByProbe));
}

TEST_F(Processes, SayThatTheyGoByNoConfigurationFile) {
    if (std::filesystem::exists("/etc/orv/agent.toml")) {
        GTEST_SKIP() << "this host has a configuration file";
    }
    const std::string state = geteuid() == 0 ? "/var/lib" : folder / "state";
    EXPECT_EQ(AgentTest::linesOf("env -u ORV_AGENT_CONFIG XDG_STATE_HOME='" + (folder / "state").string() + "' " +
                                 ORV_INSTRUMENTATION_PROBE + " list")
                  .back(),
              "log 6000 Corvane.Instrumentation No configuration file: power management of a simulated machine (1 "
              "node, state in " +
                  state + "/orv/simulated-machine.json)");
}

} // namespace

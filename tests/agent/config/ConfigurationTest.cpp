#include "config/Configuration.h"
#include "config/ConfigurationWatch.h"

#include "PassingTime.h"
#include "TestSupport.h"

#include <gmock/gmock.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <sstream>
#include <string>

#include <unistd.h>

namespace {

using AgentTest::TemporaryFolder;
using AgentTest::writeFile;
using Norv::Agent::Configuration;
using Norv::Agent::ConfigurationError;
using Norv::Agent::InstrumentationSettings;
using Norv::Agent::loadConfiguration;
using Norv::Agent::LogSettings;
using std::chrono::milliseconds;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::StartsWith;

class ConfigurationTest : public testing::Test {
protected:
    ConfigurationTest() { setenv("ORV_AGENT_CONFIG", file.c_str(), 1); }
    ~ConfigurationTest() override { unsetenv("ORV_AGENT_CONFIG"); }

    Configuration load(const std::string& text) const {
        writeFile(file, text);
        return loadConfiguration();
    }

    static std::string errorOfLoading() {
        try {
            loadConfiguration();
        } catch (const ConfigurationError& error) {
            return error.what();
        }
        return "no error";
    }

    std::string errorOf(const std::string& text) const {
        writeFile(file, text);
        return errorOfLoading();
    }

    const TemporaryFolder folder;
    const std::filesystem::path file = folder / "agent.toml";
};

TEST_F(ConfigurationTest, AnEmptyFileLeavesEverythingAtItsDefault) {
    const Configuration configuration = load("");

    EXPECT_EQ(configuration.source, file);
    EXPECT_FALSE(configuration.systemName.has_value());

    const LogSettings& log = configuration.log;
    EXPECT_EQ(log.destination, LogSettings::Destination::standardError);
    EXPECT_EQ(log.rotateSize, 10U * 1024 * 1024);
    EXPECT_EQ(log.rotateCount, 5U);
    EXPECT_EQ(log.logLevel, 6000);
    EXPECT_EQ(log.traceLevel, 10000);
    EXPECT_THAT(log.categories, IsEmpty());

    const InstrumentationSettings& instrumentation = configuration.instrumentation;
    EXPECT_EQ(instrumentation.backend, InstrumentationSettings::Backend::simulated);
    EXPECT_EQ(instrumentation.logind.delay, milliseconds{5'000});
    EXPECT_EQ(instrumentation.logind.timeout, milliseconds{5'000});
    EXPECT_EQ(instrumentation.simulated.rebootTime, milliseconds{10'000});
    EXPECT_EQ(instrumentation.simulated.shutdownTime, milliseconds{5'000});
    ASSERT_EQ(instrumentation.simulated.nodes.size(), 1U);
    EXPECT_EQ(instrumentation.simulated.nodes[0].path, "system");
    EXPECT_EQ(instrumentation.simulated.nodes[0].powerState, 1U);
    EXPECT_THAT(instrumentation.simulated.nodes[0].powerStates, ElementsAre(2, 5, 8));
}

TEST_F(ConfigurationTest, EveryKeyOfTheFileIsRead) {
    const Configuration configuration = load(R"(
        [system]
        name = "server.example.org"

        [log]
        destination = "file"
        file = "/var/log/orv.log"
        rotate-size = 1000
        rotate-count = 2
        level = 3000
        trace-level = 4000

        [[log.category]]
        prefix = "Corvane.Power"
        level = 0

        [[log.category]]
        prefix = "Corvane.Log"
        trace-level = 10000

        [instrumentation]
        backend = "simulated"

        [instrumentation.logind]
        delay = 7.5
        timeout = 0.5
        lock-file = "/run/orv.lock"

        [instrumentation.simulated]
        state-file = "/var/lib/state.json"
        reboot-time = 0.25
        shutdown-time = 3

        [[instrumentation.simulated.node]]
        path = "chassis/blade1"
        power-state = 10
        power-states = [5]

        [[instrumentation.simulated.node]]
        path = "chassis/blade2"
    )");

    EXPECT_EQ(configuration.systemName, "server.example.org");

    const LogSettings& log = configuration.log;
    EXPECT_EQ(log.destination, LogSettings::Destination::file);
    EXPECT_EQ(log.file, "/var/log/orv.log");
    EXPECT_EQ(log.rotateSize, 1000U);
    EXPECT_EQ(log.rotateCount, 2U);
    EXPECT_EQ(log.logLevel, 3000);
    EXPECT_EQ(log.traceLevel, 4000);
    ASSERT_EQ(log.categories.size(), 2U);
    EXPECT_EQ(log.categories[0].prefix, "Corvane.Power");
    EXPECT_EQ(log.categories[0].logLevel, 0);
    EXPECT_EQ(log.categories[0].traceLevel, std::nullopt);
    EXPECT_EQ(log.categories[1].prefix, "Corvane.Log");
    EXPECT_EQ(log.categories[1].logLevel, std::nullopt);
    EXPECT_EQ(log.categories[1].traceLevel, 10000);

    EXPECT_EQ(configuration.instrumentation.logind.delay, milliseconds{7'500});
    EXPECT_EQ(configuration.instrumentation.logind.timeout, milliseconds{500});
    EXPECT_EQ(configuration.instrumentation.logind.lockFile, "/run/orv.lock");

    const auto& simulated = configuration.instrumentation.simulated;
    EXPECT_EQ(simulated.stateFile, "/var/lib/state.json");
    EXPECT_EQ(simulated.rebootTime, milliseconds{250});
    EXPECT_EQ(simulated.shutdownTime, milliseconds{3000});
    ASSERT_EQ(simulated.nodes.size(), 2U);
    EXPECT_EQ(simulated.nodes[0].path, "chassis/blade1");
    EXPECT_EQ(simulated.nodes[0].powerState, 10U);
    EXPECT_THAT(simulated.nodes[0].powerStates, ElementsAre(5));
    EXPECT_EQ(simulated.nodes[1].path, "chassis/blade2");
    EXPECT_EQ(simulated.nodes[1].powerState, 1U);
    EXPECT_THAT(simulated.nodes[1].powerStates, ElementsAre(2, 5, 8));
}

TEST_F(ConfigurationTest, AnEmptyListOfNodesIsAMachineWithoutNodes) {
    EXPECT_THAT(load("instrumentation.simulated.node = []").instrumentation.simulated.nodes, IsEmpty());
}

TEST_F(ConfigurationTest, PowerStatesHaveNamesAndNumbers) {
    const auto nodes = load(R"(
        [[instrumentation.simulated.node]]
        path = "a"
        power-state = "off"
        power-states = ["on", 5, "off-soft"]
        [[instrumentation.simulated.node]]
        path = "b"
        power-state = 10
    )")
                           .instrumentation.simulated.nodes;
    ASSERT_EQ(nodes.size(), 2U);
    EXPECT_EQ(nodes[0].powerState, 10U);
    EXPECT_THAT(nodes[0].powerStates, ElementsAre(2, 5, 8));
    EXPECT_EQ(nodes[1].powerState, 10U);
}

TEST_F(ConfigurationTest, ALargeTreeIsReadInOrder) {
    constexpr int count = 60'000;
    std::ostringstream text;
    for (int number = 0; number < count; ++number) {
        text << "[[instrumentation.simulated.node]]\npath = \"rack/blade" << number << "\"\n";
    }
    const auto nodes = load(text.str()).instrumentation.simulated.nodes;

    ASSERT_EQ(nodes.size(), static_cast<std::size_t>(count));
    EXPECT_EQ(nodes.front().path, "rack/blade0");
    EXPECT_EQ(nodes.back().path, "rack/blade59999");
}

TEST_F(ConfigurationTest, TheBackendLogindCanBeChosenWhereItIsBuiltIn) {
    const std::string text = "[instrumentation]\nbackend = \"logind\"\n";
    if (ORV_LOGIND != 0) {
        EXPECT_EQ(load(text).instrumentation.backend, InstrumentationSettings::Backend::logind);
    } else {
        EXPECT_EQ(errorOf(text), file.string() + ":2: instrumentation.backend: \"logind\": expected \"simulated\": "
                                                 "backend logind is not built in");
    }
}

/** Whether a watch reports a change when it next looks at the file. */
bool tellsOfAChange(Norv::Agent::ConfigurationWatch& watch) {
    AgentTest::passTime(std::chrono::seconds{1});
    bool told = false;
    watch.onChange([&told] { told = true; });
    return told;
}

TEST_F(ConfigurationTest, AChangeIsToldOnce) {
    writeFile(file, "log.level = 1");
    std::filesystem::last_write_time(file, std::filesystem::file_time_type::clock::now() - std::chrono::hours{1});
    Norv::Agent::ConfigurationWatch watch;
    EXPECT_FALSE(tellsOfAChange(watch));
    std::filesystem::last_write_time(file, std::filesystem::file_time_type::clock::now() - std::chrono::minutes{1});
    EXPECT_TRUE(tellsOfAChange(watch));
    EXPECT_FALSE(tellsOfAChange(watch));
    std::filesystem::remove(file);
    EXPECT_TRUE(tellsOfAChange(watch));
}

TEST_F(ConfigurationTest, AChangeThatLooksLikeTheOneJustBeforeIsTold) {
    // Even if the watch looks late, this time is just before.
    const auto time = std::filesystem::file_time_type::clock::now() + std::chrono::hours{1};
    writeFile(file, "log.level = 1");
    std::filesystem::last_write_time(file, time);
    Norv::Agent::ConfigurationWatch watch;
    writeFile(file, "log.level = 2");
    std::filesystem::last_write_time(file, time);
    EXPECT_TRUE(tellsOfAChange(watch));
}

struct WrongFile {
    const char* name;
    const char* text;
    /** The message behind the file's name. */
    const char* error;
};

void PrintTo(const WrongFile& wrong, std::ostream* stream) {
    *stream << wrong.name;
}

class WrongConfigurationTest : public ConfigurationTest, public testing::WithParamInterface<WrongFile> {};

TEST_P(WrongConfigurationTest, IsReportedWithFileLineKeyValueAndWhatWasExpected) {
    EXPECT_EQ(errorOf(GetParam().text), file.string() + GetParam().error);
}

#define SUPPORTED_STATES                                                                                               \
    "an integer from 0 to 65535 or one of \"on\", \"sleep-light\", \"sleep-deep\", \"power-cycle-off-soft\", "         \
    "\"off-hard\", \"hibernate\", \"off-soft\", \"power-cycle-off-hard\", \"master-bus-reset\", "                      \
    "\"diagnostic-interrupt\", \"off-soft-graceful\", \"off-hard-graceful\", \"master-bus-reset-graceful\", "          \
    "\"power-cycle-off-soft-graceful\", \"power-cycle-off-hard-graceful\""

constexpr WrongFile wrongFiles[] = {
    {"UnknownTable", "\n[locale]\n", ":2: locale: unknown key: expected one of system, log, instrumentation"},
    {"UnknownKey", "[system]\nnmae = \"x\"\n", ":2: system.nmae: unknown key: expected one of name"},
    {"UnknownKeyThatNeedsQuotes", "[system]\n\"a\\nb\" = 1\n",
     ":2: system.\"a\\nb\": unknown key: expected one of name"},
    {"UnknownKeyOfANode", "[[instrumentation.simulated.node]]\npath = \"a\"\nstate = 1\n",
     ":3: instrumentation.simulated.node[0].state: unknown key: expected one of path, power-state, power-states"},
    {"ValueInPlaceOfATable", "log = 3\n", ":1: log: 3: expected a table"},
    {"TableInPlaceOfAValue", "[system.name]\n", ":1: system.name: a table: expected a text that is not empty"},
    {"ValueInPlaceOfAListOfTables", "[log]\ncategory = 1\n", ":2: log.category: 1: expected a list of tables"},
    {"ListOfSomethingElseThanTables", "[log]\ncategory = [1]\n", ":2: log.category[0]: 1: expected a table"},
    {"EmptyText", "[system]\nname = \"\"\n", ":2: system.name: \"\": expected a text that is not empty"},
    {"NumberInPlaceOfAText", "[system]\nname = 5\n", ":2: system.name: 5: expected a text that is not empty"},
    {"UnknownDestination", "[log]\ndestination = \"printer\"\n",
     ":2: log.destination: \"printer\": expected \"stderr\" or \"file\" or \"syslog\""},
    {"MissingLogFile", "\n[log]\ndestination = \"file\"\n",
     ":2: log.file: missing: expected an absolute path where the destination is a file"},
    {"RelativeLogFile", "[log]\nfile = \"agent.log\"\n", ":2: log.file: \"agent.log\": expected an absolute path"},
    {"LevelAboveTheRange", "[log]\nlevel = 60000\n", ":2: log.level: 60000: expected an integer from 0 to 10000"},
    {"LevelBelowTheRange", "[log]\ntrace-level = -1\n", ":2: log.trace-level: -1: expected an integer from 0 to 10000"},
    {"TextInPlaceOfANumber", "[log]\nlevel = \"high\"\n",
     ":2: log.level: \"high\": expected an integer from 0 to 10000"},
    {"FractionInPlaceOfAnInteger", "[log]\nlevel = 1.5\n", ":2: log.level: 1.5: expected an integer from 0 to 10000"},
    {"TruthInPlaceOfANumber", "[log]\nlevel = true\n", ":2: log.level: true: expected an integer from 0 to 10000"},
    {"NegativeSize", "[log]\nrotate-size = -5\n",
     ":2: log.rotate-size: -5: expected an integer from 0 to 9223372036854775807"},
    {"TooManyFiles", "[log]\nrotate-count = 1001\n", ":2: log.rotate-count: 1001: expected an integer from 0 to 1000"},
    {"CategoryWithoutPrefix", "[[log.category]]\nlevel = 1\n",
     ":1: log.category[0].prefix: missing: expected a text that is not empty"},
    {"PrefixTwice", "[[log.category]]\nprefix = \"A\"\n[[log.category]]\nprefix = \"A\"\n",
     ":4: log.category[1].prefix: \"A\": expected a prefix that no other category has"},
    {"UnknownBackend", "[instrumentation]\nbackend = \"ipmi\"\n",
     ":2: instrumentation.backend: \"ipmi\": expected \"simulated\" or \"logind\""},
    {"NoTimeToWait", "[instrumentation.logind]\ntimeout = 0\n",
     ":2: instrumentation.logind.timeout: 0: expected a number of seconds from 0.1 to 60"},
    {"TooLongADelay", "[instrumentation.logind]\ndelay = 86401\n",
     ":2: instrumentation.logind.delay: 86401: expected a number of seconds from 0 to 86400"},
    {"NegativeTime", "[instrumentation.simulated]\nreboot-time = -0.5\n",
     ":2: instrumentation.simulated.reboot-time: -0.5: expected a number of seconds from 0 to 86400"},
    {"TimeThatIsNoNumber", "[instrumentation.simulated]\nshutdown-time = nan\n",
     ":2: instrumentation.simulated.shutdown-time: nan: expected a number of seconds from 0 to 86400"},
    {"RelativeStateFile", "[instrumentation.simulated]\nstate-file = \"state\"\n",
     ":2: instrumentation.simulated.state-file: \"state\": expected an absolute path"},
    {"NodeWithoutPath", "[[instrumentation.simulated.node]]\npower-state = 1\n",
     ":1: instrumentation.simulated.node[0].path: missing: expected names separated by single slashes"},
    {"EmptyNodePath", "[[instrumentation.simulated.node]]\npath = \"\"\n",
     ":2: instrumentation.simulated.node[0].path: \"\": expected names separated by single slashes"},
    {"NodePathWithAnEmptyName", "[[instrumentation.simulated.node]]\npath = \"a//b\"\n",
     ":2: instrumentation.simulated.node[0].path: \"a//b\": expected names separated by single slashes"},
    {"NodePathThatBeginsWithASlash", "[[instrumentation.simulated.node]]\npath = \"/a\"\n",
     ":2: instrumentation.simulated.node[0].path: \"/a\": expected names separated by single slashes"},
    {"NodePathOfTwoLines", "[[instrumentation.simulated.node]]\npath = \"\"\"a\nb\"\"\"\n",
     ":2: instrumentation.simulated.node[0].path: \"a\\nb\": expected names separated by single slashes"},
    {"NodePathTwice",
     "[[instrumentation.simulated.node]]\npath = \"a/b\"\n[[instrumentation.simulated.node]]\npath = \"a/b\"\n",
     ":4: instrumentation.simulated.node[1].path: \"a/b\": expected a path that no other node has"},
    {"PowerStateAboveTheRange", "[[instrumentation.simulated.node]]\npath = \"a\"\npower-state = 65536\n",
     ":3: instrumentation.simulated.node[0].power-state: 65536: expected an integer from 0 to 65535 or one of \"running\", "
     "\"hibernating\", \"rebooting\", \"off\", \"shutting-down\""},
    {"PowerStateOfAnUnknownName", "[[instrumentation.simulated.node]]\npath = \"a\"\npower-state = \"on\"\n",
     ":3: instrumentation.simulated.node[0].power-state: \"on\": expected an integer from 0 to 65535 or one of "
     "\"running\", \"hibernating\", \"rebooting\", \"off\", \"shutting-down\""},
    {"PowerStatesThatAreNoList", "[[instrumentation.simulated.node]]\npath = \"a\"\npower-states = 5\n",
     ":3: instrumentation.simulated.node[0].power-states: 5: expected a list, each element " SUPPORTED_STATES},
    {"PowerStateOfAnotherType", "[[instrumentation.simulated.node]]\npath = \"a\"\npower-states = [2, \"off\"]\n",
     ":3: instrumentation.simulated.node[0].power-states[1]: \"off\": expected " SUPPORTED_STATES},
};

INSTANTIATE_TEST_SUITE_P(Configuration, WrongConfigurationTest, testing::ValuesIn(wrongFiles),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_F(ConfigurationTest, ASyntaxErrorIsReportedWithItsLine) {
    EXPECT_THAT(errorOf("[system]\nname = \n"), StartsWith(file.string() + ":2: not TOML: "));
}

TEST_F(ConfigurationTest, AKeyThatStandsTwiceIsASyntaxError) {
    EXPECT_THAT(errorOf("[log]\nlevel = 1\nlevel = 2\n"), StartsWith(file.string() + ":3: not TOML: "));
}

TEST_F(ConfigurationTest, ANamedFileThatIsMissingIsAnError) {
    EXPECT_EQ(errorOfLoading(), file.string() + ": No such file or directory: expected a file that can be read");
}

TEST_F(ConfigurationTest, AFolderIsNoFile) {
    std::filesystem::create_directory(file);
    EXPECT_EQ(errorOfLoading(), file.string() + ": not a regular file: expected a file that can be read");
}

TEST_F(ConfigurationTest, AFileThatMayNotBeReadIsAnError) {
    if (geteuid() == 0) {
        GTEST_SKIP() << "root may read every file";
    }
    writeFile(file, "");
    std::filesystem::permissions(file, std::filesystem::perms::none);
    EXPECT_EQ(errorOfLoading(), file.string() + ": Permission denied: expected a file that can be read");
}

TEST_F(ConfigurationTest, AnEmptyVariableCountsAsNotSet) {
    if (std::filesystem::exists("/etc/orv/agent.toml")) {
        GTEST_SKIP() << "this machine has a configuration of its own";
    }
    setenv("ORV_AGENT_CONFIG", "", 1);
    EXPECT_EQ(loadConfiguration().source, "");
    unsetenv("ORV_AGENT_CONFIG");
    EXPECT_EQ(loadConfiguration().source, "");
}

TEST_F(ConfigurationTest, OnlyTheMachineInUseNeedsAPlaceForItsFile) {
    if (ORV_LOGIND == 0) {
        GTEST_SKIP() << "there is one kind of machine only";
    }
    const auto real = load("[instrumentation]\nbackend = \"logind\"\n").instrumentation;
    EXPECT_EQ(real.simulated.stateFile, "");
    EXPECT_EQ(real.logind.lockFile.filename(), "power-request.lock");
    const auto simulated = load("").instrumentation;
    EXPECT_EQ(simulated.logind.lockFile, "");
    EXPECT_EQ(simulated.simulated.stateFile.filename(), "simulated-machine.json");
}

TEST_F(ConfigurationTest, StateIsKeptWhereTheUserKeepsState) {
    if (geteuid() == 0) {
        EXPECT_EQ(load("").instrumentation.simulated.stateFile, "/var/lib/orv/simulated-machine.json");
        return;
    }
    setenv("XDG_STATE_HOME", "/state", 1);
    EXPECT_EQ(load("").instrumentation.simulated.stateFile, "/state/orv/simulated-machine.json");
    setenv("XDG_STATE_HOME", "relative", 1);
    setenv("HOME", "/home/user", 1);
    EXPECT_EQ(load("").instrumentation.simulated.stateFile, "/home/user/.local/state/orv/simulated-machine.json");
    unsetenv("XDG_STATE_HOME");
    unsetenv("HOME");
    EXPECT_THAT(errorOf(""), StartsWith("instrumentation.simulated.state-file: missing: expected an absolute path"));
}

} // namespace

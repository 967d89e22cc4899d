#include "OrvLog/OrvLogger.h"

#include "Allocations.h"
#include "LogProcess.h"
#include "PassingTime.h"

#include <gmock/gmock.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

namespace {

using LogTest::LogProcess;
using LogTest::textsOf;
using LogTest::writeLog;
using LogTest::writeTrace;
using OrvLog::OrvLogger;
using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::SizeIs;

constexpr const char* everything = "[log]\nlevel = 0\ntrace-level = 0\n";

TEST(LoggerTest, ARecordIsOneLineWithTimeKindLevelCategoryFunctionPlaceAndText) {
    const LogProcess process;
    process.configure(everything);
    process.run([] {
        OrvLogger::logLevelMessage("PowerOn", "src/Power.cpp", 88, "Corvane.Power", 6000, nullptr, 0, 0, "some text");
        OrvLogger::traceLevelMessage("PowerOn", "src/Power.cpp", 88, "Corvane.Power", 3000, nullptr, 0, 0, "more");
    });
    const std::string time = "[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}\\.[0-9]{3}Z ";
    EXPECT_THAT(process.standardError(),
                ElementsAre(MatchesRegex(time + "log 6000 Corvane\\.Power PowerOn src/Power\\.cpp:88 some text"),
                            MatchesRegex(time + "trace 3000 Corvane\\.Power PowerOn src/Power\\.cpp:88 more")));
}

TEST(LoggerTest, ControlCharactersAreEscaped) {
    const LogProcess process;
    process.run([] { writeLog(6000, "a\nb\tc\rd\x1b[1m\x7f ä"); });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre("a\\nb\\tc\\x0dd\\x1b[1m\\x7f ä"));
}

TEST(LoggerTest, NullTextsAreEmpty) {
    const LogProcess process;
    process.run([] { OrvLogger::logLevelMessage(nullptr, nullptr, 3, "C", 6000, nullptr, 0, 0, "text"); });
    EXPECT_THAT(process.standardError(), ElementsAre(EndsWith(" log 6000 C  :3 text")));
}

TEST(LoggerTest, ALineIsCutOffWhereAPipeWouldSplitIt) {
    const LogProcess process;
    process.run([] {
        writeLog(6000, std::string(5000, 'x'));
        writeLog(6000, "next");
    });
    EXPECT_THAT(process.standardError(), ElementsAre(AllOf(SizeIs(4095), EndsWith("xxx...")), EndsWith(" next")));
}

TEST(LoggerTest, NoCharacterIsCutInTwo) {
    const LogProcess process;
    process.run([] {
        for (int shift = 0; shift < 3; ++shift) {
            std::string text(shift, 'x');
            while (text.size() < 5000) {
                text += "電";
            }
            writeLog(6000, text);
        }
    });
    EXPECT_THAT(process.standardError(), testing::Each(EndsWith("電...")));
    // A character that ends where the line is cut is kept: so one of the lines has the full length.
    EXPECT_THAT(process.standardError(), testing::Contains(SizeIs(4095)));
    EXPECT_THAT(process.standardError(), SizeIs(3));
}

struct ThresholdCase {
    const char* name;
    const char* configuration;
    const char* category;
    int level;
    bool logIsWritten;
    bool traceIsWritten;
};

void PrintTo(const ThresholdCase& threshold, std::ostream* stream) {
    *stream << threshold.name;
}

class ThresholdTest : public testing::TestWithParam<ThresholdCase> {};

TEST_P(ThresholdTest, DecidesWhatIsWritten) {
    const ThresholdCase& given = GetParam();
    const LogProcess process;
    process.configure(given.configuration);
    process.run([&given] {
        writeLog(given.level, "log", given.category);
        writeTrace(given.level, "trace", given.category);
    });
    std::vector<std::string> expected;
    if (given.logIsWritten) {
        expected.emplace_back("log");
    }
    if (given.traceIsWritten) {
        expected.emplace_back("trace");
    }
    EXPECT_EQ(textsOf(process.standardError()), expected);
}

constexpr const char* categories = R"(
    [log]
    level = 5000
    trace-level = 8000
    [[log.category]]
    prefix = "A.B"
    level = 3000
    [[log.category]]
    prefix = "A"
    level = 7000
    trace-level = 2000
    [[log.category]]
    prefix = "A.B.C"
    trace-level = 4000
)";

constexpr ThresholdCase thresholdCases[] = {
    {"DefaultAtTheThreshold", "", "X", 6000, true, false},
    {"DefaultBelowTheThreshold", "", "X", 5999, false, false},
    {"DefaultAtTheHighestLevel", "", "X", 10000, true, true},
    {"HighestThresholds", "[log]\nlevel = 10000\ntrace-level = 10000\n", "X", 10000, true, true},
    {"LowestThresholds", "[log]\nlevel = 0\ntrace-level = 0\n", "X", 0, true, true},
    {"GeneralThresholdBeyondCategories", categories, "B", 5000, true, false},
    {"GeneralThresholdNotReached", categories, "B", 4999, false, false},
    {"GeneralTraceThreshold", categories, "", 8000, true, true},
    {"PrefixIsTheWholeCategory", categories, "A", 6999, false, true},
    {"PrefixOfTheCategory", categories, "A.X", 2000, false, true},
    {"PrefixNotReached", categories, "A.X", 1999, false, false},
    {"LongerPrefixDecides", categories, "A.B", 3000, true, false},
    {"LongerPrefixTakesWhatItLeavesOutFromTheGeneralThreshold", categories, "A.B", 8000, true, true},
    {"LongestPrefixDecides", categories, "A.B.C.D", 4999, false, true},
    {"PrefixMayEndWithinAName", categories, "AZ", 2000, false, true},
    {"PrefixHasLetterCase", categories, "a", 5000, true, false},
};

INSTANTIATE_TEST_SUITE_P(Logger, ThresholdTest, testing::ValuesIn(thresholdCases),
                         [](const auto& test) { return std::string(test.param.name); });

TEST(LoggerTest, AWrongConfigurationIsReportedOnceAndTheDefaultsHold) {
    const LogProcess process;
    process.configure("[log]\nlevel = 60000\ntrace-level = 0\n");
    process.run([] {
        writeLog(5999, "below", "Corvane.Other");
        writeLog(6000, "at the threshold");
        writeTrace(9999, "trace");
    });
    const auto lines = process.standardError();
    EXPECT_THAT(lines, ElementsAre(HasSubstr(" log 10000 Corvane.Log "), HasSubstr(" log 6000 Corvane.Test ")));
    EXPECT_EQ(textsOf(lines)[0],
              (process.folder / "agent.toml").string() + ":2: log.level: 60000: expected an integer from 0 to 10000");
}

TEST(LoggerTest, NothingIsSaidWhereThereIsNoConfiguration) {
    if (std::filesystem::exists("/etc/orv/agent.toml")) {
        GTEST_SKIP() << "this machine has a configuration of its own";
    }
    const LogProcess process;
    process.run([] {
        unsetenv("ORV_AGENT_CONFIG");
        writeLog(6000, "text");
    });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre("text"));
}

/** Writes records below the default thresholds until standard error has a line. */
void writeUntilSomethingIsSaid(const LogProcess& process) {
    LogTest::waitUntil([&process] {
        AgentTest::passTime(std::chrono::seconds(1));
        writeLog(3000, "below");
        return !process.standardError().empty();
    });
}

TEST(LoggerTest, ThresholdsFollowTheConfigurationWhileTheProcessRuns) {
    const LogProcess process;
    process.run([&process] {
        writeLog(3000, "below");
        process.configure("[log]\ntrace-level = 0\n[[log.category]]\nprefix = \"Corvane.Power\"\nlevel = 3000\n");
        writeUntilSomethingIsSaid(process);
        writeLog(3000, "power", "Corvane.Power");
        writeTrace(0, "trace");
        writeLog(3000, "below");
    });
    EXPECT_THAT(textsOf(process.standardError()),
                ElementsAre((process.folder / "agent.toml").string() + " has changed: its thresholds apply from now on",
                            "power", "trace"));
}

TEST(LoggerTest, AFileThatIsMadeOrRemovedIsAChange) {
    const LogProcess process;
    process.run([&process] {
        writeLog(1, "first use");
        std::filesystem::remove(process.folder / "agent.toml");
        writeUntilSomethingIsSaid(process);
        process.configure("[log]\nlevel = 3000\n");
        LogTest::waitUntil([&process] {
            AgentTest::passTime(std::chrono::seconds(1));
            writeLog(3000, "heard");
            return textsOf(process.standardError()).back() == "heard";
        });
    });
    const std::string file = process.folder / "agent.toml";
    EXPECT_THAT(textsOf(process.standardError()),
                ElementsAre(file + ": No such file or directory: expected a file that can be read: the former "
                                   "thresholds still apply",
                            file + " has changed: its thresholds apply from now on", "heard"));
}

TEST(LoggerTest, AWrongChangeIsReportedOnceAndTheFormerThresholdsStillApply) {
    const LogProcess process;
    process.configure("[log]\nlevel = 5000\n");
    process.run([&process] {
        writeLog(1, "first use");
        process.configure("[log]\nlevel = 1\ntrace-level = -1\n");
        writeUntilSomethingIsSaid(process);
        writeLog(4999, "below", "Corvane.Other");
        writeLog(5000, "at the threshold");
    });
    EXPECT_THAT(textsOf(process.standardError()),
                ElementsAre((process.folder / "agent.toml").string() +
                                ":3: log.trace-level: -1: expected an integer from 0 to 10000: the former thresholds "
                                "still apply",
                            "at the threshold"));
}

TEST(LoggerTest, AChangeOfSomethingElseIsNotTold) {
    const LogProcess process;
    process.run([&process] {
        writeLog(1, "first use");
        process.configure("[system]\nname = \"other\"\n");
        // The log looks twice at a change that is this recent.
        for (int look = 0; look < 3; ++look) {
            AgentTest::passTime(std::chrono::seconds(1));
            writeLog(3000, "below");
        }
        writeLog(6000, "failure");
    });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre("failure"));
}

TEST(LoggerTest, ThresholdsMayChangeWhileThreadsWrite) {
    const LogProcess process;
    process.configureFile();
    process.run([&process] {
        writeLog(1, "first use");
        std::atomic<bool> over = false;
        std::vector<std::thread> threads;
        for (int number = 0; number < 4; ++number) {
            threads.emplace_back([&over] {
                while (!over) {
                    writeLog(5000, "text");
                }
            });
        }
        for (const char* level : {"5500", "5600", "5700"}) {
            const auto changes = [&process] {
                return exists(process.file()) ? LogTest::linesOfFile(process.file()).size() : 0;
            };
            const auto before = changes();
            process.configureFile("level = " + std::string(level) + "\n");
            LogTest::waitUntil([&] { return changes() > before; });
        }
        over = true;
        for (std::thread& thread : threads) {
            thread.join();
        }
    });
    EXPECT_THAT(textsOf(LogTest::linesOfFile(process.file())), SizeIs(3));
}

TEST(LoggerTest, AFailureIsWrittenWithTheOperationBeforeIt) {
    const LogProcess process;
    process.run([] {
        writeLog(4000, "operation");
        writeLog(3999, "step");
        writeTrace(5999, "trace");
        writeLog(6000, "failure");
        writeLog(6000, "second failure");
    });
    const auto lines = process.standardError();
    EXPECT_THAT(textsOf(lines), ElementsAre("operation", "failure", "second failure"));
    EXPECT_THAT(lines[0], HasSubstr(" log 4000 Corvane.Test function file.cpp:7 operation"));
}

TEST(LoggerTest, AFailureIsNotWrittenWithWhatIsNotItsOperation) {
    const LogProcess process;
    process.configure("[log]\ntrace-level = 6000\n[[log.category]]\nprefix = \"Corvane.Silent\"\nlevel = 7000\n");
    process.run([] {
        writeLog(4000, "of another category");
        writeLog(6000, "failure", "Corvane.Other");
        writeLog(4000, "of another thread");
        std::thread([] { writeLog(6000, "failure of a thread"); }).join();
        writeTrace(6000, "trace");
        writeLog(10000, "power request");
        writeLog(4000, "of a failure that is not written", "Corvane.Silent");
        writeLog(6000, "not written", "Corvane.Silent");
        writeLog(7000, "written", "Corvane.Silent");
    });
    EXPECT_THAT(textsOf(process.standardError()),
                ElementsAre("failure", "failure of a thread", "trace", "power request", "not written", "written"));
}

TEST(LoggerTest, AnOperationIsCutOffWhereItIsLong) {
    const LogProcess process;
    process.run([] {
        writeLog(4000, std::string(300, 'x'));
        writeLog(6000, "failure");
    });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre(std::string(256, 'x'), "failure"));
}

TEST(LoggerTest, TheCallersErrorNumberStays) {
    const LogProcess process;
    process.configure("[log]\ndestination = \"file\"\nfile = \"" + (process.folder / "missing/file").string() + "\"\n");
    process.run([] {
        for (const int level : {1, 6000}) {
            errno = EXDEV;
            writeLog(level, "text");
            EXPECT_EQ(errno, EXDEV);
            writeTrace(level, "text");
            EXPECT_EQ(errno, EXDEV);
        }
    });
}

TEST(LoggerTest, NoRecordAllocatesMemory) {
    const LogProcess process;
    process.configure("[[log.category]]\nprefix = \"Corvane.Written\"\nlevel = 0\n");
    process.run([] {
        const std::string written = "Corvane.WrittenCategory";
        const std::string filtered = "Corvane.FilteredCategory";
        const std::string text(200, 'x');
        writeLog(6000, text, written);
        const int before = LogTest::allocations();
        for (int round = 0; round < 100; ++round) {
            writeLog(5000, text, filtered);
            writeTrace(5000, text, filtered);
            writeLog(5000, text, written);
        }
        EXPECT_EQ(LogTest::allocations(), before);
    });
    EXPECT_THAT(process.standardError(), SizeIs(101));
}

TEST(LoggerTest, TheLibraryExportsItsInterfaceTheOptionalFunctionAndNothingElse) {
    EXPECT_THAT(AgentTest::linesOf("nm -DC --defined-only --format=just-symbols '" ORV_LOG_LIBRARY "' | sort -u"),
                testing::UnorderedElementsAre(
                    "orvLogObserve1", "OrvLog::OrvMessageBuffer::OrvMessageBuffer()",
                    "OrvLog::OrvMessageBuffer::~OrvMessageBuffer()",
                    "OrvLog::OrvMessageBuffer::operator<<(char const*)",
                    "OrvLog::OrvMessageBuffer::operator std::ostream&()",
                    "OrvLog::OrvMessageBuffer::str[abi:cxx11](OrvLog::OrvMessageBuffer&)",
                    "OrvLog::OrvMessageBuffer::str[abi:cxx11](std::ostream&)",
                    testing::StartsWith("OrvLog::OrvLogger::logLevelMessage(char const*, char const*, int, "),
                    testing::StartsWith("OrvLog::OrvLogger::traceLevelMessage(char const*, char const*, int, ")));
}

} // namespace

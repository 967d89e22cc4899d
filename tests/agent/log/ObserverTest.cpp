#include "OrvLog/Observer.h"

#include "LogProcess.h"

#include "OrvLog/OrvLogger.h"

#include <gmock/gmock.h>

#include <dlfcn.h>

#include <set>
#include <string>
#include <thread>
#include <vector>

namespace {

using LogTest::LogProcess;
using LogTest::textsOf;
using LogTest::writeLog;
using LogTest::writeTrace;
using OrvLog::ObservedRecord1;
using OrvLog::Observer1;
using testing::AllOf;
using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;

struct Seen {
    int kind;
    int level;
    std::string category;
    std::string text;
};

/** The records that the observer received in this thread. */
std::vector<Seen>& seenHere() {
    thread_local std::vector<Seen> records;
    return records;
}

void keep(void* /*context*/, const ObservedRecord1* record) {
    seenHere().push_back(
        {record->kind, record->level, {record->category, record->categorySize}, {record->text, record->textSize}});
}

constexpr Observer1 keeping{.lowestLevel = 5000, .record = keep, .context = nullptr};

auto isRecord(int level, const std::string& category, const std::string& text) {
    return AllOf(Field(&Seen::level, level), Field(&Seen::category, category), Field(&Seen::text, text));
}

TEST(ObserverTest, IsHandedRecordsFromItsLevelUpWhateverTheThresholds) {
    const LogProcess process;
    process.run([] {
        orvLogObserve1(&keeping);
        writeLog(4999, "operation");
        writeLog(5000, "information", "Corvane.A");
        writeLog(6000, "failure\nof two lines", "Corvane.B");
        writeTrace(6000, "trace");
        EXPECT_THAT(seenHere(), ElementsAre(isRecord(5000, "Corvane.A", "information"),
                                            isRecord(6000, "Corvane.B", "failure\nof two lines")));
    });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre("failure\\nof two lines"));
}

TEST(ObserverTest, IsToldWhatKindOfRecordItIs) {
    const LogProcess process;
    process.run([] {
        orvLogObserve1(&keeping);
        OrvLog::OrvLogger::logLevelMessage("f", "f.cpp", 1, "Corvane.A", 6000, nullptr,
                                           OrvLog::POWER_REQUEST_REFUSED_RECORD, 0, "no");
        writeLog(6000, "some other");
        ASSERT_EQ(seenHere().size(), 2U);
        EXPECT_EQ(seenHere()[0].kind, OrvLog::POWER_REQUEST_REFUSED_RECORD);
        EXPECT_EQ(seenHere()[1].kind, OrvLog::ORDINARY_RECORD);
    });
}

TEST(ObserverTest, MissesNoRecordAndMixesNoThreads) {
    const LogProcess process;
    process.configure("[log]\nlevel = 10000\n");
    process.run([] {
        orvLogObserve1(&keeping);
        std::vector<std::thread> threads;
        constexpr int count = 200;
        static constexpr std::size_t records = 1000;
        threads.reserve(count);
        for (int number = 0; number < count; ++number) {
            threads.emplace_back([number] {
                const std::string own = "of thread " + std::to_string(number);
                for (std::size_t record = 0; record < records; ++record) {
                    writeLog(5000, own);
                }
                EXPECT_EQ(seenHere().size(), records);
                std::set<std::string> texts;
                for (const Seen& seen : seenHere()) {
                    texts.insert(seen.text);
                }
                EXPECT_THAT(texts, ElementsAre(own));
            });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
    });
}

TEST(ObserverTest, GivesItsPlaceToAnotherOne) {
    const LogProcess process;
    process.run([] {
        orvLogObserve1(&keeping);
        const Observer1 counting{.lowestLevel = 0,
                                 .record = [](void* context, const ObservedRecord1*) { ++*static_cast<int*>(context); },
                                 .context = new int(0)};
        orvLogObserve1(&counting);
        writeLog(3000, "text");
        writeLog(6000, "text");
        EXPECT_EQ(*static_cast<int*>(counting.context), 2);
        orvLogObserve1(nullptr);
        writeLog(6000, "text");
        EXPECT_EQ(*static_cast<int*>(counting.context), 2);
        EXPECT_THAT(seenHere(), IsEmpty());
    });
}

TEST(ObserverTest, HearsThatTheConfigurationIsWrong) {
    const LogProcess process;
    process.configure("[log]\nlevel = \"high\"\n");
    process.run([] {
        orvLogObserve1(&keeping);
        writeLog(3000, "the first record");
        ASSERT_EQ(seenHere().size(), 1U);
        EXPECT_THAT(seenHere()[0].text, testing::HasSubstr("agent.toml:2"));
    });
}

TEST(ObserverTest, IsSetByTheFunctionOfTheNameThatTheHeaderGives) {
    EXPECT_EQ(dlsym(RTLD_DEFAULT, OrvLog::observe1Name), reinterpret_cast<void*>(&orvLogObserve1));
}

} // namespace

#include "agentlog/LogTap.h"

#include "TestProviders.h"

#include <dlfcn.h>
#include <thread>

namespace ObjectManager {
namespace {

using testing::Each;
using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;
using testing::SizeIs;

class LogTapTest : public testing::Test {
protected:
    ~LogTapTest() override { dlclose(library); }

    /** Writes a log record in the calling thread. */
    void log(const std::string& text, int level = 6000, int kind = OrvLog::ORDINARY_RECORD) const {
        using Log = void(int kind, int level, const char* text);
        reinterpret_cast<Log*>(dlsym(library, "TestProvider_log"))(kind, level, text.c_str());
    }

    static auto hasText(const std::string& text) { return Field(&LogRecord::text, text); }

    /** A library that uses an agent whose log can be listened to. */
    void* const library = dlopen((testProviders / "liborvtestprovider.so").c_str(), RTLD_NOW | RTLD_LOCAL);
};

TEST_F(LogTapTest, ListensToTheAgentOfALibraryWhileItLives) {
    {
        LogTap tap;
        EXPECT_FALSE(tap.isAttached());
        tap.attach(library);
        EXPECT_TRUE(tap.isAttached());
        log("text");
        EXPECT_THAT(tap.take(), ElementsAre(hasText("text")));
    }
    log("nobody listens");
    LogTap another;
    another.attach(library);
    EXPECT_THAT(another.take(), IsEmpty());
}

TEST_F(LogTapTest, IsNotAttachedByALibraryWhoseAgentCannotBeListenedTo) {
    void* const other = dlopen((testProviders / "liborvbrokenprovider.so").c_str(), RTLD_NOW | RTLD_LOCAL);
    LogTap tap;
    tap.attach(other);
    EXPECT_FALSE(tap.isAttached());
    EXPECT_FALSE(tap.isSimulated());
    EXPECT_EQ(nullptr, tap.agentFunction<Norv::Machine1>(Norv::machine1Name));
    dlclose(other);
}

TEST_F(LogTapTest, MayOutliveTheLibrary) {
    const auto tap = std::make_unique<LogTap>();
    void* const again = dlopen((testProviders / "liborvtestprovider.so").c_str(), RTLD_NOW | RTLD_LOCAL);
    tap->attach(again);
    dlclose(again);
    log("still there");
    EXPECT_THAT(tap->take(), ElementsAre(hasText("still there")));
}

TEST_F(LogTapTest, KeepsWholeRecords) {
    LogTap tap;
    tap.attach(library);
    log("Power request accepted:\nreboot", 10000, OrvLog::POWER_REQUEST_ACCEPTED_RECORD);
    const std::vector<LogRecord> records = tap.take();
    ASSERT_THAT(records, SizeIs(1));
    EXPECT_EQ(OrvLog::POWER_REQUEST_ACCEPTED_RECORD, records[0].kind);
    EXPECT_EQ(10000, records[0].level);
    EXPECT_EQ("Test.Disk", records[0].category);
    EXPECT_EQ("Power request accepted:\nreboot", records[0].text);
    EXPECT_THAT(tap.take(), IsEmpty());
}

TEST_F(LogTapTest, LeavesOutWhatEveryOperationLogs) {
    LogTap tap;
    tap.attach(library);
    log("operation", 4999);
    log("information", 5000);
    EXPECT_THAT(tap.take(), ElementsAre(hasText("information")));
}

TEST_F(LogTapTest, KeepsTheRecordsOfAnyNumberOfThreadsForThem) {
    LogTap tap;
    tap.attach(library);
    log("mine");
    constexpr int count = 200;
    std::vector<std::thread> threads;
    threads.reserve(count);
    for (int number = 0; number < count; ++number) {
        threads.emplace_back([&, text = std::to_string(number)] {
            constexpr std::size_t records = 100;
            for (std::size_t record = 0; record < records; ++record) {
                log(text);
            }
            const std::vector<LogRecord> own = tap.take();
            EXPECT_THAT(own, SizeIs(records));
            EXPECT_THAT(own, Each(hasText(text)));
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_THAT(tap.take(), ElementsAre(hasText("mine")));
}

TEST_F(LogTapTest, ForgetsTheRecordsOfTheThread) {
    LogTap tap;
    tap.attach(library);
    log("forgotten");
    const std::uint64_t point = tap.newest();
    tap.forget();
    EXPECT_THAT(tap.since(0), IsEmpty());
    log("new");
    EXPECT_EQ(point + 1, tap.newest());
    EXPECT_THAT(tap.since(0), ElementsAre(hasText("new")));
}

TEST_F(LogTapTest, TellsRecordsSinceAPointInTimeAndKeepsThem) {
    LogTap tap;
    tap.attach(library);
    log("before");
    const std::uint64_t point = tap.newest();
    EXPECT_THAT(tap.since(point), IsEmpty());
    log("after");
    EXPECT_THAT(tap.since(point), ElementsAre(hasText("after")));
    EXPECT_THAT(tap.take(), ElementsAre(hasText("before"), hasText("after")));
}

TEST_F(LogTapTest, CountsNeitherTheMachineNorAnAcceptedRequestAsAFailure) {
    LogTap tap;
    tap.attach(library);
    log("of a simulated machine", 6000, OrvLog::MACHINE_RECORD);
    log("accepted", 10000, OrvLog::POWER_REQUEST_ACCEPTED_RECORD);
    log("refused", 10000, OrvLog::POWER_REQUEST_REFUSED_RECORD);
    log("information", 5000);
    log("MESSAGE [File: a.cpp, Line: 1]: failure");
    EXPECT_THAT(tap.failuresSince(0), ElementsAre("refused", "failure"));
}

TEST_F(LogTapTest, KeepsTheNewestRecordsOfAThreadAndAllRecordsAboutAPowerRequest) {
    LogTap tap;
    tap.attach(library);
    log("accepted", 10000, OrvLog::POWER_REQUEST_ACCEPTED_RECORD);
    for (std::size_t i = 0; i < LogTap::recordsPerThread + 5; ++i) {
        log(std::to_string(i));
    }
    const std::vector<LogRecord> records = tap.take();
    ASSERT_THAT(records, SizeIs(LogTap::recordsPerThread));
    EXPECT_EQ("accepted", records[0].text);
    EXPECT_EQ("6", records[1].text);
}

TEST(MessageTest, LosesItsFrame) {
    EXPECT_EQ("no: disk]: here", messageOf("MESSAGE [File: src/a.cpp, Line: 12]: no: disk]: here"));
    EXPECT_EQ("plain text]: kept", messageOf("plain text]: kept"));
    EXPECT_EQ("MESSAGE [File: cut", messageOf("MESSAGE [File: cut"));
}

} // namespace
} // namespace ObjectManager

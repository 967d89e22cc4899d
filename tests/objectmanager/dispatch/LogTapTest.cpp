#include "dispatch/LogTap.h"

#include <gmock/gmock.h>

#include <cstdlib>
#include <sys/socket.h>
#include <thread>
#include <unistd.h>

namespace ObjectManager {
namespace {

using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;
using testing::SizeIs;

class LogTapTest : public testing::Test {
protected:
    /** Where the agent's log library would send to; -1 where nobody listens. */
    static int sender() {
        const char* variable = std::getenv("ORV_AGENT_LOG_SOCKET");
        return variable != nullptr ? std::stoi(variable) : -1;
    }

    static bool sendText(const std::string& datagram) {
        return send(sender(), datagram.data(), datagram.size(), MSG_DONTWAIT | MSG_NOSIGNAL) > 0;
    }

    static bool sendRecord(std::int64_t thread, const std::string& text) {
        return sendText(std::to_string(thread) + "\n6000\nTest\n" + text);
    }

    static auto hasText(const std::string& text) { return Field(&LogRecord::text, text); }
};

TEST_F(LogTapTest, IsAnnouncedToTheAgentWhileItLives) {
    {
        const LogTap tap;
        EXPECT_GE(sender(), 0);
    }
    EXPECT_EQ(-1, sender());
}

TEST_F(LogTapTest, ReadsRecords) {
    LogTap tap;
    sendText(std::to_string(gettid()) + "\n10000\nCorvane.Instrumentation\nPower request accepted:\nreboot");
    const std::vector<LogRecord> records = tap.take();
    ASSERT_THAT(records, SizeIs(1));
    EXPECT_EQ(10000, records[0].level);
    EXPECT_EQ("Corvane.Instrumentation", records[0].category);
    EXPECT_EQ("Power request accepted:\nreboot", records[0].text);
    EXPECT_THAT(tap.take(), IsEmpty());
}

TEST_F(LogTapTest, IgnoresWhatIsNoRecord) {
    LogTap tap;
    for (const char* text : {"x", "1", "1\nx\nTest\ntext", "x\n6000\nTest\ntext", "\n\n\n"}) {
        sendText(text);
    }
    sendRecord(gettid(), "");
    EXPECT_THAT(tap.take(), ElementsAre(hasText("")));
}

TEST_F(LogTapTest, KeepsTheRecordsOfOtherThreadsForThem) {
    LogTap tap;
    sendRecord(gettid(), "mine");
    std::thread([&] {
        sendRecord(gettid(), "yours");
        EXPECT_THAT(tap.take(), ElementsAre(hasText("yours")));
    }).join();
    EXPECT_THAT(tap.take(), ElementsAre(hasText("mine")));
}

TEST_F(LogTapTest, ForgetsWhatWasLookedAt) {
    LogTap tap;
    sendRecord(gettid(), "seen");
    sendRecord(gettid() + 1, "of another thread");
    const std::uint64_t point = tap.newest();
    sendRecord(gettid(), "not seen");
    tap.forget();
    EXPECT_THAT(tap.since(0), ElementsAre(hasText("not seen")));
    EXPECT_EQ(point + 1, tap.newest());
    tap.forget();
    EXPECT_THAT(tap.take(), IsEmpty());
}

TEST_F(LogTapTest, TellsRecordsSinceAPointInTimeAndKeepsThem) {
    LogTap tap;
    sendRecord(gettid(), "before");
    const std::uint64_t point = tap.newest();
    EXPECT_THAT(tap.since(point), IsEmpty());
    sendRecord(gettid(), "after");
    EXPECT_THAT(tap.since(point), ElementsAre(hasText("after")));
    EXPECT_THAT(tap.take(), ElementsAre(hasText("before"), hasText("after")));
}

TEST_F(LogTapTest, KeepsTheNewestRecordsOfAThreadThatDoesNotTakeThem) {
    LogTap tap;
    for (std::size_t i = 0; i < LogTap::recordsPerThread + 5; ++i) {
        ASSERT_TRUE(sendRecord(gettid(), std::to_string(i)));
        tap.newest();
    }
    const std::vector<LogRecord> records = tap.take();
    ASSERT_THAT(records, SizeIs(LogTap::recordsPerThread));
    EXPECT_EQ("5", records.front().text);
}

TEST_F(LogTapTest, ForgetsTheThreadThatWasSilentLongest) {
    LogTap tap;
    sendRecord(gettid(), "forgotten");
    for (std::size_t i = 0; i < LogTap::threads; ++i) {
        ASSERT_TRUE(sendRecord(-1 - static_cast<std::int64_t>(i), "other"));
        tap.newest();
    }
    EXPECT_THAT(tap.take(), IsEmpty());
}

TEST_F(LogTapTest, ABurstOfRecordsIsHeldUntilItIsRead) {
    LogTap tap;
    constexpr int burst = 100;
    for (int i = 0; i < burst; ++i) {
        ASSERT_TRUE(sendRecord(gettid(), "record"));
    }
    EXPECT_THAT(tap.take(), SizeIs(burst));
}

TEST(MessageTest, LosesItsFrame) {
    EXPECT_EQ("no: disk]: here", messageOf("MESSAGE [File: src/a.cpp, Line: 12]: no: disk]: here"));
    EXPECT_EQ("plain text]: kept", messageOf("plain text]: kept"));
    EXPECT_EQ("MESSAGE [File: cut", messageOf("MESSAGE [File: cut"));
}

} // namespace
} // namespace ObjectManager

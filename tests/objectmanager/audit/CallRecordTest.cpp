#include "audit/CallRecord.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace ObjectManager::Audit {
namespace {

using testing::ElementsAre;

CallRecord reboot() {
    return {std::chrono::system_clock::time_point(std::chrono::seconds(1'000'000'000)),
            "192.0.2.7",
            "alice",
            "root/cimv2:Test_Service.Name=\"s\"",
            "Test_Service",
            "Restart",
            "State=5",
            Verdict::accepted,
            ""};
}

TEST(CallRecordTest, SaysWhoCalledWhichMethodWithWhichArgumentsAndOutcome) {
    CallRecord record = reboot();
    EXPECT_EQ(messageOf(record),
              "192.0.2.7 alice: Test_Service.Restart(State=5) of root/cimv2:Test_Service.Name=\"s\": accepted");
    record.verdict = Verdict::refused;
    record.reason = "it is Sunday";
    EXPECT_EQ(messageOf(record), "192.0.2.7 alice: Test_Service.Restart(State=5) of "
                                 "root/cimv2:Test_Service.Name=\"s\": refused: it is Sunday");
}

TEST(CallRecordTest, NamesTheOperationOfARequestThatIsNoMethodCall) {
    CallRecord record = reboot();
    record.user.clear();
    record.target = "root/cimv2";
    record.className.clear();
    record.verdict = Verdict::denied;
    EXPECT_EQ(messageOf(record), "192.0.2.7 somebody without a log-in: Restart(State=5) of root/cimv2: denied");
}

TEST(CallRecordTest, IsALineOfTheLogWithItsTimeIfThereIsNoJournal) {
    std::vector<std::string> lines;
    makeRecorder([&](const std::string& line) { lines.push_back(line); })(reboot());
    EXPECT_THAT(lines, ElementsAre("2001-09-09T01:46:40Z " + messageOf(reboot())));
}

} // namespace
} // namespace ObjectManager::Audit

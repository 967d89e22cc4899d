/* What clients can do to the log. */
#include "server/EventLog.h"

#include <gmock/gmock.h>

#include <vector>

namespace ServerTest {
namespace {

using namespace ObjectManager;
using Server::EventLog;

class EventLogTest : public testing::Test {
protected:
    std::vector<std::string> _lines;
    EventLog _log{[this](const std::string& line) { _lines.push_back(line); }};
    const EventLog::Clock::time_point _start = EventLog::Clock::now();
};

TEST_F(EventLogTest, CutsLongLines) {
    _log.report("192.0.2.1", std::string(5000, 'x'));
    ASSERT_EQ(_lines.size(), 1U);
    EXPECT_EQ(_lines.front(), std::string(EventLog::longestLine, 'x') + "... (5000 bytes)");
}

TEST_F(EventLogTest, CountsWhatItLeavesOutOfOneNetwork) {
    for (unsigned int i = 0; i < EventLog::linesOfNetwork + 7; ++i) {
        _log.report("192.0.2.1", "bad", _start);
    }
    EXPECT_EQ(_lines.size(), EventLog::linesOfNetwork);
    _log.report("192.0.2.2", "of another", _start);
    EXPECT_EQ(_lines.back(), "of another");
    _log.report("of no client");
    EXPECT_EQ(_lines.back(), "of no client");
    _log.settle(_start + EventLog::period);
    EXPECT_EQ(_lines.back(), "192.0.2.1: 7 more lines in a minute are left out");
    _log.report("192.0.2.1", "later", _start + EventLog::period);
    EXPECT_EQ(_lines.back(), "later");
}

TEST_F(EventLogTest, CountsWhatItLeavesOutOfAllNetworks) {
    for (unsigned int i = 0; i < EventLog::linesOfAll + 5; ++i) {
        _log.report(std::to_string(i), "bad", _start);
    }
    EXPECT_EQ(_lines.size(), EventLog::linesOfAll);
    _log.settle(_start + EventLog::period);
    EXPECT_EQ(_lines.back(), "all clients: 5 more lines in a minute are left out");
}

} // namespace
} // namespace ServerTest

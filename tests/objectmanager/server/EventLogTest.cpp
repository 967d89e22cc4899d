/* What clients can do to the log. */
#include "server/EventLog.h"
#include "server/Printable.h"

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

TEST(PrintableTest, LeavesNothingThatBreaksALogOrATerminal) {
    const std::pair<std::string, const char*> cases[] = {
        {"name \xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80", "name \xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80"},
        {"a\nb\x1b[31m\x7f", "a\\x0ab\\x1b[31m\\x7f"},
        {std::string("\0", 1), "\\x00"},
        {"\xc2\x9b"
         "31m",
         "\\xc2\\x9b31m"}, // U+009B begins a sequence as ESC [ does
        {"\x9b"
         "31m",
         "\\x9b31m"}, // in no UTF-8
        {"\xe2\x80\xae"
         "x",
         "\\xe2\\x80\\xaex"},                // U+202E turns the direction
        {"\xc0\x8a", "\\xc0\\x8a"},          // a line feed in too many bytes
        {"\xed\xa0\x80", "\\xed\\xa0\\x80"}, // half of a pair of UTF-16
        {"\xe2\x82", "\\xe2\\x82"},          // cut off
    };
    for (const auto& [text, expected] : cases) {
        EXPECT_EQ(Server::printable(text), expected);
    }
}

} // namespace
} // namespace ServerTest

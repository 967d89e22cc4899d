#include "LogProcess.h"

#include <gmock/gmock.h>

#include <syslog.h>

#include <cstdarg>
#include <cstdio>
#include <string>
#include <vector>

namespace {

struct SyslogEntry {
    int priority;
    std::string text;
    bool operator==(const SyslogEntry&) const = default;
};

std::vector<SyslogEntry>& entries() {
    static std::vector<SyslogEntry> all;
    return all;
}

void note(int priority, const char* format, va_list arguments) {
    char text[8192];
    std::vsnprintf(text, sizeof text, format, arguments);
    entries().push_back({priority, text});
}

} // namespace

// The program's own functions replace the C library's syslog. Which of the two names is called depends on how the
// library was hardened.
extern "C" {
[[gnu::format(printf, 2, 3)]] void syslog(int priority, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    note(priority, format, arguments);
    va_end(arguments);
}

[[gnu::format(printf, 3, 4)]] void __syslog_chk(int priority, int, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    note(priority, format, arguments);
    va_end(arguments);
}

void openlog(const char*, int, int) {
    ADD_FAILURE() << "the host's identity was replaced";
}
void closelog() {
    ADD_FAILURE() << "the host's connection was closed";
}
}

namespace {

using LogTest::LogProcess;
using LogTest::writeLog;
using LogTest::writeTrace;
using testing::ElementsAre;

TEST(SyslogTest, ARecordHasThePriorityOfItsLevelAndNoTimeOfItsOwn) {
    const LogProcess process;
    process.configure("[log]\ndestination = \"syslog\"\nlevel = 0\ntrace-level = 0\n");
    process.run([] {
        writeLog(10000, "100 %s");
        writeLog(6000, "failure");
        writeLog(4000, "operation");
        writeTrace(3000, "progress");
        EXPECT_THAT(entries(),
                    ElementsAre(SyslogEntry{LOG_NOTICE, "log 10000 Corvane.Test function file.cpp:7 100 %s"},
                                SyslogEntry{LOG_ERR, "log 6000 Corvane.Test function file.cpp:7 failure"},
                                SyslogEntry{LOG_INFO, "log 4000 Corvane.Test function file.cpp:7 operation"},
                                SyslogEntry{LOG_DEBUG, "trace 3000 Corvane.Test function file.cpp:7 progress"}));
    });
}

} // namespace

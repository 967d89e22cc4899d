#include "RecordedLog.h"

#include "OrvLog/OrvLogger.h"

#include <mutex>
#include <utility>

namespace {

std::mutex mutex;
std::vector<std::string> records;

void keep(const std::string& kind, int level, const std::string& category, const std::string& text) {
    const std::lock_guard guard(mutex);
    records.push_back(kind + ' ' + std::to_string(level) + ' ' + category + ' ' + text);
}

} // namespace

namespace AgentTest {

std::vector<std::string> takeLog() {
    const std::lock_guard guard(mutex);
    return std::exchange(records, {});
}

} // namespace AgentTest

namespace OrvLog {

void OrvLogger::logLevelMessage(const char*, const char*, int, const std::string& category, int level, char*, int, int,
                                const std::string& message) {
    keep("log", level, category, message);
}

void OrvLogger::traceLevelMessage(const char*, const char*, int, const std::string& category, int level, char*, int,
                                  int, const std::string& message) {
    keep("trace", level, category, message);
}

} // namespace OrvLog

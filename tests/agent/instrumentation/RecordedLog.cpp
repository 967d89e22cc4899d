#include "RecordedLog.h"

#include "OrvLog/OrvLogger.h"

#include <mutex>
#include <regex>
#include <utility>

namespace {

std::mutex mutex;
std::vector<std::string> records;
std::vector<int> recordKinds;

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

std::vector<int> takeRecordKinds() {
    const std::lock_guard guard(mutex);
    return std::exchange(recordKinds, {});
}

void maskRequester(std::vector<std::string>& lines) {
    static const std::regex numbers("process [0-9]+, uid [0-9]+\\]$");
    for (std::string& line : lines) {
        line = std::regex_replace(line, numbers, "process N, uid N]");
    }
}

} // namespace AgentTest

namespace OrvLog {

void OrvLogger::logLevelMessage(const char*, const char*, int, const std::string& category, int level, char*,
                                int recordKind, int, const std::string& message) {
    keep("log", level, category, message);
    const std::lock_guard guard(mutex);
    recordKinds.push_back(recordKind);
}

void OrvLogger::traceLevelMessage(const char*, const char*, int, const std::string& category, int level, char*, int,
                                  int, const std::string& message) {
    keep("trace", level, category, message);
}

} // namespace OrvLog

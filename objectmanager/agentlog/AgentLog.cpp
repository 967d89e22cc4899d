#include "agentlog/AgentLog.h"

#include <algorithm>

namespace ObjectManager {

std::string powerRequestText(const std::vector<LogRecord>& records, PowerAnswer answer) {
    const int kind =
        answer == PowerAnswer::accepted ? OrvLog::POWER_REQUEST_ACCEPTED_RECORD : OrvLog::POWER_REQUEST_REFUSED_RECORD;
    const auto found = std::ranges::find(records, kind, &LogRecord::kind);
    return found == records.end() ? std::string() : found->text;
}

std::string reasonsText(const std::vector<std::string>& logged, const char* introduction) {
    std::vector<std::string> reasons;
    for (const std::string& each : logged) {
        if (std::find(reasons.begin(), reasons.end(), each) == reasons.end()) {
            reasons.push_back(each);
        }
    }
    std::string text;
    for (const std::string& reason : reasons) {
        text += (text.empty() ? introduction : "; ") + reason;
    }
    return text;
}

} // namespace ObjectManager

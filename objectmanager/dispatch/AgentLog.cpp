#include "dispatch/AgentLog.h"

#include "model/Model.h"

#include <algorithm>

namespace ObjectManager {

namespace {

constexpr std::string_view instrumentationCategory = "Corvane.Instrumentation";
constexpr std::string_view simulationNotice = "power management of a simulated machine";
constexpr std::string_view acceptedText = "Power request accepted: ";
constexpr std::string_view refusedText = "Power request refused: ";

} // namespace

bool isSimulationNotice(std::string_view text) {
    return std::search(text.begin(), text.end(), simulationNotice.begin(), simulationNotice.end(), [](char a, char b) {
               return equalNames({&a, 1}, {&b, 1});
           }) != text.end();
}

bool isAcceptance(std::string_view text) {
    return text.starts_with(acceptedText);
}

bool saysSimulated(const std::vector<LogRecord>& records) {
    return std::any_of(records.begin(), records.end(), [](const LogRecord& record) {
        return record.category == instrumentationCategory && isSimulationNotice(record.text);
    });
}

std::string powerRequestText(const std::vector<LogRecord>& records, PowerAnswer answer) {
    const std::string_view beginning = answer == PowerAnswer::accepted ? acceptedText : refusedText;
    const auto found = std::find_if(records.begin(), records.end(), [beginning](const LogRecord& record) {
        return record.category == instrumentationCategory && record.text.starts_with(beginning);
    });
    return found == records.end() ? std::string() : found->text;
}

std::string reasonsText(const std::vector<std::string>& logged, const char* introduction) {
    std::vector<std::string> reasons;
    for (const std::string& each : logged) {
        if (!isSimulationNotice(each) && !isAcceptance(each) &&
            std::find(reasons.begin(), reasons.end(), each) == reasons.end()) {
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

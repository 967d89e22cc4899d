#include "orvcim/AgentLog.h"

#include "model/Model.h"

#include <algorithm>

namespace ObjectManager::Orvcim {

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

} // namespace ObjectManager::Orvcim

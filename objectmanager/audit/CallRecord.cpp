#include "audit/CallRecord.h"

#include "audit/Journal.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <memory>
#include <utility>

namespace ObjectManager::Audit {

namespace {

/** The record as fields of the journal: fields of systemd.journal-fields(7), and own fields, which begin with ORV_. */
Journal::Fields fieldsOf(const CallRecord& record) {
    // The priorities of syslog(3): notice and warning.
    const char* const priority = record.verdict == Verdict::accepted ? "5" : "4";
    return {{"MESSAGE", messageOf(record)},      {"PRIORITY", priority},
            {"SYSLOG_IDENTIFIER", "orvcim"},     {"ORV_USER", record.user},
            {"ORV_ADDRESS", record.address},     {"ORV_TARGET", record.target},
            {"ORV_CLASS", record.className},     {"ORV_METHOD", record.method},
            {"ORV_ARGUMENTS", record.arguments}, {"ORV_OUTCOME", std::string(nameOf(record.verdict))},
            {"ORV_REASON", record.reason}};
}

} // namespace

std::string_view nameOf(Verdict verdict) {
    switch (verdict) {
    case Verdict::accepted:
        return "accepted";
    case Verdict::refused:
        return "refused";
    case Verdict::denied:
        break;
    }
    return "denied";
}

std::string messageOf(const CallRecord& record) {
    return fmt::format("{} {}: {}{}{}({}) of {}: {}{}{}", record.address,
                       record.user.empty() ? "somebody without a log-in" : record.user, record.className,
                       record.className.empty() ? "" : ".", record.method, record.arguments, record.target,
                       nameOf(record.verdict), record.reason.empty() ? "" : ": ", record.reason);
}

Recorder makeRecorder(std::function<void(const std::string& line)> log) {
    const auto journal = std::make_shared<const Journal>();
    return [journal, log = std::move(log)](const CallRecord& record) {
        if (!journal->write(fieldsOf(record))) {
            const auto time = std::chrono::floor<std::chrono::seconds>(record.time);
            log(fmt::format("{:%Y-%m-%dT%H:%M:%SZ} {}", fmt::gmtime(std::chrono::system_clock::to_time_t(time)),
                            messageOf(record)));
        }
    };
}

} // namespace ObjectManager::Audit

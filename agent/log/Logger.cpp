#include "OrvLog/OrvLogger.h"

#include "Destination.h"
#include "Gate.h"
#include "LastOperation.h"
#include "Line.h"
#include "Observation.h"
#include "Record.h"
#include "Thresholds.h"

#include "config/Configuration.h"
#include "config/ConfigurationWatch.h"

#include <atomic>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <exception>
#include <forward_list>
#include <memory>
#include <new>
#include <string>
#include <string_view>
#include <utility>

namespace OrvLog {

namespace {

class Log {
public:
    /** @param watch must be constructed before the settings are read, so that no change is missed. */
    Log(const Norv::Agent::LogSettings& settings, std::unique_ptr<Norv::Agent::ConfigurationWatch> watch)
        : _watch(std::move(watch)), _generations{Thresholds(settings)}, _thresholds(&_generations.front()),
          _destination(destinationFor(settings)) {}

    /** Writes a record of the log's own, which the observer has not seen yet. */
    void report(const Record& record) {
        showToObserver(record);
        note(record);
    }

    /** Writes a record where it passes the thresholds. */
    void note(const Record& record) {
        try {
            _watch->onChange([this] { renewThresholds(); });
        } catch (const std::bad_alloc&) {
            // The former thresholds go on to hold until the next look.
        }
        if (_thresholds.load(std::memory_order_acquire)->passes(record.kind, record.category, record.level)) {
            if (LastOperation::isNeededFor(record)) {
                writeLastOperation(record.category);
            }
            write(record);
        } else if (LastOperation::isOne(record)) {
            LastOperation::ofThisThread().remember(record);
        }
    }

private:
    // Only the thresholds are read again; the destination stays the same.
    void renewThresholds() {
        try {
            const auto configuration = Norv::Agent::loadConfiguration();
            _mistake.clear();
            const Thresholds thresholds(configuration.log);
            if (thresholds == _generations.front()) {
                return;
            }
            const std::string news =
                Norv::Agent::configurationFile() + " has changed: its thresholds apply from now on";
            _generations.push_front(thresholds);
            _thresholds.store(&_generations.front(), std::memory_order_release);
            report(ownRecord(news));
        } catch (const Norv::Agent::ConfigurationError& error) {
            if (_mistake != error.what()) {
                report(ownRecord(error.what() + std::string(": the former thresholds still apply")));
                _mistake = error.what();
            }
        }
    }

    void writeLastOperation(std::string_view category) {
        auto& operation = LastOperation::ofThisThread();
        if (operation.hasBeen(category)) {
            write(operation.record());
        }
        operation.forget();
    }

    static std::unique_ptr<Destination> destinationFor(const Norv::Agent::LogSettings& settings) {
        using enum Norv::Agent::LogSettings::Destination;
        switch (settings.destination) {
        case file:
            return fileDestination(settings);
        case syslog:
            return syslogDestination();
        case standardError:
            break;
        }
        return standardErrorDestination();
    }

    // Counts the records that the destination did not take. Their number is written before the first record that it
    // takes again.
    void write(const Record& record) {
        if (const auto lost = _lost.exchange(0); lost != 0) {
            const std::string text = std::to_string(lost) + (lost == 1 ? " record" : " records") +
                                     " lost: " + _destination->name() + ": " + strerrordesc_np(_lossReason);
            if (!tryWrite(ownRecord(text), lost)) {
                ++_lost;
                return;
            }
        }
        tryWrite(record, 1);
    }

    bool tryWrite(const Record& record, std::size_t countedAs) {
        const auto pass = _gate.enter();
        const int error = pass ? _destination->write(Line(record)) : EBUSY;
        if (error != 0) {
            _lossReason = error;
            _lost += countedAs;
        }
        return error == 0;
    }

    const std::unique_ptr<Norv::Agent::ConfigurationWatch> _watch;
    /** All thresholds so far, the newest first. Older ones stay, since other threads may be reading them. */
    std::forward_list<Thresholds> _generations;
    std::atomic<const Thresholds*> _thresholds;
    /** The mistake that the file had at the last look, which was reported; empty if it had none. */
    std::string _mistake;
    const std::unique_ptr<Destination> _destination;
    Gate _gate;
    std::atomic<std::size_t> _lost = 0;
    std::atomic<int> _lossReason = 0;
};

std::unique_ptr<Log> makeLog() {
    auto watch = std::make_unique<Norv::Agent::ConfigurationWatch>();
    try {
        const auto configuration = Norv::Agent::loadConfiguration();
        return std::make_unique<Log>(configuration.log, std::move(watch));
    } catch (const Norv::Agent::ConfigurationError& error) {
        auto log = std::make_unique<Log>(Norv::Agent::LogSettings{}, std::move(watch));
        log->report(ownRecord(error.what()));
        return log;
    }
}

void report(Kind kind, const char* function, const char* file, int line, const std::string& category, int level,
            int toldKind, const std::string& text) {
    constexpr auto textOf = [](const char* nullable) { return std::string_view(nullable == nullptr ? "" : nullable); };
    const int error = errno;
    const Record record{kind, level, category, textOf(function), textOf(file), line, text, toldKind};
    // This needs no memory, and no log that has to be made first.
    showToObserver(record);
    try {
        // Never destroyed: see -z nodelete in CMakeLists.txt.
        static Log& log = *makeLog().release();
        log.note(record);
    } catch (const std::exception&) {
        // Only memory can be short here, and there is no place left to report that.
    }
    errno = error;
}

} // namespace

void OrvLogger::logLevelMessage(const char* function, const char* file, int line, const std::string& category,
                                int level, char*, int recordKind, int, const std::string& message) {
    report(Kind::log, function, file, line, category, level, recordKind, message);
}

void OrvLogger::traceLevelMessage(const char* function, const char* file, int line, const std::string& category,
                                  int level, char*, int, int, const std::string& message) {
    report(Kind::trace, function, file, line, category, level, ORDINARY_RECORD, message);
}

} // namespace OrvLog

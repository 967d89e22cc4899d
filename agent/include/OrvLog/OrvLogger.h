/**
 * The management agent's log: liborvlog.so.1.
 */
#ifndef ORVLOG_ORVLOGGER_H
#define ORVLOG_ORVLOGGER_H

#include <string>

namespace OrvLog {

/**
 * Writes records to the configured destination. Both members may be called from any thread at any time. Neither throws,
 * nor waits for a destination that is full or missing.
 *
 * A record is written if its level is at or above the threshold of its category and kind.
 */
class OrvLogger {
public:
    /**
     * Writes a record of kind "log".
     *
     * @param function,file,line the place in the source that reports; null texts become empty.
     * @param category a dotted name; thresholds are set for prefixes of it.
     * @param level a higher level is more important: 3000 progress, 4000 operations, 6000 failures.
     * @param message the text, one line.
     *
     * Of the three unnamed arguments, the first number is a RecordKind of OrvLog/Observer.h; the others are not used.
     */
    static void logLevelMessage(const char* function, const char* file, int line, const std::string& category,
                                int level, char*, int, int, const std::string& message);

    /** Writes a record of kind "trace"; the arguments are those of `logLevelMessage`. */
    static void traceLevelMessage(const char* function, const char* file, int line, const std::string& category,
                                  int level, char*, int, int, const std::string& message);
};

} // namespace OrvLog

#endif

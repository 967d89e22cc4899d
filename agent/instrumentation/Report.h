/**
 * The instrumentation's records in the agent's log.
 */
#ifndef INSTRUMENTATION_REPORT_H
#define INSTRUMENTATION_REPORT_H

#include "OrvLog/Observer.h"
#include "OrvLog/OrvLogger.h"

#include <string>

namespace Norv::Agent {

inline constexpr const char* instrumentationCategory = "Corvane.Instrumentation";

/** The levels of the instrumentation's records; a third one is alwaysWrittenLevel. */
inline constexpr int informationLevel = 5000;
inline constexpr int failureLevel = 6000;

/** Writes a record of kind "log"; its place in the source is the caller's. */
inline void report(int level, const std::string& text, OrvLog::RecordKind kind = OrvLog::ORDINARY_RECORD,
                   const char* function = __builtin_FUNCTION(), const char* file = __builtin_FILE(),
                   int line = __builtin_LINE()) {
    OrvLog::OrvLogger::logLevelMessage(function, file, line, instrumentationCategory, level, nullptr, kind, 0, text);
}

} // namespace Norv::Agent

#endif

/**
 * Logs the failures of operations in the agent's provider libraries.
 */
#ifndef PROVIDER_LOG_H
#define PROVIDER_LOG_H

#include "OrvLog/OrvLogger.h"

namespace Norv::Provider {

/** The place in the source that a record names. */
struct Site {
    const char* function;
    const char* file;
    int line;

    /**
     * The place of the call of `here`; in a default argument, that is the place of the call that omits the argument.
     */
    static constexpr Site here(const char* function = __builtin_FUNCTION(), const char* file = __builtin_FILE(),
                               int line = __builtin_LINE()) {
        return Site{function, file, line};
    }
};

/** Writes a failure to the log, with its category. */
inline void logFailure(const Site& site, const char* category, const char* message) {
    constexpr int failureLevel = 6000;
    OrvLog::OrvLogger::logLevelMessage(site.function, site.file, site.line, category, failureLevel, nullptr, 0, 0,
                                       message);
}

} // namespace Norv::Provider

#endif

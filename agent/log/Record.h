#ifndef LOG_RECORD_H
#define LOG_RECORD_H

#include "OrvLog/Observer.h"

#include "config/Configuration.h"

#include <string_view>

namespace OrvLog {

enum class Kind { log, trace };

/** What a caller reports. The texts belong to the caller. */
struct Record {
    Kind kind = Kind::log;
    int level = 0;
    std::string_view category;
    std::string_view function;
    std::string_view file;
    int line = 0;
    std::string_view text;
    /** The RecordKind that the caller gave. */
    int toldKind = ORDINARY_RECORD;
};

/** A record of the log about itself; its place in the source is the caller's. The text belongs to the caller. */
inline Record ownRecord(std::string_view text, const char* function = __builtin_FUNCTION(),
                        const char* file = __builtin_FILE(), int line = __builtin_LINE()) {
    return {Kind::log, Norv::Agent::alwaysWrittenLevel, "Corvane.Log", function, file, line, text};
}

} // namespace OrvLog

#endif

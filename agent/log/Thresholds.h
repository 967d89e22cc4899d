#ifndef LOG_THRESHOLDS_H
#define LOG_THRESHOLDS_H

#include "Record.h"

#include "config/Configuration.h"

#include <string>
#include <string_view>
#include <vector>

namespace OrvLog {

/** Decides which records are written. This is asked for every record, and most are not written. */
class Thresholds {
public:
    explicit Thresholds(const Norv::Agent::LogSettings& settings);

    bool passes(Kind kind, std::string_view category, int level) const;

    bool operator==(const Thresholds&) const = default;

private:
    struct Levels {
        int log;
        int trace;

        int of(Kind kind) const { return kind == Kind::log ? log : trace; }
        bool operator==(const Levels&) const = default;
    };
    struct Category {
        std::string prefix;
        Levels levels;

        bool operator==(const Category&) const = default;
    };

    Levels _general;
    /** The lowest of all thresholds: a record below it is dropped without a look at its category. */
    Levels _lowest;
    /** Categories with thresholds of their own, the longest prefix first. */
    std::vector<Category> _categories;
};

} // namespace OrvLog

#endif

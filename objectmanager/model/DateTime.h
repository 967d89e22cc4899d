/** The CIM datetime type: points in time and intervals in the 25-character form of DSP0004. */
#ifndef OBJECTMANAGER_DATETIME_H
#define OBJECTMANAGER_DATETIME_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager {

struct DateTime {
    /** Since 1970-01-01 00:00 UTC, or the length of the interval. Digits given as asterisks count as the least value.
     */
    std::uint64_t microseconds = 0;
    bool interval = false;
};

/**
 * Reads "yyyymmddhhmmss.mmmmmmsutc" (s a sign, utc an offset in minutes) or "ddddddddhhmmss.mmmmmm:000".
 * Nothing where `text` is neither, or lies before 1970.
 */
std::optional<DateTime> parseDateTime(std::string_view text);

/** Points in time are written in UTC. Nothing where the value does not fit into the form. */
std::optional<std::string> formatDateTime(const DateTime& value);

} // namespace ObjectManager

#endif

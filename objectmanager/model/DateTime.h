/** The CIM datetime type: times and intervals, which DSP0004 writes with 25 characters. */
#ifndef MODEL_DATETIME_H
#define MODEL_DATETIME_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager {

/** A time or an interval. */
struct DateTime {
    /** The time since 1970-01-01 00:00 UTC, or the length of the interval. */
    std::uint64_t microseconds = 0;
    bool interval = false;
};

/**
 * Reads a CIM datetime in one of the two forms of DSP0004: a time is written as "yyyymmddhhmmss.mmmmmmsutc", where "s"
 * is the sign and "utc" the number of minutes by which the local time differs from UTC; an interval is written as
 * "ddddddddhhmmss.mmmmmm:000". A field of asterisks counts as the least value that the field can have, and trailing
 * asterisks in the microseconds count as zeros.
 *
 * @return no value if `text` is not in one of these forms, or is a time before 1970.
 */
std::optional<DateTime> parseDateTime(std::string_view text);

/**
 * Writes a CIM datetime in the form of DSP0004; a time is written in UTC.
 *
 * @return no value if the form has too few digits: for a time after the year 9999, or an interval of 100,000,000 days
 * or more.
 */
std::optional<std::string> formatDateTime(const DateTime& value);

} // namespace ObjectManager

#endif

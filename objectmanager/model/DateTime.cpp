#include "model/DateTime.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <chrono>
#include <cstdio>
#include <limits>

namespace ObjectManager {

namespace {

constexpr std::size_t length = 25;

/** Reads the fields of a datetime from left to right. After a wrong field, every further field counts as wrong. */
class Fields {
public:
    explicit Fields(std::string_view text) : _text(text), _good(text.size() == length) {}

    bool good() const { return _good; }

    /** The number in the next `width` digits; `least` if there are asterisks instead of digits. */
    std::uint32_t number(std::size_t width, std::uint32_t least, std::uint32_t greatest) {
        const std::string_view field = next(width);
        std::uint32_t value = least;
        if (field != std::string_view("********").substr(0, width)) {
            const auto [end, error] = std::from_chars(field.data(), field.data() + field.size(), value);
            _good = _good && error == std::errc{} && end == field.data() + field.size();
        }
        _good = _good && least <= value && value <= greatest;
        return value;
    }

    /** The number of microseconds: six digits, of which the last ones may be asterisks, which count as zeros. */
    std::uint32_t fraction() {
        const std::string_view field = next(6);
        const std::size_t digits = std::min(field.find('*'), field.size());
        _good = _good && field.find_first_not_of('*', digits) == std::string_view::npos;
        std::string padded(field.substr(0, digits));
        padded.resize(6, '0');
        std::uint32_t value = 0;
        const auto [end, error] = std::from_chars(padded.data(), padded.data() + padded.size(), value);
        _good = _good && error == std::errc{} && end == padded.data() + padded.size();
        return value;
    }

    /** The next character, which must be one of `expected`. */
    char separator(std::string_view expected) {
        const std::string_view field = next(1);
        _good = _good && expected.find(field) != std::string_view::npos;
        return _good ? field.front() : '\0';
    }

private:
    std::string_view next(std::size_t width) {
        const std::string_view field = _good ? _text.substr(0, width) : std::string_view();
        _text.remove_prefix(field.size());
        return field;
    }

    std::string_view _text;
    bool _good;
};

std::optional<DateTime> parseInterval(std::string_view text) {
    Fields fields(text);
    const std::chrono::days days(fields.number(8, 0, 99'999'999));
    const std::chrono::hours hours(fields.number(2, 0, 23));
    const std::chrono::minutes minutes(fields.number(2, 0, 59));
    const std::chrono::seconds seconds(fields.number(2, 0, 59));
    fields.separator(".");
    const std::chrono::microseconds fraction(fields.fraction());
    fields.separator(":");
    fields.number(3, 0, 0);
    if (!fields.good()) {
        return std::nullopt;
    }
    const std::chrono::microseconds whole = days + hours + minutes + seconds + fraction;
    return DateTime{static_cast<std::uint64_t>(whole.count()), true};
}

std::optional<DateTime> parseTime(std::string_view text) {
    Fields fields(text);
    const std::chrono::year year(static_cast<int>(fields.number(4, 0, 9999)));
    const std::chrono::month month(fields.number(2, 1, 12));
    const std::chrono::day day(fields.number(2, 1, 31));
    const std::chrono::hours hours(fields.number(2, 0, 23));
    const std::chrono::minutes minutes(fields.number(2, 0, 59));
    const std::chrono::seconds seconds(fields.number(2, 0, 59));
    fields.separator(".");
    const std::chrono::microseconds fraction(fields.fraction());
    const bool ahead = fields.separator("+-") == '+';
    const std::chrono::minutes offset(fields.number(3, 0, 999));
    const std::chrono::year_month_day date(year, month, day);
    if (!fields.good() || !date.ok()) {
        return std::nullopt;
    }
    const auto local = std::chrono::sys_days(date) + hours + minutes + seconds + fraction;
    const auto utc = ahead ? local - offset : local + offset;
    if (utc.time_since_epoch().count() < 0) {
        return std::nullopt;
    }
    return DateTime{static_cast<std::uint64_t>(utc.time_since_epoch().count()), false};
}

} // namespace

std::optional<DateTime> parseDateTime(std::string_view text) {
    return text.size() == length && text[21] == ':' ? parseInterval(text) : parseTime(text);
}

std::optional<std::string> formatDateTime(const DateTime& value) {
    if (value.microseconds > std::numeric_limits<std::int64_t>::max()) {
        return std::nullopt;
    }
    const std::chrono::microseconds whole(static_cast<std::int64_t>(value.microseconds));
    const auto days = std::chrono::floor<std::chrono::days>(whole);
    const std::chrono::hh_mm_ss time(whole - days);
    constexpr std::chrono::days year10000(2'932'897);
    if (!value.interval && days >= year10000) {
        return std::nullopt;
    }
    std::array<char, 32> dayText{};
    if (value.interval) {
        std::snprintf(dayText.data(), dayText.size(), "%08d", static_cast<int>(days.count()));
    } else {
        const std::chrono::year_month_day date{std::chrono::sys_days(days)};
        std::snprintf(dayText.data(), dayText.size(), "%04d%02u%02u", static_cast<int>(date.year()),
                      static_cast<unsigned int>(date.month()), static_cast<unsigned int>(date.day()));
    }
    std::array<char, 32> timeText{};
    std::snprintf(timeText.data(), timeText.size(), "%02d%02d%02d.%06d", static_cast<int>(time.hours().count()),
                  static_cast<int>(time.minutes().count()), static_cast<int>(time.seconds().count()),
                  static_cast<int>(time.subseconds().count()));
    std::string text = std::string(dayText.data()) + timeText.data() + (value.interval ? ":000" : "+000");
    return text.size() == length ? std::optional(std::move(text)) : std::nullopt;
}

} // namespace ObjectManager

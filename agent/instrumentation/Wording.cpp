#include "Wording.h"

#include <array>
#include <charconv>
#include <cstddef>
#include <cstdio>

namespace Norv::Agent {

std::string inSeconds(std::chrono::milliseconds duration) {
    std::array<char, 32> text;
    const double seconds = std::chrono::duration<double>(duration).count();
    char* const begin = text.data();
    char* const end = std::to_chars(begin, begin + text.size(), seconds, std::chars_format::fixed).ptr;
    return std::string(begin, end) + " s";
}

std::string inUtc(std::chrono::sys_seconds time) {
    const auto day = std::chrono::floor<std::chrono::days>(time);
    const std::chrono::year_month_day date(day);
    const std::chrono::hh_mm_ss clock(time - day);
    std::array<char, 64> text;
    const int size = std::snprintf(text.data(), text.size(), "%04d-%02u-%02uT%02d:%02d:%02dZ", int(date.year()),
                                   unsigned(date.month()), unsigned(date.day()), int(clock.hours().count()),
                                   int(clock.minutes().count()), int(clock.seconds().count()));
    return {text.data(), static_cast<std::size_t>(size)};
}

} // namespace Norv::Agent

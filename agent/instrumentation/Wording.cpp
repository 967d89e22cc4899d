#include "Wording.h"

#include <array>
#include <charconv>
#include <ctime>

namespace Norv::Agent {

std::string inSeconds(std::chrono::milliseconds duration) {
    std::array<char, 32> text;
    const double seconds = std::chrono::duration<double>(duration).count();
    char* const begin = text.data();
    char* const end = std::to_chars(begin, begin + text.size(), seconds, std::chars_format::fixed).ptr;
    return std::string(begin, end) + " s";
}

std::string inUtc(std::chrono::system_clock::time_point time) {
    const std::time_t seconds = std::chrono::system_clock::to_time_t(time);
    std::tm utc{};
    ::gmtime_r(&seconds, &utc);
    std::array<char, 64> text{};
    const std::size_t size = std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%SZ", &utc);
    return {text.data(), size};
}

} // namespace Norv::Agent

#include "Wording.h"

#include <array>
#include <charconv>

namespace Norv::Agent {

std::string inSeconds(std::chrono::milliseconds duration) {
    std::array<char, 32> text;
    const double seconds = std::chrono::duration<double>(duration).count();
    char* const begin = text.data();
    char* const end = std::to_chars(begin, begin + text.size(), seconds, std::chars_format::fixed).ptr;
    return std::string(begin, end) + " s";
}

} // namespace Norv::Agent

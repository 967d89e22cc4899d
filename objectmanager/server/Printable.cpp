#include "server/Printable.h"

#include <fmt/format.h>

#include <cstdint>

namespace ObjectManager::Server {

namespace {

constexpr char32_t invalid = 0xffffffff;

struct Character {
    char32_t code;
    std::size_t size;
};

/** Decodes the first character of a text that is not empty. */
Character firstOf(std::string_view text) {
    const auto byte = [text](std::size_t at) { return static_cast<unsigned char>(text[at]); };
    const unsigned char first = byte(0);
    if (first < 0x80) {
        return {first, 1};
    }
    const std::size_t size = first >= 0xf0 ? 4 : first >= 0xe0 ? 3 : 2;
    if (first < 0xc2 || first > 0xf4 || text.size() < size) {
        return {invalid, 1};
    }
    char32_t code = first & (0xffU >> (size + 1));
    for (std::size_t i = 1; i < size; ++i) {
        if ((byte(i) & 0xc0U) != 0x80U) {
            return {invalid, 1};
        }
        code = code << 6U | (byte(i) & 0x3fU);
    }
    const bool isShortest = code >= (size == 4 ? 0x10000U : size == 3 ? 0x800U : 0x80U);
    const bool isCharacter = code <= 0x10ffff && (code < 0xd800 || code > 0xdfff);
    return isShortest && isCharacter ? Character{code, size} : Character{invalid, 1};
}

bool isHarmless(char32_t code) {
    const auto isIn = [code](char32_t first, char32_t last) { return code >= first && code <= last; };
    return code != invalid && !isIn(0, 0x1f) && !isIn(0x7f, 0x9f) && !isIn(0x200e, 0x200f) && !isIn(0x2028, 0x202e) &&
           !isIn(0x2066, 0x2069);
}

} // namespace

std::string printable(std::string_view text) {
    std::string result;
    while (!text.empty()) {
        const auto [code, size] = firstOf(text);
        for (const char byte : text.substr(0, size)) {
            if (isHarmless(code)) {
                result += byte;
            } else {
                result += fmt::format("\\x{:02x}", static_cast<unsigned char>(byte));
            }
        }
        text.remove_prefix(size);
    }
    return result;
}

} // namespace ObjectManager::Server

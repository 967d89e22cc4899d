#include "basics/Printable.h"

#include "basics/Utf8.h"

#include <fmt/format.h>

#include <algorithm>

namespace ObjectManager {

namespace {

bool isHarmless(char32_t code) {
    const auto isIn = [code](char32_t first, char32_t last) { return code >= first && code <= last; };
    return !isIn(0, 0x1f) && !isIn(0x7f, 0x9f) && !isIn(0x200e, 0x200f) && !isIn(0x2028, 0x202e) &&
           !isIn(0x2066, 0x2069) && !isIn(0xd800, 0xdfff);
}

} // namespace

std::string printable(std::string_view text, std::size_t longest) {
    std::string result;
    while (!text.empty()) {
        if (result.size() >= longest) {
            return result + "...";
        }
        const Utf8Character character = firstCharacter(text);
        const std::string_view bytes = text.substr(0, std::max<std::size_t>(character.size, 1));
        if (character.size > 0 && isHarmless(character.code)) {
            result += bytes;
        } else {
            for (const char byte : bytes) {
                result += fmt::format("\\x{:02x}", static_cast<unsigned char>(byte));
            }
        }
        text.remove_prefix(bytes.size());
    }
    return result;
}

} // namespace ObjectManager

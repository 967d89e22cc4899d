/** Decodes UTF-8 (RFC 3629). */
#ifndef BASICS_UTF8_H
#define BASICS_UTF8_H

#include <cstddef>
#include <string_view>

namespace ObjectManager {

/** Whether a byte is one of the bytes of a character after its first one. */
constexpr bool continuesCharacter(char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80U;
}

struct Utf8Character {
    char32_t code;
    /** How many bytes the character has; 0 if the bytes are not a character. */
    std::size_t size;
};

/**
 * Decodes the first character of a text that is not empty. Codes of surrogates, which RFC 3629 excludes, are returned,
 * since a char16 of CIM can be one; callers that do not want them have to check the code.
 */
constexpr Utf8Character firstCharacter(std::string_view text) {
    const auto first = static_cast<unsigned char>(text.front());
    if (first < 0x80) {
        return {first, 1};
    }
    const std::size_t size = first >= 0xF0 ? 4 : first >= 0xE0 ? 3 : 2;
    if (first < 0xC2 || first > 0xF4 || text.size() < size) {
        return {0, 0};
    }
    char32_t code = first & (0xFFU >> (size + 1));
    for (const char byte : text.substr(1, size - 1)) {
        if (!continuesCharacter(byte)) {
            return {0, 0};
        }
        code = code << 6U | (static_cast<unsigned char>(byte) & 0x3FU);
    }
    const bool isShortest = code >= (size == 4 ? 0x10000U : size == 3 ? 0x800U : 0x80U);
    return isShortest && code <= 0x10FFFF ? Utf8Character{code, size} : Utf8Character{0, 0};
}

} // namespace ObjectManager

#endif

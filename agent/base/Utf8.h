#ifndef BASE_UTF8_H
#define BASE_UTF8_H

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace Norv::Agent {

/** Converts a text to UTF-8; a wide character that is not a Unicode character becomes U+FFFD. */
std::string utf8From(std::wstring_view text);

/** Converts a text from UTF-8; no value if it is not valid UTF-8. */
std::optional<std::wstring> wideFrom(std::string_view text);

/** The beginning of a text in UTF-8: at most `longest` bytes, but only whole characters. */
constexpr std::string_view beginningOf(std::string_view text, std::size_t longest) {
    const auto continuesCharacter = [](char byte) { return (static_cast<unsigned char>(byte) & 0xC0) == 0x80; };
    if (text.size() <= longest) {
        return text;
    }
    while (longest > 0 && continuesCharacter(text[longest])) {
        --longest;
    }
    return text.substr(0, longest);
}

} // namespace Norv::Agent

#endif

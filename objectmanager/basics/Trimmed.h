/** Removes white space around texts. */
#ifndef BASICS_TRIMMED_H
#define BASICS_TRIMMED_H

#include <cstddef>
#include <string_view>

namespace ObjectManager {

/** The text without the characters of `blanks` at its ends. */
constexpr std::string_view trimmed(std::string_view text, std::string_view blanks = " \t\r\n") {
    const std::size_t first = text.find_first_not_of(blanks);
    return first == std::string_view::npos ? std::string_view()
                                           : text.substr(first, text.find_last_not_of(blanks) + 1 - first);
}

} // namespace ObjectManager

#endif

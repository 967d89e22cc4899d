/** Makes texts of clients safe for the log. */
#ifndef BASICS_PRINTABLE_H
#define BASICS_PRINTABLE_H

#include <string>
#include <string_view>

namespace ObjectManager {

/**
 * The text without characters that could break or forge lines of a log, or control a terminal. Control characters
 * (including U+0080 to U+009F), characters that change the direction of text, and bytes that are not valid UTF-8 become
 * \x and the hexadecimal digits of their bytes.
 *
 * @param longest once the result has this number of bytes, "..." replaces the rest of the text. No character is cut in
 *        two.
 */
std::string printable(std::string_view text, std::size_t longest = std::string::npos);

} // namespace ObjectManager

#endif

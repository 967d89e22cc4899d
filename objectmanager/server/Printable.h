/** Makes clients' texts safe for the log. */
#ifndef SERVER_PRINTABLE_H
#define SERVER_PRINTABLE_H

#include <string>
#include <string_view>

namespace ObjectManager::Server {

/**
 * The text without characters that could break or forge lines of a log, or control a terminal. Control characters
 * (including U+0080 to U+009F), characters that change the direction of text, and bytes that are not valid UTF-8 become
 * \x and the hexadecimal digits of their bytes.
 */
std::string printable(std::string_view text);

} // namespace ObjectManager::Server

#endif

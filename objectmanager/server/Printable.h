/** Texts of clients in the log. */
#ifndef SERVER_PRINTABLE_H
#define SERVER_PRINTABLE_H

#include <string>
#include <string_view>

namespace ObjectManager::Server {

/**
 * The text without what would break or forge lines of a log, or do something to a terminal: control characters, those
 * beyond ASCII (U+0080 to U+009F) included, characters that turn the direction of a text, and what is not UTF-8 become
 * \x and the digits of their bytes.
 */
std::string printable(std::string_view text);

} // namespace ObjectManager::Server

#endif

#ifndef BASE_UTF8_H
#define BASE_UTF8_H

#include <optional>
#include <string>
#include <string_view>

namespace Norv::Agent {

/** Converts a text to UTF-8; a wide character that is not a Unicode character becomes U+FFFD. */
std::string utf8From(std::wstring_view text);

/** Converts a text from UTF-8; no value if it is not valid UTF-8. */
std::optional<std::wstring> wideFrom(std::string_view text);

} // namespace Norv::Agent

#endif

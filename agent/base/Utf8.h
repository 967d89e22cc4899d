#ifndef BASE_UTF8_H
#define BASE_UTF8_H

#include <optional>
#include <string>
#include <string_view>

namespace Norv::Agent {

/** The text in UTF-8; what is no Unicode character becomes U+FFFD. */
std::string utf8From(std::wstring_view text);

/** The text that is given in UTF-8; nothing where it is something else. */
std::optional<std::wstring> wideFrom(std::string_view text);

} // namespace Norv::Agent

#endif

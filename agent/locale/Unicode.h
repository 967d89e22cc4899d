#ifndef LOCALE_UNICODE_H
#define LOCALE_UNICODE_H

#include <optional>
#include <string>
#include <string_view>

namespace Norv::Locale {

/** The text in UTF-8; what is no Unicode character becomes U+FFFD. */
std::string utf8From(std::wstring_view text);

/** The text that is given in UTF-8; nothing where it is something else. */
std::optional<std::wstring> wideFrom(std::string_view text);

} // namespace Norv::Locale

#endif

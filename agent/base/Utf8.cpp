#include "Utf8.h"

#include <algorithm>
#include <cwchar>
#include <locale>

namespace Norv::Agent {

namespace {

static_assert(sizeof(wchar_t) == sizeof(char32_t), "a wide character is a whole Unicode character");

using Utf8 = std::codecvt<char32_t, char8_t, std::mbstate_t>;

const Utf8& utf8() {
    return std::use_facet<Utf8>(std::locale::classic());
}

constexpr bool isCharacter(char32_t code) {
    return code < 0xD800 || (code > 0xDFFF && code <= 0x10FFFF);
}

} // namespace

std::string utf8From(std::wstring_view text) {
    // Most texts have ASCII characters only, each of which is its own byte.
    constexpr char32_t endOfAscii = 0x80;
    if (std::ranges::all_of(text, [](wchar_t code) { return static_cast<char32_t>(code) < endOfAscii; })) {
        return {text.begin(), text.end()};
    }
    constexpr char32_t replacement = 0xFFFD;
    std::u32string codes(text.begin(), text.end());
    std::ranges::replace_if(
        codes, [](char32_t code) { return !isCharacter(code); }, replacement);

    std::u8string bytes(codes.size() * static_cast<std::size_t>(utf8().max_length()), u8'\0');
    std::mbstate_t state{};
    const char32_t* read = nullptr;
    char8_t* written = nullptr;
    utf8().out(state, codes.data(), codes.data() + codes.size(), read, bytes.data(), bytes.data() + bytes.size(),
               written);
    return {bytes.data(), written};
}

std::optional<std::wstring> wideFrom(std::string_view text) {
    const std::u8string bytes(text.begin(), text.end());
    std::u32string codes(bytes.size(), U'\0');
    std::mbstate_t state{};
    const char8_t* read = nullptr;
    char32_t* written = nullptr;
    const auto result = utf8().in(state, bytes.data(), bytes.data() + bytes.size(), read, codes.data(),
                                  codes.data() + codes.size(), written);
    if (result != std::codecvt_base::ok || !std::all_of(codes.data(), written, isCharacter)) {
        return std::nullopt;
    }
    return std::wstring(codes.data(), written);
}

} // namespace Norv::Agent

#include "classes/Literals.h"

#include "basics/Utf8.h"
#include "model/DateTime.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <limits>
#include <utility>

namespace ObjectManager {

namespace {

struct TypeName {
    std::string_view name;
    CMPIType type;
};

/** The types that a MOF declaration can name. */
constexpr std::array<TypeName, 14> typeNames{{{"boolean", CMPI_boolean},
                                              {"char16", CMPI_char16},
                                              {"uint8", CMPI_uint8},
                                              {"uint16", CMPI_uint16},
                                              {"uint32", CMPI_uint32},
                                              {"uint64", CMPI_uint64},
                                              {"sint8", CMPI_sint8},
                                              {"sint16", CMPI_sint16},
                                              {"sint32", CMPI_sint32},
                                              {"sint64", CMPI_sint64},
                                              {"real32", CMPI_real32},
                                              {"real64", CMPI_real64},
                                              {"string", CMPI_string},
                                              {"datetime", CMPI_dateTime}}};

struct Digits {
    std::string_view text;
    int base;
};

/** The digits of an unsigned integer and their base, which prefix or suffix tell (DSP0004). */
Digits digitsOf(std::string_view text) {
    if (text.starts_with("0x") || text.starts_with("0X")) {
        return {text.substr(2), 16};
    }
    if (text.ends_with('b') || text.ends_with('B')) {
        return {text.substr(0, text.size() - 1), 2};
    }
    if (text.size() > 1 && text.starts_with('0')) {
        return {text.substr(1), 8};
    }
    return {text, 10};
}

struct Integer {
    bool negative;
    std::uint64_t magnitude;
    /** Whether the magnitude does not fit into 64 bits. */
    bool tooLarge;
};

std::optional<Integer> parseInteger(std::string_view text) {
    const bool negative = text.starts_with('-');
    if (negative || text.starts_with('+')) {
        text.remove_prefix(1);
    }
    const auto [digits, base] = digitsOf(text);
    std::uint64_t magnitude = 0;
    const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), magnitude, base);
    if (digits.empty() || error == std::errc::invalid_argument || end != digits.data() + digits.size()) {
        return std::nullopt;
    }
    return Integer{negative, magnitude, error == std::errc::result_out_of_range};
}

std::optional<double> parseReal(std::string_view text) {
    if (text.starts_with('+')) {
        text.remove_prefix(1);
    }
    double value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size() || !std::isfinite(value)) {
        return std::nullopt;
    }
    return value;
}

[[noreturn]] void unexpected(std::string_view text, const std::string& expected) {
    throw LiteralError(0, fmt::format("found '{}', expected {}", text, expected));
}

/** The number of bits of an integer type. The type codes of signed and of unsigned types each grow with the size. */
int bitsOf(CMPIType type) {
    return 8 << (((type & ~CMPI_ARRAY) >> 4) & 3);
}

bool isSigned(CMPIType type) {
    return type >= CMPI_sint8 && type <= CMPI_sint64;
}

Value integerOfText(std::string_view text, CMPIType type) {
    const int bits = bitsOf(type);
    const std::uint64_t magnitudeOfMax =
        std::numeric_limits<std::uint64_t>::max() >> (isSigned(type) ? 65 - bits : 64 - bits);
    const std::uint64_t magnitudeOfMin = isSigned(type) ? magnitudeOfMax + 1 : 0;
    const auto integer = parseInteger(text);
    if (!integer || integer->tooLarge || integer->magnitude > (integer->negative ? magnitudeOfMin : magnitudeOfMax)) {
        unexpected(text, fmt::format("a {} from {}{} to {}", typeName(type), isSigned(type) ? "-" : "", magnitudeOfMin,
                                     magnitudeOfMax));
    }
    if (!isSigned(type)) {
        return unsignedValue(type, integer->magnitude);
    }
    // The number is negated while it is unsigned, since no signed integer holds the magnitude of the smallest value.
    return signedValue(type,
                       static_cast<std::int64_t>(integer->negative ? 0 - integer->magnitude : integer->magnitude));
}

Value realOfText(std::string_view text, CMPIType type) {
    const auto value = parseReal(text);
    if (!value || (type == CMPI_real32 && std::abs(*value) > std::numeric_limits<float>::max())) {
        unexpected(text, fmt::format("a {}", typeName(type)));
    }
    return realValue(type, *value);
}

std::optional<bool> parseBoolean(std::string_view text) {
    if (equalNames(text, "true")) {
        return true;
    }
    if (equalNames(text, "false")) {
        return false;
    }
    return std::nullopt;
}

void appendUtf8(std::string& text, char16_t character) {
    const auto byte = [](int value) { return static_cast<char>(static_cast<unsigned char>(value)); };
    const int code = character;
    if (code < 0x80) {
        text += byte(code);
    } else if (code < 0x800) {
        text += byte(0xc0 | (code >> 6));
        text += byte(0x80 | (code & 0x3f));
    } else {
        text += byte(0xe0 | (code >> 12));
        text += byte(0x80 | ((code >> 6) & 0x3f));
        text += byte(0x80 | (code & 0x3f));
    }
}

/**
 * The character of a text in UTF-8 that consists of one character; no value if there are more or it does not fit into a
 * char16.
 */
std::optional<char16_t> singleCharacter(std::string_view text) {
    if (text.empty()) {
        return std::nullopt;
    }
    const auto [code, size] = firstCharacter(text);
    return size == text.size() && code <= 0xffff ? std::optional(static_cast<char16_t>(code)) : std::nullopt;
}

struct Escape {
    char letter;
    char character;
};

/** The escape sequences of one letter. The only other one is \x with up to four hexadecimal digits. */
constexpr std::array<Escape, 8> escapes{
    {{'b', '\b'}, {'t', '\t'}, {'n', '\n'}, {'f', '\f'}, {'r', '\r'}, {'"', '"'}, {'\'', '\''}, {'\\', '\\'}}};

/** Reads the escape sequence whose letter is at `position`, behind the backslash. */
void readEscape(std::string_view text, std::size_t& position, std::string& result) {
    const std::size_t start = position;
    const char letter = text[position++];
    const auto* const escape =
        std::find_if(escapes.begin(), escapes.end(), [letter](const Escape& e) { return e.letter == letter; });
    if (escape != escapes.end()) {
        result += escape->character;
        return;
    }
    constexpr std::size_t maxDigits = 4;
    const std::string_view digits = text.substr(position, maxDigits);
    unsigned int code = 0;
    const char* end = digits.data();
    if (letter == 'x' || letter == 'X') {
        end = std::from_chars(digits.data(), digits.data() + digits.size(), code, 16).ptr;
    }
    if (end == digits.data()) {
        throw LiteralError(start - 1, fmt::format("found the escape '\\{}', expected \\b, \\t, \\n, \\f, \\r, \\\", "
                                                  "\\', \\\\ or \\x and hexadecimal digits",
                                                  letter));
    }
    position += static_cast<std::size_t>(end - digits.data());
    appendUtf8(result, static_cast<char16_t>(code));
}

} // namespace

std::optional<CMPIType> typeByName(std::string_view name) {
    const auto* const found = std::find_if(typeNames.begin(), typeNames.end(),
                                           [name](const TypeName& t) { return equalNames(t.name, name); });
    return found == typeNames.end() ? std::nullopt : std::optional(found->type);
}

std::string typeName(CMPIType type) {
    const auto element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    const auto* const found =
        std::find_if(typeNames.begin(), typeNames.end(), [element](const TypeName& t) { return t.type == element; });
    const std::string name = found != typeNames.end()   ? std::string(found->name)
                             : element == CMPI_ref      ? "reference"
                             : element == CMPI_instance ? "instance"
                                                        : fmt::format("type {:#x}", element);
    return (type & CMPI_ARRAY) != 0 ? name + "[]" : name;
}

bool isInteger(CMPIType type) {
    return type >= CMPI_uint8 && type <= CMPI_sint64;
}

bool isReal(CMPIType type) {
    return type == CMPI_real32 || type == CMPI_real64;
}

Value valueOfText(std::string_view text, CMPIType type) {
    if (isInteger(type)) {
        return integerOfText(text, type);
    }
    if (isReal(type)) {
        return realOfText(text, type);
    }
    switch (type) {
    case CMPI_boolean:
        if (const auto value = parseBoolean(text)) {
            return booleanValue(*value);
        }
        unexpected(text, "TRUE or FALSE");
    case CMPI_char16:
        if (const auto character = singleCharacter(text)) {
            return Value{CMPI_char16, *character};
        }
        unexpected(text, "one character");
    case CMPI_string:
        return stringValue(std::string(text));
    case CMPI_dateTime:
        if (parseDateTime(text)) {
            return dateTimeValue(std::string(text));
        }
        unexpected(text, "a datetime: yyyymmddhhmmss.mmmmmm+uuu (local time and its minutes east of UTC) or "
                         "ddddddddhhmmss.mmmmmm:000 (an interval)");
    default:
        unexpected(text, "no value, since a " + typeName(type) + " cannot be written as plain text");
    }
}

std::optional<Value> valueOfUntypedText(std::string_view text) {
    if (const auto boolean = parseBoolean(text)) {
        return booleanValue(*boolean);
    }
    if (const auto integer = parseInteger(text)) {
        constexpr std::uint64_t largestSigned = std::numeric_limits<std::int64_t>::max();
        const bool fitsSigned = integer->magnitude <= (integer->negative ? largestSigned + 1 : largestSigned);
        if (integer->tooLarge || (integer->negative && !fitsSigned)) {
            return std::nullopt;
        }
        return integerOfText(text, fitsSigned ? CMPI_sint64 : CMPI_uint64);
    }
    if (const auto real = parseReal(text)) {
        return realValue(CMPI_real64, *real);
    }
    return std::nullopt;
}

std::string readQuoted(std::string_view text, std::size_t& position) {
    const std::size_t start = position;
    const char quote = text[position++];
    std::string result;
    while (position < text.size() && text[position] != quote) {
        const char character = text[position++];
        if (character != '\\') {
            result += character;
        } else if (position < text.size()) {
            readEscape(text, position, result);
        }
    }
    if (position >= text.size()) {
        throw LiteralError(start, fmt::format("found no closing {0}, expected one for the {0} here", quote));
    }
    ++position;
    return result;
}

std::string inQuotes(std::string_view text, char quote) {
    std::string result(1, quote);
    for (const char character : text) {
        const auto* const escape = std::find_if(escapes.begin(), escapes.end(),
                                                [character](const Escape& e) { return e.character == character; });
        const bool otherQuote = (character == '"' || character == '\'') && character != quote;
        if (escape != escapes.end() && !otherQuote) {
            result += '\\';
            result += escape->letter;
        } else if (static_cast<unsigned char>(character) < 0x20 || character == 0x7f) {
            result += fmt::format("\\x{:04x}", static_cast<unsigned char>(character));
        } else {
            result += character;
        }
    }
    return result + quote;
}

std::string utf8(char16_t character) {
    std::string text;
    appendUtf8(text, character);
    return text;
}

} // namespace ObjectManager

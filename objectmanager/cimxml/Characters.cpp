#include "cimxml/Characters.h"

#include "basics/Utf8.h"

#include <array>
#include <cstddef>

namespace ObjectManager::CimXml {

namespace {

constexpr std::string_view replacement = "\xEF\xBF\xBD";

/** Whether a byte cannot always be copied as it is: it has to be escaped somewhere, or is not a character of ASCII. */
constexpr std::array<bool, 256> special = [] {
    std::array<bool, 256> bytes{};
    for (unsigned int byte = 0; byte < bytes.size(); ++byte) {
        bytes[byte] = byte < 0x20 || byte >= 0x80 || byte == '<' || byte == '>' || byte == '&' || byte == '"';
    }
    return bytes;
}();

unsigned char byteAt(std::string_view text, std::size_t position) {
    return static_cast<unsigned char>(text[position]);
}

/** The position of the first special byte from `position` on, or the size of the text. */
std::size_t nextSpecial(std::string_view text, std::size_t position) {
    while (position < text.size() && !special[byteAt(text, position)]) {
        ++position;
    }
    return position;
}

/** Whether a document may contain the character. */
bool isXmlCharacter(char32_t code) {
    return code == '\t' || code == '\n' || code == '\r' || (code >= 0x20 && code <= 0xD7FF) ||
           (code >= 0xE000 && code <= 0xFFFD) || (code >= 0x10000 && code <= 0x10FFFF);
}

/** The escaped form of a character of ASCII; empty if the character stands for itself. */
std::string_view escapeOf(unsigned char byte, bool inAttribute) {
    switch (byte) {
    case '<':
        return "&lt;";
    case '>':
        return "&gt;";
    case '&':
        return "&amp;";
    case '"':
        return inAttribute ? "&quot;" : "";
    case '\t':
        return inAttribute ? "&#9;" : "";
    case '\n':
        return inAttribute ? "&#10;" : "";
    case '\r':
        return "&#13;";
    default:
        return byte < 0x20 ? replacement : "";
    }
}

void append(std::string& document, std::string_view text, bool inAttribute) {
    std::size_t written = 0;
    for (std::size_t position = nextSpecial(text, 0); position < text.size();) {
        const unsigned char byte = byteAt(text, position);
        std::string_view instead;
        std::size_t length = 1;
        if (byte < 0x80) {
            instead = escapeOf(byte, inAttribute);
        } else if (const auto [code, size] = firstCharacter(text.substr(position)); size > 0 && isXmlCharacter(code)) {
            length = size;
        } else {
            instead = replacement;
        }
        if (!instead.empty()) {
            document.append(text, written, position - written);
            document.append(instead);
            written = position + length;
        }
        position = nextSpecial(text, position + length);
    }
    document.append(text, written);
}

} // namespace

void appendText(std::string& document, std::string_view text) {
    append(document, text, false);
}

void appendAttributeText(std::string& document, std::string_view text) {
    append(document, text, true);
}

} // namespace ObjectManager::CimXml

#include "cimxml/Characters.h"

#include <array>
#include <cstddef>
#include <cstdint>

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

/** A kind of UTF-8 sequence, by the bits of its first byte. */
struct Lead {
    std::size_t length;
    std::uint32_t bits;
    /** The lowest character of this length; a lower one has a shorter sequence. */
    std::uint32_t least;
};

Lead leadOf(unsigned char byte) {
    if (byte >= 0xC2 && byte <= 0xDF) {
        return {2, byte & 0x1FU, 0x80};
    }
    if (byte >= 0xE0 && byte <= 0xEF) {
        return {3, byte & 0x0FU, 0x800};
    }
    if (byte >= 0xF0 && byte <= 0xF4) {
        return {4, byte & 0x07U, 0x10000};
    }
    return {0, 0, 0};
}

/** Whether a document may contain the character. */
bool isXmlCharacter(std::uint32_t code) {
    return code == '\t' || code == '\n' || code == '\r' || (code >= 0x20 && code <= 0xD7FF) ||
           (code >= 0xE000 && code <= 0xFFFD) || (code >= 0x10000 && code <= 0x10FFFF);
}

/**
 * The length of the UTF-8 sequence at `position`, in bytes; 0 if it is not valid, or if XML does not allow its
 * character.
 */
std::size_t characterLength(std::string_view text, std::size_t position) {
    const Lead lead = leadOf(byteAt(text, position));
    if (lead.length == 0 || text.size() - position < lead.length) {
        return 0;
    }
    std::uint32_t code = lead.bits;
    for (std::size_t i = 1; i < lead.length; ++i) {
        const unsigned char byte = byteAt(text, position + i);
        if ((byte & 0xC0U) != 0x80) {
            return 0;
        }
        code = (code << 6U) | (byte & 0x3FU);
    }
    return code >= lead.least && isXmlCharacter(code) ? lead.length : 0;
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
        } else if (const std::size_t valid = characterLength(text, position); valid != 0) {
            length = valid;
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

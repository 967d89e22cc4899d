/** The characters of XML, in UTF-8. */
#ifndef CIMXML_CHARACTERS_H
#define CIMXML_CHARACTERS_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** Bytes of which each is in it or not. */
class ByteSet {
public:
    template <class Predicate>
    explicit constexpr ByteSet(Predicate isIn) {
        for (std::size_t byte = 0; byte < _contains.size(); ++byte) {
            _contains[byte] = isIn(static_cast<unsigned char>(byte));
        }
    }

    static constexpr ByteSet of(std::string_view bytes) {
        return ByteSet(
            [bytes](unsigned char byte) { return bytes.find(static_cast<char>(byte)) != std::string_view::npos; });
    }

    constexpr bool contains(char byte) const { return _contains[static_cast<unsigned char>(byte)]; }

    /** The position of the first byte at or behind `position` that is in it, or the end of the text. */
    constexpr std::size_t firstIn(std::string_view text, std::size_t position) const {
        while (position < text.size() && !contains(text[position])) {
            ++position;
        }
        return position;
    }

    /** As `firstIn`, of the first byte that is not in it. */
    constexpr std::size_t firstNotIn(std::string_view text, std::size_t position) const {
        while (position < text.size() && contains(text[position])) {
            ++position;
        }
        return position;
    }

private:
    std::array<bool, 256> _contains{};
};

/** Whether a document may contain the character, literally or as a reference. */
bool isXmlCharacter(std::uint32_t code);

/** `characterLength` of what is a control character or none of ASCII's. */
std::size_t specialCharacterLength(std::string_view text, std::size_t position);

/** How many bytes the character at `position` has; 0 where there is none in UTF-8, or one that XML does not allow. */
inline std::size_t characterLength(std::string_view text, std::size_t position) {
    const auto byte = static_cast<unsigned char>(text[position]);
    return byte >= 0x20 && byte < 0x80 ? 1 : specialCharacterLength(text, position);
}

/* Append a text so that a reader of the document gets it back. What XML cannot say becomes U+FFFD. */

void appendText(std::string& document, std::string_view text);
/** For attribute values in double quotes. */
void appendAttributeText(std::string& document, std::string_view text);

} // namespace ObjectManager::CimXml

#endif

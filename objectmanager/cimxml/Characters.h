/** The characters of XML, in UTF-8. */
#ifndef CIMXML_CHARACTERS_H
#define CIMXML_CHARACTERS_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

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

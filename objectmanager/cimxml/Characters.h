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

/** How many bytes the character at `position` has; 0 where there is no UTF-8, or a character that XML does not allow.
 */
std::size_t characterLength(std::string_view text, std::size_t position);

/* Append a text so that a reader of the document gets it back. What XML cannot say becomes U+FFFD. */

void appendText(std::string& document, std::string_view text);
/** For attribute values in double quotes. */
void appendAttributeText(std::string& document, std::string_view text);

} // namespace ObjectManager::CimXml

#endif

/** Writes texts as characters of XML, in UTF-8. */
#ifndef CIMXML_CHARACTERS_H
#define CIMXML_CHARACTERS_H

#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/*
 * These append a text so that a reader of the document gets it back. Characters that XML does not allow become U+FFFD.
 */

void appendText(std::string& document, std::string_view text);
/** For attribute values in double quotes. */
void appendAttributeText(std::string& document, std::string_view text);

} // namespace ObjectManager::CimXml

#endif

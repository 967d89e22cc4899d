/** XML as it comes from the network. */
#ifndef CIMXML_MARKUP_H
#define CIMXML_MARKUP_H

#include <pugixml.hpp>

#include <cstddef>
#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** How many elements may stand within each other, and how many attributes an element may have. */
constexpr std::size_t maximumDepth = 100;
constexpr std::size_t maximumAttributes = 50;

/**
 * Reads a document. It is checked first for what the parser lets pass: that it is UTF-8 with the characters that XML
 * allows, has one root and matching tags, names no attribute twice, refers to no entity but the five of XML itself and
 * declares none.
 *
 * @throws ProtocolError where it is not well-formed, too deep, or in another encoding.
 */
void parseMarkup(std::string_view text, pugi::xml_document& document);

/** The text that stands in an element itself, white space included. */
std::string textOf(const pugi::xml_node& element);

/** The text without the white space at its ends. */
std::string_view trimmed(std::string_view text);

} // namespace ObjectManager::CimXml

#endif

/** Reads XML that comes from the network. */
#ifndef CIMXML_MARKUP_H
#define CIMXML_MARKUP_H

#include <cstddef>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ObjectManager::CimXml {

/* Limits for a document: nested elements, attributes of one element, elements altogether. */
constexpr std::size_t maximumDepth = 100;
constexpr std::size_t maximumAttributes = 50;
constexpr std::size_t maximumElements = 100'000;

/** An element of a document, with its content. */
struct XmlElement {
    std::string name;
    std::vector<std::pair<std::string, std::string>> attributes;
    /** The text of the element itself, without the text of its children; white space is included. */
    std::string text;
    std::vector<XmlElement> children;

    /** The value of an attribute; null if the element does not have it. */
    const std::string* attribute(std::string_view attributeName) const;
};

/**
 * Reads a document in UTF-8. @return its root. A document may name a document type, which is not read, and must not
 * declare anything; only XML's own five entities are allowed.
 *
 * @throws ProtocolError if the document is not well-formed, exceeds one of the limits above, or has another encoding.
 */
XmlElement parseMarkup(std::string_view text);

} // namespace ObjectManager::CimXml

#endif

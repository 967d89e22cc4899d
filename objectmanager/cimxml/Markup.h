/** XML as it comes from the network. */
#ifndef CIMXML_MARKUP_H
#define CIMXML_MARKUP_H

#include <cstddef>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ObjectManager::CimXml {

/* How much a document may have: elements within each other, attributes of one element, elements altogether. */
constexpr std::size_t maximumDepth = 100;
constexpr std::size_t maximumAttributes = 50;
constexpr std::size_t maximumElements = 100'000;

/** An element of a document, with everything that stands in it. */
struct XmlElement {
    std::string name;
    std::vector<std::pair<std::string, std::string>> attributes;
    /** The text that stands in the element itself and not in one of its children, white space included. */
    std::string text;
    std::vector<XmlElement> children;

    /** The value of an attribute; null where the element has no attribute of that name. */
    const std::string* attribute(std::string_view attributeName) const;
};

/**
 * Reads a document in UTF-8 and gives its root. A document may name a document type, of which nothing is read, and must
 * not declare anything; the only entities are the five of XML itself.
 *
 * @throws ProtocolError where the document is not well-formed, beyond one of the limits above, or in another encoding.
 */
XmlElement parseMarkup(std::string_view text);

} // namespace ObjectManager::CimXml

#endif

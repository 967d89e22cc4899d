#include "cimxml/Markup.h"

#include "cimxml/ProtocolError.h"
#include "model/Model.h"

#include <expat.h>

#include <algorithm>
#include <array>
#include <exception>
#include <limits>
#include <memory>
#include <new>

namespace ObjectManager::CimXml {

namespace {

constexpr std::array<std::string_view, 5> entities{"lt", "gt", "amp", "quot", "apos"};
constexpr const char* knownReference = "one of the five entities of XML or a reference to a character that it allows";

/** What is expected where expat reports an error. */
struct Expectation {
    XML_Error error;
    const char* expected;
};

constexpr Expectation expectations[] = {
    {XML_ERROR_SYNTAX, "the root, and at most one document type before it"},
    {XML_ERROR_INVALID_TOKEN, "what XML allows there"},
    {XML_ERROR_UNCLOSED_TOKEN, "the end of what begins there"},
    {XML_ERROR_PARTIAL_CHAR, "a whole character of UTF-8"},
    {XML_ERROR_DUPLICATE_ATTRIBUTE, "every attribute of an element once"},
    {XML_ERROR_JUNK_AFTER_DOC_ELEMENT, "nothing after the root"},
    {XML_ERROR_UNDEFINED_ENTITY, knownReference},
    {XML_ERROR_BAD_CHAR_REF, knownReference},
    {XML_ERROR_UNCLOSED_CDATA_SECTION, "the end of a CDATA section"},
    {XML_ERROR_MISPLACED_XML_PI, "the XML declaration at the beginning only"},
    {XML_ERROR_XML_DECL, "an XML declaration with a version"},
};

/** The text at a position, cut short, in the form in which messages quote it. */
std::string quoted(std::string_view text, std::size_t position) {
    if (position >= text.size()) {
        return "the end of the document";
    }
    constexpr std::size_t longest = 20;
    const std::string_view rest = text.substr(position, longest);
    const auto* const end = std::find_if(rest.begin(), rest.end(), [](char c) { return c < ' ' || c > '~'; });
    if (end != rest.begin()) {
        return '\'' + std::string(rest.begin(), end) + '\'';
    }
    constexpr std::string_view digits = "0123456789ABCDEF";
    const auto byte = static_cast<unsigned char>(rest.front());
    return std::string("the byte 0x") + digits[byte >> 4U] + digits[byte & 0xFU];
}

/** Builds the elements of a document out of expat's events. */
class Builder {
public:
    explicit Builder(std::string_view text) : _text(text), _parser(XML_ParserCreate("UTF-8"), XML_ParserFree) {
        if (_parser == nullptr) {
            throw std::bad_alloc();
        }
        XML_SetUserData(_parser.get(), this);
        XML_SetXmlDeclHandler(_parser.get(), onDeclaration);
        XML_SetStartDoctypeDeclHandler(_parser.get(), onDocumentType);
        XML_SetSkippedEntityHandler(_parser.get(), onSkippedEntity);
        XML_SetElementHandler(_parser.get(), onStart, onEnd);
        XML_SetCharacterDataHandler(_parser.get(), onText);
    }

    XmlElement build() {
        if (_text.size() > static_cast<std::size_t>(std::numeric_limits<int>::max())) {
            throw notWellFormed("the body is not XML: found " + std::to_string(_text.size()) + " bytes, expected less");
        }
        // Expat recognises UTF-16 even if it was told UTF-8. XML in UTF-16 contains zero bytes, XML in UTF-8 never
        // does.
        if (const std::size_t zero = _text.find('\0'); zero != std::string_view::npos) {
            throw malformed(zero, "found " + quoted(_text, zero) + ", expected a character of UTF-8 that XML allows");
        }
        const XML_Status status =
            XML_Parse(_parser.get(), _text.data(), static_cast<int>(_text.size()), /*isFinal=*/XML_TRUE);
        if (_failure) {
            std::rethrow_exception(_failure);
        }
        if (status != XML_STATUS_OK) {
            throw error();
        }
        return std::move(_root);
    }

private:
    /**
     * Runs the body of a handler. No exception may pass through expat, which is written in C: an exception is kept,
     * and thrown when the parser has stopped. Until it stops, expat may call more handlers.
     */
    template <typename Do>
    static void handle(void* self, Do doWith) {
        auto& builder = *static_cast<Builder*>(self);
        if (builder._failure) {
            return;
        }
        try {
            doWith(builder);
        } catch (...) {
            builder._failure = std::current_exception();
            XML_StopParser(builder._parser.get(), XML_FALSE);
        }
    }

    static void onDeclaration(void* self, const XML_Char*, const XML_Char* encoding, int) {
        handle(self, [&](Builder&) {
            if (encoding != nullptr && !equalNames(encoding, "utf-8") && !equalNames(encoding, "us-ascii")) {
                throw ProtocolError(Http::unsupportedMediaType, nullptr,
                                    std::string("found the encoding \"") + encoding + "\", expected utf-8");
            }
        });
    }

    static void onDocumentType(void* self, const XML_Char*, const XML_Char*, const XML_Char*, int declares) {
        handle(self, [&](Builder& builder) {
            if (declares != 0) {
                throw builder.malformed("found declarations in the document type, expected none");
            }
            builder._documentTypeSeen = true;
        });
    }

    /** Expat skips an entity that may be declared in an external document type; expat does not read these. */
    static void onSkippedEntity(void* self, const XML_Char* entity, int) {
        handle(self, [&](Builder& builder) { throw builder.unknownEntity(entity); });
    }

    static void onStart(void* self, const XML_Char* name, const XML_Char** attributes) {
        handle(self, [&](Builder& builder) { builder.start(name, attributes); });
    }

    static void onEnd(void* self, const XML_Char*) {
        handle(self, [](Builder& builder) { builder._open.pop_back(); });
    }

    static void onText(void* self, const XML_Char* text, int length) {
        handle(self,
               [&](Builder& builder) { builder._open.back()->text.append(text, static_cast<std::size_t>(length)); });
    }

    void start(const char* name, const char** attributes) {
        if (_open.size() == maximumDepth) {
            throw malformed("found more than " + std::to_string(maximumDepth) + " nested elements");
        }
        if (_count == maximumElements) {
            throw malformed("found more than " + std::to_string(maximumElements) + " elements");
        }
        ++_count;
        if (_documentTypeSeen) {
            checkEntitiesOfTag();
        }
        // The address of an open element does not change: its parent gets no other child while the element is open.
        XmlElement& element = _open.empty() ? _root : _open.back()->children.emplace_back();
        element.name = name;
        for (; *attributes != nullptr; attributes += 2) {
            if (element.attributes.size() == maximumAttributes) {
                throw malformed("found more than " + std::to_string(maximumAttributes) + " attributes");
            }
            element.attributes.emplace_back(attributes[0], attributes[1]);
        }
        _open.push_back(&element);
    }

    /** Finds unknown entities in the values of attributes: expat skips these without telling. */
    void checkEntitiesOfTag() const {
        const std::string_view tag =
            _text.substr(position(), static_cast<std::size_t>(XML_GetCurrentByteCount(_parser.get())));
        for (std::size_t found = tag.find('&'); found != std::string_view::npos; found = tag.find('&', found + 1)) {
            const std::string_view entity = tag.substr(found + 1, tag.find(';', found) - found - 1);
            if (!entity.starts_with('#') && std::find(entities.begin(), entities.end(), entity) == entities.end()) {
                throw unknownEntity(entity);
            }
        }
    }

    /** The parser's position in the text, in bytes. */
    std::size_t position() const {
        const XML_Index index = XML_GetCurrentByteIndex(_parser.get());
        return index < 0 ? 0 : static_cast<std::size_t>(index);
    }

    ProtocolError malformed(const std::string& message) const { return malformed(position(), message); }

    static ProtocolError malformed(std::size_t position, const std::string& message) {
        return notWellFormed("the body is not XML: at byte " + std::to_string(position + 1) + ", " + message);
    }

    ProtocolError unknownEntity(std::string_view entity) const {
        return malformed("found '&" + std::string(entity) + ";', expected " + knownReference);
    }

    /** The error that describes where and why expat stopped. */
    ProtocolError error() const {
        const XML_Error code = XML_GetErrorCode(_parser.get());
        if (code == XML_ERROR_NO_MEMORY) {
            throw std::bad_alloc();
        }
        const std::string found = "found " + quoted(_text, position()) + ", expected ";
        if (code == XML_ERROR_NO_ELEMENTS) {
            return malformed(found + (_open.empty() ? "an element" : "the end of the element " + _open.back()->name));
        }
        if (code == XML_ERROR_TAG_MISMATCH) {
            return malformed(found + "the end of the element " + _open.back()->name);
        }
        const auto* const known = std::find_if(std::begin(expectations), std::end(expectations),
                                               [&](const Expectation& entry) { return entry.error == code; });
        return malformed(known == std::end(expectations) ? std::string(XML_ErrorString(code))
                                                         : found + known->expected);
    }

    std::string_view _text;
    std::unique_ptr<XML_ParserStruct, decltype(&XML_ParserFree)> _parser;
    XmlElement _root;
    /** The elements that are open, outermost first. */
    std::vector<XmlElement*> _open;
    std::size_t _count = 0;
    bool _documentTypeSeen = false;
    /** The exception that a handler threw. */
    std::exception_ptr _failure;
};

} // namespace

const std::string* XmlElement::attribute(std::string_view attributeName) const {
    const auto found = std::find_if(attributes.begin(), attributes.end(),
                                    [&](const auto& attribute) { return attribute.first == attributeName; });
    return found == attributes.end() ? nullptr : &found->second;
}

XmlElement parseMarkup(std::string_view text) {
    return Builder(text).build();
}

} // namespace ObjectManager::CimXml

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

/** What would have been right where expat gives up with an error. */
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
    {XML_ERROR_JUNK_AFTER_DOC_ELEMENT, "nothing behind the root"},
    {XML_ERROR_UNDEFINED_ENTITY, knownReference},
    {XML_ERROR_BAD_CHAR_REF, knownReference},
    {XML_ERROR_UNCLOSED_CDATA_SECTION, "the end of a CDATA section"},
    {XML_ERROR_MISPLACED_XML_PI, "the XML declaration at the beginning only"},
    {XML_ERROR_XML_DECL, "an XML declaration with a version"},
};

/** What stands at a position of a text, cut short, as a message can quote it. */
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

/** Makes the elements of one document from what expat finds in it. */
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
            throw notWellFormed("the body is no XML: found " + std::to_string(_text.size()) + " bytes, expected less");
        }
        // Expat recognises UTF-16 whatever it is told. A document in it has zeros, which UTF-8 has for no character.
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
     * Does what a handler has to do. No exception may go through expat: it is kept until the parser has stopped, which
     * may call some handlers before it does.
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

    /** Expat passes over an entity that could be declared in a document type that it does not read. */
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
            throw malformed("found more than " + std::to_string(maximumDepth) + " elements within each other");
        }
        if (_count == maximumElements) {
            throw malformed("found more than " + std::to_string(maximumElements) + " elements");
        }
        ++_count;
        if (_documentTypeSeen) {
            checkEntitiesOfTag();
        }
        // An element that is open stays where it is: its parent gets no other child meanwhile.
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

    /** Of entities that expat passes over, it tells of none where they stand in an attribute's value. */
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

    /** Of what the parser is at. */
    std::size_t position() const {
        const XML_Index index = XML_GetCurrentByteIndex(_parser.get());
        return index < 0 ? 0 : static_cast<std::size_t>(index);
    }

    ProtocolError malformed(const std::string& message) const { return malformed(position(), message); }

    static ProtocolError malformed(std::size_t position, const std::string& message) {
        return notWellFormed("the body is no XML: at byte " + std::to_string(position + 1) + ", " + message);
    }

    ProtocolError unknownEntity(std::string_view entity) const {
        return malformed("found '&" + std::string(entity) + ";', expected " + knownReference);
    }

    /** What expat did not take, and why. */
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
    /** The elements that have begun and not ended. */
    std::vector<XmlElement*> _open;
    std::size_t _count = 0;
    bool _documentTypeSeen = false;
    /** What a handler threw. */
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

#include "cimxml/Markup.h"

#include "cimxml/Characters.h"
#include "cimxml/ProtocolError.h"
#include "model/Model.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <vector>

namespace ObjectManager::CimXml {

namespace {

constexpr std::string_view blanks = " \t\r\n";
constexpr ByteSet whiteSpace = ByteSet::of(blanks);
constexpr ByteSet behindNames = ByteSet::of(" \t\r\n/>=<&'\"");
/** What stands behind the '<' of everything but a start tag. */
constexpr ByteSet tagMarks = ByteSet::of("/!?");
/* What ends characters that stand for themselves. */
constexpr ByteSet behindText = ByteSet::of("<&");
constexpr ByteSet behindDoubleQuoted = ByteSet::of("<&\"");
constexpr ByteSet behindSingleQuoted = ByteSet::of("<&'");
constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";
constexpr std::array<std::string_view, 5> entities{"lt", "gt", "amp", "quot", "apos"};

/** Goes over a document once, from tag to tag. */
class Check {
public:
    explicit Check(std::string_view text) : _text(text) {}

    void run() {
        checkCharacters();
        declaration();
        while (_position < _text.size()) {
            if (_text[_position] == '<') {
                markup();
            } else if (_open.empty() && whiteSpace.contains(_text[_position])) {
                ++_position;
            } else {
                requireInside();
                characters(behindText);
            }
        }
        if (!_open.empty()) {
            fail("the end of the element " + std::string(_open.back()) + " is missing");
        }
        if (!_rootSeen) {
            fail("there is no element");
        }
    }

private:
    void checkCharacters() {
        for (std::size_t position = 0; position < _text.size();) {
            const std::size_t length = characterLength(_text, position);
            if (length == 0) {
                _position = position;
                fail("there is a byte that is not UTF-8, or a character that XML does not allow");
            }
            position += length;
        }
    }

    /** The XML declaration, of which only the encoding matters. */
    void declaration() {
        if (!_text.starts_with("<?xml") || _text.size() == 5 || !whiteSpace.contains(_text[5])) {
            return;
        }
        skipTo("?>", "the XML declaration");
        const std::string_view whole = _text.substr(0, _position);
        const std::size_t start = whole.find("encoding");
        const std::size_t quote = whole.find_first_of("'\"", start == std::string_view::npos ? whole.size() : start);
        if (quote != std::string_view::npos) {
            const std::string_view encoding = whole.substr(quote + 1, whole.find(whole[quote], quote + 1) - quote - 1);
            if (!equalNames(encoding, "utf-8") && !equalNames(encoding, "us-ascii")) {
                throw ProtocolError(Http::unsupportedMediaType, nullptr,
                                    "found the encoding \"" + std::string(encoding) + "\", expected utf-8");
            }
        }
    }

    void markup() {
        if (!tagMarks.contains(_position + 1 < _text.size() ? _text[_position + 1] : '\0')) {
            ++_position;
            startTag();
        } else if (accept("</")) {
            endTag();
        } else if (accept("<!--")) {
            skipTo("-->", "a comment");
        } else if (accept("<![CDATA[")) {
            requireInside();
            skipTo("]]>", "a CDATA section");
        } else if (accept("<?")) {
            skipTo("?>", "a processing instruction");
        } else if (accept("<!DOCTYPE")) {
            documentType();
        } else if (accept("<!")) {
            fail("found a declaration, expected none");
        }
    }

    /** A document type may be named. What it would declare here are entities, which nothing needs. */
    void documentType() {
        if (_rootSeen) {
            fail("found a document type, expected it before the root");
        }
        char quote = '\0';
        for (; _position < _text.size(); ++_position) {
            const char c = _text[_position];
            if (quote != '\0') {
                quote = c == quote ? '\0' : quote;
            } else if (c == '"' || c == '\'') {
                quote = c;
            } else if (c == '>') {
                ++_position;
                return;
            } else if (c == '[' || c == '<') {
                fail("found declarations in the document type, expected none");
            }
        }
        fail("the end of the document type is missing");
    }

    void startTag() {
        if (_open.empty() && _rootSeen) {
            fail("found a second root, expected one");
        }
        _rootSeen = true;
        const std::string_view element = name();
        if (_open.size() == maximumDepth) {
            fail("found more than " + std::to_string(maximumDepth) + " elements within each other");
        }
        _attributes.clear();
        while (true) {
            const bool separated = skipWhiteSpace();
            if (accept("/>")) {
                return;
            }
            if (accept(">")) {
                _open.push_back(element);
                return;
            }
            if (!separated) {
                fail("found no end of the tag " + std::string(element));
            }
            attribute();
        }
    }

    void attribute() {
        const std::string_view attributeName = name();
        if (std::find(_attributes.begin(), _attributes.end(), attributeName) != _attributes.end()) {
            fail("found the attribute " + std::string(attributeName) + " twice");
        }
        if (_attributes.size() == maximumAttributes) {
            fail("found more than " + std::to_string(maximumAttributes) + " attributes");
        }
        _attributes.push_back(attributeName);
        skipWhiteSpace();
        if (!accept("=")) {
            fail("found no '=' behind the attribute " + std::string(attributeName));
        }
        skipWhiteSpace();
        const char quote = peek();
        if (quote != '"' && quote != '\'') {
            fail("found no quote before the value of the attribute " + std::string(attributeName));
        }
        ++_position;
        characters(quote == '"' ? behindDoubleQuoted : behindSingleQuoted);
        if (peek() != quote) {
            fail("found no end of the value of the attribute " + std::string(attributeName));
        }
        ++_position;
    }

    void endTag() {
        const std::string_view element = name();
        skipWhiteSpace();
        const bool ended = accept(">");
        if (_open.empty() || _open.back() != element) {
            fail("found the end of " + std::string(element) + ", expected that of " +
                 (_open.empty() ? "nothing" : std::string(_open.back())));
        }
        if (!ended) {
            fail("found no '>' behind the end of " + std::string(element));
        }
        _open.pop_back();
    }

    /** Characters and references to some, up to what else is in `end`. */
    void characters(const ByteSet& end) {
        while ((_position = end.firstIn(_text, _position)) < _text.size() && accept("&")) {
            reference();
        }
    }

    void reference() {
        const std::string_view rest = _text.substr(_position);
        const std::size_t length = rest.find(';'); // far off, with any number of leading zeros
        const std::string_view entity = rest.substr(0, length);
        if (length == std::string_view::npos || !isKnown(entity)) {
            constexpr std::size_t longestQuoted = 10;
            const std::string_view quoted = entity.substr(0, longestQuoted);
            fail("found '&" + std::string(quoted.substr(0, quoted.find_first_of(blanks))) +
                 "', expected one of the five entities of XML or a reference to a character that it allows");
        }
        _position += length + 1;
    }

    static bool isKnown(std::string_view entity) {
        if (!entity.starts_with('#')) {
            return std::find(entities.begin(), entities.end(), entity) != entities.end();
        }
        const bool hexadecimal = entity.starts_with("#x");
        const std::string_view digits = entity.substr(hexadecimal ? 2 : 1);
        std::uint32_t code = 0;
        const auto [end, error] =
            std::from_chars(digits.data(), digits.data() + digits.size(), code, hexadecimal ? 16 : 10);
        return error == std::errc() && end == digits.data() + digits.size() && isXmlCharacter(code);
    }

    std::string_view name() {
        const std::size_t end = behindNames.firstIn(_text, _position);
        if (end == _position) {
            fail("found no name");
        }
        const std::string_view found = _text.substr(_position, end - _position);
        _position = end;
        return found;
    }

    bool skipWhiteSpace() {
        const std::size_t start = _position;
        _position = whiteSpace.firstNotIn(_text, _position);
        return _position != start;
    }

    void skipTo(std::string_view end, const std::string& what) {
        const std::size_t found = _text.find(end, _position);
        if (found == std::string_view::npos) {
            fail("the end of " + what + " is missing");
        }
        _position = found + end.size();
    }

    bool accept(std::string_view expected) {
        const bool there = _text.substr(_position).starts_with(expected);
        _position += there ? expected.size() : 0;
        return there;
    }

    char peek() const { return _position < _text.size() ? _text[_position] : '\0'; }

    void requireInside() {
        if (_open.empty()) {
            fail("found text outside the root");
        }
    }

    [[noreturn]] void fail(const std::string& message) const {
        throw notWellFormed("the body is no XML: at byte " + std::to_string(_position + 1) + ", " + message);
    }

    std::string_view _text;
    std::size_t _position = 0;
    /** The elements that have begun and not ended. */
    std::vector<std::string_view> _open;
    /** Of the tag that is being read. */
    std::vector<std::string_view> _attributes;
    bool _rootSeen = false;
};

} // namespace

void parseMarkup(std::string_view text, pugi::xml_document& document) {
    if (text.starts_with(byteOrderMark)) {
        text.remove_prefix(byteOrderMark.size());
    }
    Check(text).run();
    const pugi::xml_parse_result result = document.load_buffer(
        text.data(), text.size(), pugi::parse_default | pugi::parse_ws_pcdata, pugi::encoding_utf8);
    if (!result) {
        throw notWellFormed("the body is no XML: at byte " + std::to_string(result.offset + 1) + ", " +
                            result.description());
    }
}

std::string textOf(const pugi::xml_node& element) {
    std::string text;
    for (const pugi::xml_node& part : element) {
        if (part.type() == pugi::node_pcdata || part.type() == pugi::node_cdata) {
            text += part.value();
        }
    }
    return text;
}

std::string_view trimmed(std::string_view text) {
    const std::size_t start = whiteSpace.firstNotIn(text, 0);
    return text.substr(start, text.find_last_not_of(blanks) - start + 1);
}

} // namespace ObjectManager::CimXml

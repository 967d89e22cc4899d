#include "text/ObjectPathText.h"

#include "classes/Literals.h"
#include "text/MofText.h"

#include <fmt/format.h>

#include <algorithm>
#include <optional>
#include <utility>

namespace ObjectManager {

namespace {

bool isNameCharacter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_' ||
           static_cast<unsigned char>(c) >= 0x80;
}

class Parser {
public:
    Parser(std::string_view text, const Catalogue& catalogue, std::string_view defaultNameSpace)
        : _text(text), _catalogue(catalogue) {
        _path.nameSpace = defaultNameSpace;
    }

    ObjectPath parse() {
        host();
        nameSpace();
        _path.className = name("the name of a class");
        _class = _catalogue.find(_path.className);
        if (_class != nullptr) {
            _path.className = _class->name;
        }
        if (_position < _text.size()) {
            expect('.', "'.' and keys, or the end");
            do {
                key();
            } while (accept(','));
            if (_position < _text.size()) {
                fail(found(), "',' and another key, or the end");
            }
        }
        return std::move(_path);
    }

private:
    void host() {
        constexpr std::string_view slashes = "//";
        if (_text.starts_with(slashes)) {
            const std::size_t end = std::min(_text.find('/', slashes.size()), _text.size());
            _path.host = _text.substr(slashes.size(), end - slashes.size());
            _position = end;
            if (_path.host.empty() || end == _text.size()) {
                fail(found(), _path.host.empty() ? "a host name" : "'/' and a namespace");
            }
        }
        accept('/');
    }

    /** Reads a namespace: the text before the first colon, if only characters of a namespace stand before it. */
    void nameSpace() {
        const auto belongs = [](char c) { return isNameCharacter(c) || c == '/' || c == '-'; };
        const std::string_view rest = _text.substr(_position);
        const auto length =
            static_cast<std::size_t>(std::find_if_not(rest.begin(), rest.end(), belongs) - rest.begin());
        if (length < rest.size() && rest[length] == ':') {
            if (length == 0 || rest.front() == '/') {
                fail(found(), "a namespace");
            }
            _path.nameSpace = rest.substr(0, length);
            _position += length + 1;
        } else if (!_path.host.empty()) {
            _position += length;
            fail(found(), "':' behind the namespace");
        }
    }

    void key() {
        const std::size_t start = _position;
        const std::string keyName = name("the name of a key");
        const Property* declared = _class == nullptr ? nullptr : _class->property(keyName);
        const bool duplicate = find(_path.keys, keyName) != nullptr;
        if (duplicate || (_class != nullptr && (declared == nullptr || !declared->isKey()))) {
            _position = start;
            fail(fmt::format("'{}'", keyName),
                 duplicate ? "every key once" : fmt::format("a key of {}: {}", _class->name, keyNames()));
        }
        expect('=', fmt::format("'=' behind the key {}", keyName));
        _path.keys.push_back({declared == nullptr ? keyName : declared->name, value(declared)});
    }

    Value value(const Property* declared) {
        const char first = _position < _text.size() ? _text[_position] : '\0';
        if (first == '"' || first == '\'') {
            return quotedValue(declared);
        }
        const std::size_t start = _position;
        _position = std::min(_text.find(',', start), _text.size());
        const std::string_view word = _text.substr(start, _position - start);
        try {
            if (declared == nullptr) {
                if (auto untyped = valueOfUntypedText(word)) {
                    return std::move(*untyped);
                }
            } else if (isInteger(declared->type) || isReal(declared->type) || declared->type == CMPI_boolean) {
                return valueOfText(word, declared->type);
            }
        } catch (const LiteralError& error) {
            _position = start;
            fail(error);
        }
        _position = start;
        fail(word.empty() ? found() : fmt::format("'{}'", word),
             declared == nullptr
                 ? "a quoted text, a number, TRUE or FALSE (quotes must be kept from the shell)"
                 : fmt::format("a quoted {} (quotes must be kept from the shell)", typeName(declared->type)));
    }

    Value quotedValue(const Property* declared) {
        const std::size_t start = _position;
        const bool single = _text[start] == '\'';
        const CMPIType type = declared == nullptr ? CMPIType(single ? CMPI_char16 : CMPI_string) : declared->type;
        if (single != (type == CMPI_char16) || isInteger(type) || isReal(type) || type == CMPI_boolean) {
            fail(single ? "a text in single quotes" : "a quoted text",
                 fmt::format("a {}{}", typeName(type), type == CMPI_string ? " in double quotes" : ""));
        }
        try {
            const std::string text = readQuoted(_text, _position);
            if (type == CMPI_ref) {
                return referenceValue(parseObjectPath(text, _catalogue, _path.nameSpace));
            }
            return valueOfText(text, type);
        } catch (const ObjectPathError& error) {
            _position = start;
            fail(fmt::format("a quoted text that is no object path ({})", error.what()), "an object path");
        } catch (const LiteralError& error) {
            _position = start;
            fail(error);
        }
    }

    std::string keyNames() const {
        std::string names;
        for (const Property* key : _class->keys()) {
            names += (names.empty() ? "" : ", ") + key->name;
        }
        return names.empty() ? "none" : names;
    }

    std::string name(const char* expected) {
        const std::size_t start = _position;
        while (_position < _text.size() && isNameCharacter(_text[_position])) {
            ++_position;
        }
        if (_position == start || (_text[start] >= '0' && _text[start] <= '9')) {
            _position = start;
            fail(found(), expected);
        }
        return std::string(_text.substr(start, _position - start));
    }

    bool accept(char c) {
        const bool there = _position < _text.size() && _text[_position] == c;
        _position += there ? 1 : 0;
        return there;
    }

    void expect(char c, const std::string& expected) {
        if (!accept(c)) {
            fail(found(), expected);
        }
    }

    std::string found() const { return _position < _text.size() ? fmt::format("'{}'", _text[_position]) : "the end"; }

    [[noreturn]] void fail(const std::string& found, const std::string& expected) const {
        failWith(fmt::format("found {}, expected {}", found, expected));
    }

    [[noreturn]] void fail(const LiteralError& error) const { failWith(error.what()); }

    [[noreturn]] void failWith(const std::string& message) const {
        throw ObjectPathError(fmt::format("object path {}, position {}: {}", _text, _position + 1, message));
    }

    std::string_view _text;
    const Catalogue& _catalogue;
    std::size_t _position = 0;
    ObjectPath _path;
    const Class* _class = nullptr;
};

std::string format(const ObjectPath& path, bool withHosts);

/** The value in the form that it has in an object path's key. */
std::string keyText(const Value& value, bool withHosts) {
    const auto* reference = std::get_if<std::shared_ptr<const ObjectPath>>(&value.content);
    return reference == nullptr ? mofLiteral(value) : inQuotes(format(**reference, withHosts));
}

std::string format(const ObjectPath& path, bool withHosts) {
    std::string text = withHosts && !path.host.empty() ? "//" + path.host + "/" : "";
    text += path.nameSpace.empty() ? path.className : path.nameSpace + ":" + path.className;
    char separator = '.';
    for (const NamedValue& key : path.keys) {
        text += std::exchange(separator, ',') + key.name + '=' + keyText(key.value, withHosts);
    }
    return text;
}

} // namespace

ObjectPath parseObjectPath(std::string_view text, const Catalogue& catalogue, std::string_view defaultNameSpace) {
    return Parser(text, catalogue, defaultNameSpace).parse();
}

std::string formatObjectPath(const ObjectPath& path) {
    return format(path, true);
}

std::string formatLocalPath(const ObjectPath& path) {
    return format(path, false);
}

} // namespace ObjectManager

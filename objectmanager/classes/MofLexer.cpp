#include "classes/MofLexer.h"

#include "classes/Literals.h"

#include <algorithm>

namespace ObjectManager {

namespace {

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool isWordStart(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || static_cast<unsigned char>(c) >= 0x80;
}

bool isWord(char c) {
    return isWordStart(c) || isDigit(c);
}

bool isNumber(char c) {
    return isWord(c) || c == '.' || c == '+' || c == '-';
}

class Lexer {
public:
    Lexer(std::string_view text, std::string_view file) : _text(text), _file(file) {}

    std::vector<Token> tokens() {
        while (skipBlanks()) {
            if (_text[_position] == '#') {
                skipDirective();
            } else {
                append(next());
            }
        }
        append({Token::Kind::end, "", _line});
        return std::move(_tokens);
    }

private:
    /** Moves to the next token. @return whether there is one. */
    bool skipBlanks() {
        while (_position < _text.size()) {
            const std::string_view rest = _text.substr(_position);
            if (rest.starts_with("//")) {
                advance(std::min(rest.find('\n'), rest.size()));
            } else if (rest.starts_with("/*")) {
                const std::size_t end = rest.find("*/", 2);
                if (end == std::string_view::npos) {
                    fail("found no end of the comment that begins here, expected */");
                }
                advance(end + 2);
            } else if (const std::size_t blanks = std::min(rest.find_first_not_of(" \t\r\n\f"), rest.size())) {
                advance(blanks);
            } else {
                return true;
            }
        }
        return false;
    }

    /** Skips a compiler directive, "#pragma name(text)". */
    void skipDirective() {
        const std::size_t end = _text.find(')', _position);
        if (!_text.substr(_position).starts_with("#pragma") || end == std::string_view::npos) {
            fail("found '#', expected #pragma name(...)");
        }
        advance(end + 1 - _position);
    }

    Token next() {
        const char first = _text[_position];
        if (isWordStart(first)) {
            return take(Token::Kind::identifier, isWord);
        }
        const char second = _position + 1 < _text.size() ? _text[_position + 1] : '\0';
        if (isDigit(first) || ((first == '+' || first == '-' || first == '.') && (isDigit(second) || second == '.'))) {
            return take(Token::Kind::number, isNumber);
        }
        if (first == '"' || first == '\'') {
            return quotedToken(first == '"' ? Token::Kind::string : Token::Kind::character);
        }
        if (std::string_view("{}[]()<>,;:=$@").find(first) == std::string_view::npos) {
            fail(std::string("found '") + first + "', expected a token of MOF");
        }
        Token token{Token::Kind::punctuation, std::string(1, first), _line};
        advance(1);
        return token;
    }

    Token take(Token::Kind kind, bool (*belongs)(char)) {
        const auto* const start = _text.begin() + _position;
        const auto* const end = std::find_if_not(start, _text.end(), belongs);
        Token token{kind, std::string(start, end), _line};
        advance(token.text.size());
        return token;
    }

    Token quotedToken(Token::Kind kind) {
        Token token{kind, "", _line};
        std::size_t end = _position;
        try {
            token.text = readQuoted(_text, end);
        } catch (const LiteralError& error) {
            advance(error.position() - _position);
            fail(error.what());
        }
        advance(end - _position);
        return token;
    }

    void append(Token token) {
        if (token.kind == Token::Kind::string && !_tokens.empty() && _tokens.back().kind == Token::Kind::string) {
            _tokens.back().text += token.text;
        } else {
            _tokens.push_back(std::move(token));
        }
    }

    void advance(std::size_t count) {
        const auto* const start = _text.begin() + _position;
        _line += static_cast<std::size_t>(std::count(start, start + count, '\n'));
        _position += count;
    }

    [[noreturn]] void fail(const std::string& message) const { throw SchemaError(placeOf(_file, _line), message); }

    std::string_view _text;
    std::string_view _file;
    std::size_t _position = 0;
    std::size_t _line = 1;
    std::vector<Token> _tokens;
};

} // namespace

std::string placeOf(std::string_view file, std::size_t line) {
    return std::string(file) + ":" + std::to_string(line);
}

std::string describe(const Token& token) {
    switch (token.kind) {
    case Token::Kind::end:
        return "the end of the file";
    case Token::Kind::string:
        return "the string " + inQuotes(token.text);
    case Token::Kind::character:
        return "the character " + inQuotes(token.text, '\'');
    default:
        return "'" + token.text + "'";
    }
}

std::vector<Token> tokensOfMof(std::string_view text, std::string_view file) {
    return Lexer(text, file).tokens();
}

} // namespace ObjectManager

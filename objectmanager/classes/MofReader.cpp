#include "classes/MofReader.h"

#include "classes/Literals.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <utility>

namespace ObjectManager {

namespace {

/** A flavor, and the member of a qualifier type that it sets. */
struct Flavor {
    std::string_view name;
    bool QualifierType::*member;
    bool value;
};

constexpr Flavor flavors[] = {
    {"EnableOverride", &QualifierType::overridable, true}, {"DisableOverride", &QualifierType::overridable, false},
    {"ToSubclass", &QualifierType::toSubclass, true},      {"Restricted", &QualifierType::toSubclass, false},
    {"Translatable", &QualifierType::translatable, true},
};

class Parser {
public:
    Parser(std::string_view text, std::string_view file) : _file(file), _tokens(tokensOfMof(text, file)) {}

    Declarations declarations() {
        Declarations result;
        while (peek().kind != Token::Kind::end) {
            if (acceptWord("qualifier")) {
                result.qualifierTypes.push_back(qualifierType());
            } else {
                result.classes.push_back(classDeclaration());
            }
        }
        return result;
    }

private:
    /** Reads what follows the word Qualifier: "Name : type [] = default, Scope(...), Flavor(...);". */
    QualifierType qualifierType() {
        QualifierType declared;
        declared.place = placeOf(_file, peek().line);
        declared.name = identifier("the name of the qualifier type");
        expect(":", "':' and a type");
        const Token type = peek();
        const auto found = typeByName(identifier("the name of a type"));
        if (!found) {
            fail(type, "the name of a type");
        }
        declared.type = arrayBrackets(*found);
        declared.defaultValue = accept("=") ? initializer(declared.type) : nullValue(declared.type);
        while (accept(",")) {
            if (acceptWord("flavor")) {
                expect("(", "'(' and flavors");
                do {
                    flavor(declared);
                } while (accept(","));
            } else {
                expectWord("scope", "Scope(...) or Flavor(...)");
                expect("(", "'(' and scopes");
                do {
                    scope(declared);
                } while (accept(","));
            }
            expect(")", "',' or ')'");
        }
        expect(";", fmt::format("';' behind the qualifier type {}", declared.name));
        return declared;
    }

    void scope(QualifierType& declared) {
        const Token token = peek();
        const std::string name = identifier("a scope");
        const auto* const known = std::find_if(scopeNames.begin(), scopeNames.end(),
                                               [&](const ScopeName& entry) { return equalNames(entry.name, name); });
        if (known != scopeNames.end()) {
            declared.scopes |= known->scope;
        } else if (equalNames(name, "any")) {
            declared.scopes = anyScope;
        } else if (!equalNames(name, "schema") && !equalNames(name, "qualifier")) {
            fail(token, "class, association, reference, property, method, parameter, indication or any");
        }
    }

    void flavor(QualifierType& declared) {
        const Token token = peek();
        const std::string name = identifier("a flavor");
        const auto* const known = std::find_if(std::begin(flavors), std::end(flavors),
                                               [&](const Flavor& flavor) { return equalNames(flavor.name, name); });
        if (known == std::end(flavors)) {
            fail(token, "EnableOverride, DisableOverride, ToSubclass, Restricted or Translatable");
        }
        declared.*(known->member) = known->value;
    }

    Class classDeclaration() {
        Class declared;
        declared.qualifiers = qualifierList();
        declared.place = placeOf(_file, peek().line);
        expectWord("class", "the declaration of a class or of a qualifier type");
        declared.name = identifier("the name of the class");
        if (accept(":")) {
            declared.superClass = identifier("the name of the superclass");
        }
        expect("{", declared.superClass.empty() ? "':' and a superclass, or '{'" : "'{'");
        while (!accept("}")) {
            feature(declared);
        }
        expect(";", "';' behind the class declaration");
        return declared;
    }

    /** Reads a property, a reference or a method. */
    void feature(Class& declared) {
        Element element = typedElement("a property, a method or '}'");
        if (accept("(")) {
            declared.methods.push_back(method(std::move(element)));
            return;
        }
        if (declared.property(element.name) != nullptr) {
            failBefore(fmt::format("a second property {} of {}", element.name, declared.name), "every name once");
        }
        Property property{std::move(element), {}};
        property.type = arrayBrackets(property.type);
        property.defaultValue = accept("=") ? initializer(property.type) : nullValue(property.type);
        expect(";", fmt::format("';' behind the property {}", property.name));
        declared.properties.push_back(std::move(property));
    }

    Method method(Element element) {
        Method result{std::move(element), {}};
        if (!accept(")")) {
            do {
                Parameter parameter{typedElement("a parameter")};
                parameter.type = arrayBrackets(parameter.type);
                result.parameters.push_back(std::move(parameter));
            } while (accept(","));
            expect(")", "',' or ')' behind a parameter");
        }
        expect(";", fmt::format("';' behind the method {}", result.name));
        return result;
    }

    /** Reads the qualifiers, the type and the name of an element. */
    Element typedElement(const char* expected) {
        Element element;
        element.qualifiers = qualifierList();
        const Token type = peek();
        const std::string name = identifier(expected);
        if (acceptWord("ref")) {
            element.type = CMPI_ref;
            element.referenceClass = name;
        } else if (const auto found = typeByName(name)) {
            element.type = *found;
        } else {
            fail(type, "the name of a type, or of a class and REF");
        }
        element.name = identifier("a name");
        return element;
    }

    /** The type; the array type of it if brackets follow. */
    CMPIType arrayBrackets(CMPIType type) {
        if (!accept("[")) {
            return type;
        }
        if (peek().kind == Token::Kind::number) {
            ++_next;
        }
        expect("]", "']'");
        return static_cast<CMPIType>(type | CMPI_ARRAY);
    }

    Qualifiers qualifierList() {
        Qualifiers result;
        if (!accept("[")) {
            return result;
        }
        do {
            const std::string name = identifier("the name of a qualifier");
            result.push_back({name, qualifierValue()});
            if (accept(":")) {
                do {
                    identifier("a flavor");
                } while (peek().kind == Token::Kind::identifier);
            }
        } while (accept(","));
        expect("]", "',' or ']' behind a qualifier");
        return result;
    }

    Value qualifierValue() {
        if (accept("(")) {
            Value value = untypedLiteral();
            expect(")", "')'");
            return value;
        }
        return peekIs("{") ? untypedArray() : booleanValue(true);
    }

    Value untypedArray() {
        expect("{", "'{'");
        Value::Array elements;
        if (!accept("}")) {
            do {
                const Token& token = peek();
                elements.push_back(untypedLiteral());
                if (elements.back().type != elements.front().type) {
                    fail(token, fmt::format("a {} like the elements before", typeName(elements.front().type)));
                }
            } while (accept(","));
            expect("}", "',' or '}' behind an element");
        }
        const CMPIType type = elements.empty() ? CMPIType{CMPI_string} : elements.front().type;
        return arrayValue(type, std::move(elements));
    }

    /** Reads a literal whose type is not declared. */
    Value untypedLiteral() {
        const Token& token = peek();
        ++_next;
        if (token.kind == Token::Kind::string) {
            return stringValue(token.text);
        }
        if (token.kind == Token::Kind::character) {
            return characterOf(token);
        }
        if (isNull(token)) {
            return nullValue(CMPI_null);
        }
        const bool plain = token.kind == Token::Kind::identifier || token.kind == Token::Kind::number;
        if (auto value = plain ? valueOfUntypedText(token.text) : std::nullopt) {
            return std::move(*value);
        }
        fail(token, "a string, a character, a number, TRUE, FALSE or NULL");
    }

    Value initializer(CMPIType type) {
        const auto elementType = static_cast<CMPIType>(type & ~CMPI_ARRAY);
        if (isNull(peek())) {
            ++_next;
            return nullValue(type);
        }
        if ((type & CMPI_ARRAY) == 0) {
            return literal(type);
        }
        expect("{", "'{' and the elements of the array, or NULL");
        Value::Array elements;
        if (!accept("}")) {
            do {
                elements.push_back(literal(elementType));
            } while (accept(","));
            expect("}", "',' or '}' behind an element");
        }
        return arrayValue(elementType, std::move(elements));
    }

    /** Reads a literal of a declared type. */
    Value literal(CMPIType type) {
        const Token& token = peek();
        ++_next;
        const bool quotedType = type == CMPI_string || type == CMPI_dateTime;
        const Token::Kind expected = quotedType                        ? Token::Kind::string
                                     : type == CMPI_char16             ? Token::Kind::character
                                     : isInteger(type) || isReal(type) ? Token::Kind::number
                                                                       : Token::Kind::identifier;
        if (token.kind != expected || type == CMPI_ref) {
            fail(token, type == CMPI_ref ? "NULL" : fmt::format("a {}", typeName(type)));
        }
        try {
            return valueOfText(token.text, type);
        } catch (const LiteralError& error) {
            throw SchemaError(placeOf(_file, token.line), error.what());
        }
    }

    Value characterOf(const Token& token) {
        try {
            return valueOfText(token.text, CMPI_char16);
        } catch (const LiteralError& error) {
            throw SchemaError(placeOf(_file, token.line), error.what());
        }
    }

    static bool isNull(const Token& token) {
        return token.kind == Token::Kind::identifier && equalNames(token.text, "null");
    }

    const Token& peek() const { return _tokens[_next]; }

    bool peekIs(std::string_view punctuation) const {
        return peek().kind == Token::Kind::punctuation && peek().text == punctuation;
    }

    bool accept(std::string_view punctuation) {
        const bool found = peekIs(punctuation);
        _next += found ? 1 : 0;
        return found;
    }

    void expect(std::string_view punctuation, const std::string& expected) {
        if (!accept(punctuation)) {
            fail(peek(), expected);
        }
    }

    bool acceptWord(std::string_view word) {
        const bool found = peek().kind == Token::Kind::identifier && equalNames(peek().text, word);
        _next += found ? 1 : 0;
        return found;
    }

    void expectWord(std::string_view word, const std::string& expected) {
        if (!acceptWord(word)) {
            fail(peek(), expected);
        }
    }

    std::string identifier(const std::string& expected) {
        if (peek().kind != Token::Kind::identifier) {
            fail(peek(), expected);
        }
        return _tokens[_next++].text;
    }

    [[noreturn]] void fail(const Token& token, const std::string& expected) const {
        throw SchemaError(placeOf(_file, token.line), fmt::format("found {}, expected {}", describe(token), expected));
    }

    /** Fails because of `found`, which ends in the line of the token before the next one. */
    [[noreturn]] void failBefore(const std::string& found, const std::string& expected) const {
        throw SchemaError(placeOf(_file, _tokens[_next - 1].line),
                          fmt::format("found {}, expected {}", found, expected));
    }

    std::string_view _file;
    std::vector<Token> _tokens;
    std::size_t _next = 0;
};

} // namespace

Declarations readMof(std::string_view text, std::string_view file) {
    return Parser(text, file).declarations();
}

} // namespace ObjectManager

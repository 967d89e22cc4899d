#include "cimxml/Query.h"

#include "classes/Literals.h"
#include "model/CimError.h"
#include "model/DateTime.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <compare>
#include <cstddef>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

constexpr std::array<std::string_view, 4> languages{"WQL", "CIM:WQL", "DMTF:CQL", "CIM:CQL"};

/** Words that begin a feature of the languages that the server does not have. */
constexpr std::array<std::string_view, 15> otherFeatures{"LIKE",   "ISA",   "JOIN",  "ORDER",   "GROUP",
                                                         "HAVING", "FIRST", "COUNT", "WITHIN",  "EVERY",
                                                         "ANY",    "IN",    "AS",    "BETWEEN", "DISTINCT"};

struct OperatorName {
    std::string_view text;
    Comparison::Operator comparedBy;
};

constexpr std::array<OperatorName, 7> operators{{{"=", Comparison::Operator::equal},
                                                 {"<>", Comparison::Operator::notEqual},
                                                 {"!=", Comparison::Operator::notEqual},
                                                 {"<=", Comparison::Operator::lessOrEqual},
                                                 {">=", Comparison::Operator::greaterOrEqual},
                                                 {"<", Comparison::Operator::less},
                                                 {">", Comparison::Operator::greater}}};

/* Limits for a query: nested conditions, and comparisons altogether. */
constexpr std::size_t maximumDepth = 50;
constexpr std::size_t maximumComparisons = 1000;

struct Token {
    enum class Kind { word, number, text, sign, end };

    Kind kind = Kind::end;
    std::string text;
};

std::string describe(const Token& token) {
    return token.kind == Token::Kind::end ? "the end" : '\'' + token.text + '\'';
}

CimError invalid(const std::string& found, const std::string& expected) {
    return {CMPI_RC_ERR_INVALID_QUERY, "found " + found + " in the query, expected " + expected};
}

bool isWordCharacter(char c) {
    return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '_' || static_cast<unsigned char>(c) >= 0x80;
}

class Lexer {
public:
    explicit Lexer(std::string_view text) : _text(text) {}

    Token next() {
        _position = std::min(_text.find_first_not_of(" \t\r\n", _position), _text.size());
        if (_position == _text.size()) {
            return {};
        }
        const char c = _text[_position];
        if (c == '\'' || c == '"') {
            return quoted(c);
        }
        if (std::isdigit(static_cast<unsigned char>(c)) != 0 || c == '-' || c == '+') {
            return number();
        }
        if (isWordCharacter(c)) {
            const std::size_t start = _position;
            while (_position < _text.size() && isWordCharacter(_text[_position])) {
                ++_position;
            }
            return {Token::Kind::word, std::string(_text.substr(start, _position - start))};
        }
        return sign();
    }

private:
    /** Reads a text in quotes. A quote after a backslash, or a doubled quote, is part of the text. */
    Token quoted(char quote) {
        std::string text;
        for (++_position; _position < _text.size(); ++_position) {
            const char c = _text[_position];
            const bool more = _position + 1 < _text.size();
            if (c == quote && !(more && _text[_position + 1] == quote)) {
                ++_position;
                return {Token::Kind::text, text};
            }
            if (more &&
                (c == quote || (c == '\\' && (_text[_position + 1] == quote || _text[_position + 1] == '\\')))) {
                ++_position;
            }
            text += _text[_position];
        }
        throw invalid("the end", std::string(1, quote) + " after the text");
    }

    Token number() {
        const std::size_t start = _position++;
        while (_position < _text.size() &&
               (isWordCharacter(_text[_position]) || _text[_position] == '.' ||
                ((_text[_position] == '-' || _text[_position] == '+') && std::tolower(_text[_position - 1]) == 'e'))) {
            ++_position;
        }
        return {Token::Kind::number, std::string(_text.substr(start, _position - start))};
    }

    Token sign() {
        const std::string_view rest = _text.substr(_position);
        const auto* const known = std::find_if(operators.begin(), operators.end(),
                                               [&](const OperatorName& name) { return rest.starts_with(name.text); });
        const std::size_t length = known == operators.end() ? 1 : known->text.size();
        _position += length;
        return {Token::Kind::sign, std::string(rest.substr(0, length))};
    }

    std::string_view _text;
    std::size_t _position = 0;
};

class Parser {
public:
    explicit Parser(std::string_view text) : _lexer(text), _token(_lexer.next()) {}

    Query query() {
        Query query;
        expectWord("SELECT");
        if (!acceptSign("*")) {
            query.properties.emplace();
            do {
                query.properties->push_back(property());
            } while (acceptSign(","));
        }
        expectWord("FROM");
        query.className = name("a class");
        if (_token.kind == Token::Kind::sign && _token.text == ",") {
            throw unsupported("FROM " + query.className + ',');
        }
        if (acceptWord("WHERE")) {
            query.condition = anyOf(0);
        }
        if (_token.kind != Token::Kind::end) {
            fail(query.condition ? "AND, OR or the end" : "WHERE or the end");
        }
        for (const std::string& qualifier : _classes) {
            if (!equalNames(qualifier, query.className)) {
                throw invalid("a property of " + qualifier, "properties of " + query.className);
            }
        }
        return query;
    }

private:
    Condition anyOf(std::size_t depth) { return list(depth, "OR", Condition::Kind::any); }

    /** Reads operands that are joined by a word, AND or OR. A single operand is returned as it is. */
    Condition list(std::size_t depth, std::string_view word, Condition::Kind kind) {
        Condition whole{kind};
        do {
            whole.operands.push_back(kind == Condition::Kind::any ? list(depth, "AND", Condition::Kind::all)
                                                                  : negatable(depth));
        } while (acceptWord(word));
        if (whole.operands.size() > 1) {
            return whole;
        }
        Condition only = std::move(whole.operands.front());
        return only;
    }

    Condition negatable(std::size_t depth) {
        if (depth == maximumDepth) {
            fail("at most " + std::to_string(maximumDepth) + " nested conditions");
        }
        if (acceptWord("NOT")) {
            Condition negated{Condition::Kind::none};
            negated.operands.push_back(negatable(depth + 1));
            return negated;
        }
        if (acceptSign("(")) {
            Condition inner = anyOf(depth + 1);
            if (!acceptSign(")")) {
                fail("AND, OR or ')'");
            }
            return inner;
        }
        return comparison();
    }

    Condition comparison() {
        if (++_comparisons > maximumComparisons) {
            fail("at most " + std::to_string(maximumComparisons) + " comparisons");
        }
        Comparison comparison;
        comparison.property = property();
        if (acceptWord("IS")) {
            const bool negated = acceptWord("NOT");
            expectWord("NULL");
            comparison.comparedBy = Comparison::Operator::isNull;
            Condition condition{Condition::Kind::comparison, {}, std::move(comparison)};
            if (!negated) {
                return condition;
            }
            Condition negation{Condition::Kind::none};
            negation.operands.push_back(std::move(condition));
            return negation;
        }
        const auto* const known = std::find_if(operators.begin(), operators.end(), [&](const OperatorName& name) {
            return _token.kind == Token::Kind::sign && _token.text == name.text;
        });
        if (known == operators.end()) {
            fail("=, <>, <, <=, >, >= or IS");
        }
        advance();
        comparison.comparedBy = known->comparedBy;
        comparison.literal = literal();
        return {Condition::Kind::comparison, {}, std::move(comparison)};
    }

    Value literal() {
        const Token token = _token;
        advance();
        if (token.kind == Token::Kind::text) {
            return stringValue(token.text);
        }
        const bool plain = token.kind == Token::Kind::number || token.kind == Token::Kind::word;
        const std::optional<Value> value = plain ? valueOfUntypedText(token.text) : std::nullopt;
        if (!value) {
            throw invalid(describe(token), "a text in quotes, a number, TRUE or FALSE");
        }
        return *value;
    }

    /** Reads the name of a property, with or without the class in front of it. */
    std::string property() {
        std::string found = name("a property");
        if (acceptSign(".")) {
            _classes.push_back(std::move(found));
            found = name("a property");
        }
        return found;
    }

    std::string name(const std::string& expected) {
        if (_token.kind != Token::Kind::word) {
            fail(expected);
        }
        std::string found = _token.text;
        advance();
        if (_token.kind == Token::Kind::sign && _token.text == "(") {
            throw unsupported(found + '(');
        }
        return found;
    }

    bool acceptWord(std::string_view word) {
        const bool found = _token.kind == Token::Kind::word && equalNames(_token.text, word);
        if (found) {
            advance();
        }
        return found;
    }

    void expectWord(std::string_view word) {
        if (!acceptWord(word)) {
            fail(std::string(word));
        }
    }

    bool acceptSign(std::string_view sign) {
        const bool found = _token.kind == Token::Kind::sign && _token.text == sign;
        if (found) {
            advance();
        }
        return found;
    }

    void advance() { _token = _lexer.next(); }

    static CimError unsupported(const std::string& feature) {
        return {CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED,
                "found '" + feature +
                    "' in the query, expected no more than SELECT properties FROM one class WHERE comparisons"};
    }

    [[noreturn]] void fail(const std::string& expected) const {
        if (_token.kind == Token::Kind::word &&
            std::any_of(otherFeatures.begin(), otherFeatures.end(),
                        [&](std::string_view feature) { return equalNames(feature, _token.text); })) {
            throw unsupported(_token.text);
        }
        throw invalid(describe(_token), expected);
    }

    Lexer _lexer;
    Token _token;
    std::size_t _comparisons = 0;
    /** The class names that stand before names of properties. */
    std::vector<std::string> _classes;
};

template <typename Do>
void forEachComparison(const Condition& condition, const Do& doWith) {
    if (condition.kind == Condition::Kind::comparison) {
        doWith(condition.comparison);
    }
    for (const Condition& operand : condition.operands) {
        forEachComparison(operand, doWith);
    }
}

bool isNumber(CMPIType type) {
    return isInteger(type) || isReal(type);
}

bool isText(CMPIType type) {
    return type == CMPI_string || type == CMPI_char16;
}

/** Whether a property can be compared with the literal. Booleans can only be equal or not. */
bool isComparable(CMPIType type, const Comparison& comparison) {
    const CMPIType literal = comparison.literal.type;
    if (type == CMPI_boolean && literal == CMPI_boolean) {
        return comparison.comparedBy == Comparison::Operator::equal ||
               comparison.comparedBy == Comparison::Operator::notEqual;
    }
    if (type == CMPI_dateTime && literal == CMPI_string) {
        return parseDateTime(std::get<std::string>(comparison.literal.content)).has_value();
    }
    return (isNumber(type) && isNumber(literal)) || (isText(type) && literal == CMPI_string);
}

double realOf(const Value& value) {
    if (const auto* natural = std::get_if<std::uint64_t>(&value.content)) {
        return static_cast<double>(*natural);
    }
    if (const auto* integer = std::get_if<std::int64_t>(&value.content)) {
        return static_cast<double>(*integer);
    }
    return std::get<double>(value.content);
}

/** Compares integers exactly, also a signed with an unsigned one. */
std::partial_ordering compareNumbers(const Value& left, const Value& right) {
    const auto sign = [](const Value& value) {
        const auto* integer = std::get_if<std::int64_t>(&value.content);
        return integer != nullptr && *integer < 0;
    };
    const auto magnitude = [](const Value& value) {
        const auto* natural = std::get_if<std::uint64_t>(&value.content);
        return natural != nullptr ? *natural : static_cast<std::uint64_t>(std::get<std::int64_t>(value.content));
    };
    if (std::holds_alternative<double>(left.content) || std::holds_alternative<double>(right.content)) {
        return realOf(left) <=> realOf(right);
    }
    if (sign(left) != sign(right)) {
        return sign(left) ? std::partial_ordering::less : std::partial_ordering::greater;
    }
    // As unsigned numbers, negative numbers keep their order.
    return magnitude(left) <=> magnitude(right);
}

/** A point in time and an interval cannot be compared. */
std::partial_ordering compareTimes(const std::string& left, const std::string& right) {
    const auto leftTime = parseDateTime(left);
    const auto rightTime = parseDateTime(right);
    return leftTime && rightTime && leftTime->interval == rightTime->interval
               ? leftTime->microseconds <=> rightTime->microseconds
               : std::partial_ordering::unordered;
}

std::partial_ordering compare(const Value& value, const Value& literal) {
    if (const auto* truth = std::get_if<bool>(&value.content)) {
        return *truth == std::get<bool>(literal.content) ? std::partial_ordering::equivalent
                                                         : std::partial_ordering::unordered;
    }
    if (const auto* text = std::get_if<std::string>(&value.content)) {
        const auto& other = std::get<std::string>(literal.content);
        return value.type == CMPI_dateTime ? compareTimes(*text, other) : *text <=> other;
    }
    if (const auto* character = std::get_if<char16_t>(&value.content)) {
        return utf8(*character) <=> std::get<std::string>(literal.content);
    }
    return compareNumbers(value, literal);
}

bool holds(std::partial_ordering order, Comparison::Operator comparedBy) {
    switch (comparedBy) {
    case Comparison::Operator::equal:
        return std::is_eq(order);
    case Comparison::Operator::notEqual:
        return std::is_neq(order);
    case Comparison::Operator::less:
        return std::is_lt(order);
    case Comparison::Operator::lessOrEqual:
        return std::is_lteq(order);
    case Comparison::Operator::greater:
        return std::is_gt(order);
    default:
        return std::is_gteq(order);
    }
}

/** No value if the condition is neither true nor false. */
std::optional<bool> evaluate(const Condition& condition, const Instance& instance) {
    if (condition.kind == Condition::Kind::comparison) {
        const Comparison& comparison = condition.comparison;
        const NamedValue* property = find(instance.properties, comparison.property);
        const bool isNull = property == nullptr || property->value.isNull();
        if (comparison.comparedBy == Comparison::Operator::isNull) {
            return isNull;
        }
        // A provider may return another type than the class declares.
        if (isNull || !isComparable(property->value.type, comparison)) {
            return std::nullopt;
        }
        return holds(compare(property->value, comparison.literal), comparison.comparedBy);
    }
    if (condition.kind == Condition::Kind::none) {
        const std::optional<bool> operand = evaluate(condition.operands.front(), instance);
        return operand ? std::optional(!*operand) : std::nullopt;
    }
    // One true operand makes OR true, and one false operand makes AND false; otherwise an unknown operand leaves the
    // result unknown.
    const bool deciding = condition.kind == Condition::Kind::any;
    std::optional<bool> whole = !deciding;
    for (const Condition& operand : condition.operands) {
        const std::optional<bool> value = evaluate(operand, instance);
        if (value == deciding) {
            return deciding;
        }
        if (!value) {
            whole.reset();
        }
    }
    return whole;
}

const Property& propertyOf(const Class& declared, const std::string& name) {
    const Property* property = declared.property(name);
    if (property == nullptr) {
        throw invalid("the property " + name, "properties of " + declared.name);
    }
    return *property;
}

} // namespace

std::vector<std::string> Query::compared() const {
    std::vector<std::string> names;
    if (condition) {
        forEachComparison(*condition, [&](const Comparison& comparison) { names.push_back(comparison.property); });
    }
    return names;
}

Query parseQuery(const std::string& text, std::string_view language) {
    if (std::none_of(languages.begin(), languages.end(),
                     [&](std::string_view known) { return equalNames(known, language); })) {
        throw CimError(CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED,
                       "found the query language \"" + std::string(language) + "\", expected WQL or DMTF:CQL");
    }
    return Parser(text).query();
}

void checkQuery(const Query& query, const Class& declared) {
    if (query.properties) {
        for (const std::string& name : *query.properties) {
            propertyOf(declared, name);
        }
    }
    if (query.condition) {
        forEachComparison(*query.condition, [&](const Comparison& comparison) {
            const Property& property = propertyOf(declared, comparison.property);
            if (comparison.comparedBy != Comparison::Operator::isNull && !isComparable(property.type, comparison)) {
                throw invalid("a comparison of " + property.name + " with a " + typeName(comparison.literal.type),
                              "what can be compared with a " + typeName(property.type) + " in this way");
            }
        });
    }
}

bool matches(const Query& query, const Instance& instance) {
    return !query.condition || evaluate(*query.condition, instance).value_or(false);
}

} // namespace ObjectManager::CimXml

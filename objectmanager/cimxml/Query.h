/** Queries for instances of one class, in the part that WQL and the CIM Query Language (DSP0202) have in common. */
#ifndef CIMXML_QUERY_H
#define CIMXML_QUERY_H

#include "classes/Class.h"
#include "model/Model.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::CimXml {

/** The comparison of a property with a literal. */
struct Comparison {
    enum class Operator { equal, notEqual, less, lessOrEqual, greater, greaterOrEqual, isNull };

    std::string property;
    Operator comparedBy = Operator::equal;
    /** A string, a boolean, an sint64, a uint64 or a real64; null with isNull. */
    Value literal;
};

struct Condition {
    enum class Kind { all, any, none, comparison };

    Kind kind = Kind::all;
    /** The operands of `all`, `any` and `none`; `none` has one. */
    std::vector<Condition> operands{};
    Comparison comparison{};
};

struct Query {
    std::string className;
    /** The properties to return; no value for all. */
    std::optional<std::vector<std::string>> properties;
    std::optional<Condition> condition;

    /** The properties that the condition compares. */
    std::vector<std::string> compared() const;
};

/**
 * Reads "SELECT * | name, ... FROM class [WHERE condition]". A condition consists of comparisons (=, <>, !=, <, <=, >,
 * >=, IS [NOT] NULL) of a property with a literal, AND, OR, NOT and parentheses. The class may stand before a name.
 *
 * @throws CimError with CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED if the language is another one or the text uses other
 *         parts of it, with CMPI_RC_ERR_INVALID_QUERY if the text is not a query.
 */
Query parseQuery(const std::string& text, std::string_view language);

/**
 * Checks a query against its class. @throws CimError with CMPI_RC_ERR_INVALID_QUERY if the class lacks a property of
 *         the query, or the type of a property does not allow the comparison.
 */
void checkQuery(const Query& query, const Class& declared);

/**
 * Whether the instance meets the query's condition. A comparison with a property without a value is neither true nor
 * false, nor is its negation. The query has been checked with the instance's class or an ancestor.
 */
bool matches(const Query& query, const Instance& instance);

} // namespace ObjectManager::CimXml

#endif

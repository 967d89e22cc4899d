/** Queries of the instances of one class: what WQL and the CIM Query Language (DSP0202) have in common. */
#ifndef CIMXML_QUERY_H
#define CIMXML_QUERY_H

#include "classes/Class.h"
#include "model/Model.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::CimXml {

/** What a property is compared with. */
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
    /** Of all, any and none; none has one. */
    std::vector<Condition> operands{};
    Comparison comparison{};
};

struct Query {
    std::string className;
    /** The properties to give; nothing means all. */
    std::optional<std::vector<std::string>> properties;
    std::optional<Condition> condition;

    /** The properties whose values are needed to tell whether an instance matches. */
    std::vector<std::string> compared() const;
};

/**
 * Reads "SELECT * | name, ... FROM class [WHERE condition]". A condition has comparisons (=, <>, !=, <, <=, >, >=, IS
 * [NOT] NULL) of a property with a literal, AND, OR, NOT and parentheses. A name may have the class before it.
 *
 * @throws CimError with CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED where the language is none of the two or the text uses
 *         more of it, with CMPI_RC_ERR_INVALID_QUERY where the text is no query.
 */
Query parseQuery(const std::string& text, std::string_view language);

/**
 * @throws CimError with CMPI_RC_ERR_INVALID_QUERY where the class lacks a property of the query, or has it in a type
 *         that cannot be compared as the query wants.
 */
void checkQuery(const Query& query, const Class& declared);

/**
 * Whether the instance meets the query's condition. A comparison with a property without a value is neither true nor
 * false, nor is its negation. The query has been checked with the instance's class or an ancestor.
 */
bool matches(const Query& query, const Instance& instance);

} // namespace ObjectManager::CimXml

#endif

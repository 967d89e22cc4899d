#include "classes/Class.h"

#include "classes/Literals.h"

#include <algorithm>
#include <cstdint>
#include <utility>
#include <variant>

namespace ObjectManager {

namespace {

/** The elements of a qualifier that is an array of strings; none if there is no such qualifier. */
std::vector<std::string> textsOf(const Qualifiers& qualifiers, std::string_view name) {
    std::vector<std::string> texts;
    const NamedValue* qualifier = find(qualifiers, name);
    const auto* array = qualifier == nullptr ? nullptr : std::get_if<Value::Array>(&qualifier->value.content);
    if (array != nullptr) {
        for (const Value& element : *array) {
            const auto* text = std::get_if<std::string>(&element.content);
            texts.push_back(text == nullptr ? std::string() : *text);
        }
    }
    return texts;
}

/** A signed or unsigned integer. */
using Integer = std::variant<std::uint64_t, std::int64_t>;

std::optional<Integer> integerOf(const Value& value) {
    if (const auto* number = std::get_if<std::uint64_t>(&value.content)) {
        return *number;
    }
    if (const auto* number = std::get_if<std::int64_t>(&value.content)) {
        return *number;
    }
    return std::nullopt;
}

std::optional<Integer> integerOf(std::string_view text) {
    const auto value = valueOfUntypedText(text);
    return value ? integerOf(*value) : std::nullopt;
}

bool isAtMost(const Integer& left, const Integer& right) {
    return std::visit([](auto low, auto high) { return std::cmp_less_equal(low, high); }, left, right);
}

constexpr std::string_view range = "..";

/** Whether an entry of a ValueMap ("5", "7..4095", "..3", "32768..") covers the value. */
bool covers(const std::string& entry, const Value& value) {
    if (const auto* text = std::get_if<std::string>(&value.content)) {
        return entry == *text;
    }
    const auto number = integerOf(value);
    const std::size_t dots = entry.find(range);
    if (!number || entry == range) {
        return false;
    }
    if (dots == std::string::npos) {
        const auto only = integerOf(entry);
        return only && isAtMost(*only, *number) && isAtMost(*number, *only);
    }
    const auto low = integerOf(entry.substr(0, dots));
    const auto high = integerOf(entry.substr(dots + range.size()));
    return (!low || isAtMost(*low, *number)) && (!high || isAtMost(*number, *high));
}

} // namespace

bool hasFlag(const Qualifiers& qualifiers, std::string_view name) {
    const NamedValue* qualifier = find(qualifiers, name);
    return qualifier != nullptr && qualifier->value == booleanValue(true);
}

std::optional<std::string> meaning(const Element& element, const Value& value) {
    const std::vector<std::string> texts = textsOf(element.qualifiers, "Values");
    const std::vector<std::string> map = textsOf(element.qualifiers, "ValueMap");
    if (value.isNull() || texts.size() != map.size()) {
        return std::nullopt;
    }
    auto entry = std::find_if(map.begin(), map.end(), [&](const std::string& e) { return covers(e, value); });
    if (entry == map.end()) {
        // ".." alone stands for every number that no other entry covers.
        entry = integerOf(value) ? std::find(map.begin(), map.end(), range) : map.end();
    }
    return entry == map.end() ? std::nullopt : std::optional(texts[static_cast<std::size_t>(entry - map.begin())]);
}

bool Element::isDeclaredBy(const Class& owner) const {
    return declaredBy == owner.name;
}

bool Parameter::isIn() const {
    return find(qualifiers, "In") == nullptr || hasFlag(qualifiers, "In");
}

const Property* Class::property(std::string_view propertyName) const {
    return findElement(properties, propertyName);
}

const Method* Class::method(std::string_view methodName) const {
    return findElement(methods, methodName);
}

std::vector<const Property*> Class::keys() const {
    std::vector<const Property*> result;
    for (const Property& property : properties) {
        if (property.isKey()) {
            result.push_back(&property);
        }
    }
    return result;
}

} // namespace ObjectManager

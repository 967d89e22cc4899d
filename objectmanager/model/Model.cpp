#include "model/Model.h"

#include <algorithm>
#include <functional>
#include <numeric>
#include <utility>

namespace ObjectManager {

namespace {

/** Converts ASCII letters only, since the process's locale must not decide which CIM names are equal. */
char lower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

bool alike(char left, char right) {
    return left == right || lower(left) == lower(right);
}

Value typed(CMPIType type, Value::Content content) {
    return Value{type, std::move(content)};
}

std::size_t combined(std::size_t left, std::size_t right) {
    constexpr std::size_t multiplier = 31;
    return left * multiplier + right;
}

std::size_t hashOfName(std::string_view name) {
    return std::accumulate(name.begin(), name.end(), std::size_t{0}, [](std::size_t hash, char c) {
        return combined(hash, static_cast<unsigned char>(lower(c)));
    });
}

/** The hash of a value's content. Values of different types may have the same hash. */
struct HashOfContent {
    std::size_t operator()(std::monostate) const { return 0; }
    std::size_t operator()(const std::shared_ptr<const ObjectPath>& path) const { return ObjectPathHash()(*path); }
    std::size_t operator()(const std::shared_ptr<const Instance>& instance) const {
        return ObjectPathHash()(instance->path);
    }
    std::size_t operator()(const Value::Array& array) const { return array.size(); }
    template <typename T>
    std::size_t operator()(const T& scalar) const {
        return std::hash<T>()(scalar);
    }
};

} // namespace

bool equalNames(std::string_view left, std::string_view right) {
    // Most equal names have the same letter case, too, and the exact comparison is the faster one.
    return left.size() == right.size() && (left == right || std::equal(left.begin(), left.end(), right.begin(), alike));
}

bool NameLess::operator()(std::string_view left, std::string_view right) const {
    const auto [inLeft, inRight] = std::mismatch(left.begin(), left.end(), right.begin(), right.end(), alike);
    return inRight != right.end() && (inLeft == left.end() || lower(*inLeft) < lower(*inRight));
}

bool operator==(const Value& left, const Value& right) {
    if (left.type != right.type || left.content.index() != right.content.index()) {
        return false;
    }
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&left.content)) {
        return **path == *std::get<std::shared_ptr<const ObjectPath>>(right.content);
    }
    if (const auto* instance = std::get_if<std::shared_ptr<const Instance>>(&left.content)) {
        const auto& other = std::get<std::shared_ptr<const Instance>>(right.content);
        const auto same = [](const NamedValue& a, const NamedValue& b) {
            return equalNames(a.name, b.name) && a.value == b.value;
        };
        return (*instance)->path == other->path &&
               std::equal((*instance)->properties.begin(), (*instance)->properties.end(), other->properties.begin(),
                          other->properties.end(), same);
    }
    return left.content == right.content;
}

Value nullValue(CMPIType type) {
    return typed(type, std::monostate{});
}

Value booleanValue(bool value) {
    return typed(CMPI_boolean, value);
}

Value unsignedValue(CMPIType type, std::uint64_t value) {
    return typed(type, value);
}

Value signedValue(CMPIType type, std::int64_t value) {
    return typed(type, value);
}

Value realValue(CMPIType type, double value) {
    return typed(type, value);
}

Value stringValue(std::string value) {
    return typed(CMPI_string, std::move(value));
}

Value dateTimeValue(std::string value) {
    return typed(CMPI_dateTime, std::move(value));
}

Value referenceValue(ObjectPath value) {
    return typed(CMPI_ref, std::make_shared<const ObjectPath>(std::move(value)));
}

Value arrayValue(CMPIType elementType, Value::Array elements) {
    return typed(static_cast<CMPIType>(elementType | CMPI_ARRAY), std::move(elements));
}

const NamedValue* find(const std::vector<NamedValue>& values, std::string_view name) {
    const auto found =
        std::find_if(values.begin(), values.end(), [&](const NamedValue& v) { return equalNames(v.name, name); });
    return found == values.end() ? nullptr : &*found;
}

NamedValue* find(std::vector<NamedValue>& values, std::string_view name) {
    return const_cast<NamedValue*>(find(std::as_const(values), name));
}

bool operator==(const ObjectPath& left, const ObjectPath& right) {
    if (!equalNames(left.className, right.className) || !equalNames(left.nameSpace, right.nameSpace) ||
        left.keys.size() != right.keys.size()) {
        return false;
    }
    return std::all_of(left.keys.begin(), left.keys.end(), [&](const NamedValue& key) {
        const NamedValue* other = find(right.keys, key.name);
        return other != nullptr && other->value == key.value;
    });
}

std::size_t ObjectPathHash::operator()(const ObjectPath& path) const {
    std::size_t keys = 0; // a sum does not depend on the order of the keys
    for (const NamedValue& key : path.keys) {
        keys += combined(hashOfName(key.name), std::visit(HashOfContent(), key.value.content));
    }
    return combined(combined(hashOfName(path.nameSpace), hashOfName(path.className)), keys);
}

} // namespace ObjectManager

#include "model/Model.h"

#include <algorithm>
#include <functional>
#include <numeric>
#include <utility>

namespace ObjectManager {

namespace {

/** ASCII letters only: CIM names are compared without regard to the process's locale. */
char lower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

bool alike(char left, char right) {
    return left == right || lower(left) == lower(right);
}

/** Makes `to`, which is null, what `from` is, in the memory of the allocator. */
template <typename From>
void place(Value::Content& to, From&& from, Allocator allocator) {
    const auto placeHeld = [&]<typename Held>(Held&& held) {
        using Kind = std::remove_cvref_t<Held>;
        if constexpr (std::uses_allocator_v<Kind, Allocator>) {
            to.emplace<Kind>(std::forward<Held>(held), allocator);
        } else {
            to.emplace<Kind>(held);
        }
    };
    std::visit(placeHeld, std::forward<From>(from));
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
    std::size_t operator()(const Box<ObjectPath>& path) const { return ObjectPathHash()(*path); }
    std::size_t operator()(const Box<Instance>& instance) const { return ObjectPathHash()(instance->path); }
    std::size_t operator()(const Value::Array& array) const { return array.size(); }
    template <typename T>
    std::size_t operator()(const T& scalar) const {
        return std::hash<T>()(scalar);
    }
};

} // namespace

bool equalNames(std::string_view left, std::string_view right) {
    // Most names that are the same are also written in the same letter case.
    return left.size() == right.size() && (left == right || std::equal(left.begin(), left.end(), right.begin(), alike));
}

bool NameLess::operator()(std::string_view left, std::string_view right) const {
    const auto [inLeft, inRight] = std::mismatch(left.begin(), left.end(), right.begin(), right.end(), alike);
    return inRight != right.end() && (inLeft == left.end() || lower(*inLeft) < lower(*inRight));
}

Value::Value(const Value& other) = default;
Value::Value(Value&& other) noexcept = default;
Value& Value::operator=(const Value& other) = default;
Value& Value::operator=(Value&& other) = default;
Value::~Value() = default;

Value::Value(CMPIType valueType, Content valueContent, Allocator allocator) : type(valueType) {
    place(content, std::move(valueContent), allocator);
}

Value::Value(const Value& other, Allocator allocator) : type(other.type) {
    place(content, other.content, allocator);
}

Value::Value(Value&& other, Allocator allocator) : type(other.type) {
    place(content, std::move(other.content), allocator);
}

bool operator==(const Value& left, const Value& right) {
    return left.type == right.type && left.content == right.content;
}

Value nullValue(CMPIType type) {
    return Value(type, std::monostate{});
}

Value booleanValue(bool value) {
    return Value(CMPI_boolean, value);
}

Value unsignedValue(CMPIType type, std::uint64_t value) {
    return Value(type, value);
}

Value signedValue(CMPIType type, std::int64_t value) {
    return Value(type, value);
}

Value realValue(CMPIType type, double value) {
    return Value(type, value);
}

Value stringValue(std::string_view value) {
    return Value(CMPI_string, Text(value));
}

Value dateTimeValue(std::string_view value) {
    return Value(CMPI_dateTime, Text(value));
}

Value referenceValue(ObjectPath value) {
    return Value(CMPI_ref, Box<ObjectPath>(std::move(value)));
}

Value instanceValue(Instance value) {
    return Value(CMPI_instance, Box<Instance>(std::move(value)));
}

Value arrayValue(CMPIType elementType, Value::Array elements) {
    return Value(static_cast<CMPIType>(elementType | CMPI_ARRAY), std::move(elements));
}

bool operator==(const NamedValue& left, const NamedValue& right) {
    return equalNames(left.name, right.name) && left.value == right.value;
}

const NamedValue* find(std::span<const NamedValue> values, std::string_view name) {
    const auto found =
        std::find_if(values.begin(), values.end(), [&](const NamedValue& v) { return equalNames(v.name, name); });
    return found == values.end() ? nullptr : &*found;
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
    std::size_t keys = 0; // a sum, which does not depend on their order
    for (const NamedValue& key : path.keys) {
        keys += combined(hashOfName(key.name), std::visit(HashOfContent(), key.value.content));
    }
    return combined(combined(hashOfName(path.nameSpace), hashOfName(path.className)), keys);
}

bool operator==(const Instance& left, const Instance& right) {
    return left.path == right.path && left.properties == right.properties;
}

} // namespace ObjectManager

/**
 * CIM objects as plain values: what the object manager stores, compares, prints and hands to clients. Everything here
 * is owned by value and can be copied, moved and compared; nothing knows of CMPI's function tables.
 *
 * A value lies in the memory of its allocator, by default the heap. A copy lies in the heap unless it is made with
 * another allocator; a moved value stays in its memory. Code that outlives the memory of a value may therefore read and
 * copy the value, but not move it: such code is given constant values.
 */
#ifndef OBJECTMANAGER_MODEL_H
#define OBJECTMANAGER_MODEL_H

#include "cmpidt.h"

#include <cstdint>
#include <memory>
#include <memory_resource>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

namespace ObjectManager {

/** Whether two CIM names (of namespaces, classes, properties, keys, methods) are the same: letter case is ignored. */
bool equalNames(std::string_view left, std::string_view right);

/** Orders CIM names, letter case ignored. */
struct NameLess {
    using is_transparent = void;
    bool operator()(std::string_view left, std::string_view right) const;
};

/** Names the memory in which a value lies. */
using Allocator = std::pmr::polymorphic_allocator<>;
using Text = std::pmr::string;

/** Owns one object, so that a value can hold an object that holds values. Empty only once it was moved from. */
template <typename T>
class Box {
public:
    using allocator_type = Allocator;

    explicit Box(const T& object, Allocator allocator = {})
        : _allocator(allocator), _object(_allocator.new_object<T>(object)) {}
    explicit Box(T&& object, Allocator allocator = {})
        : _allocator(allocator), _object(_allocator.new_object<T>(std::move(object))) {}
    Box(const Box& other) : Box(other, Allocator()) {}
    Box(const Box& other, Allocator allocator) : _allocator(allocator), _object(_allocator.new_object<T>(*other)) {}
    Box(Box&& other) noexcept : _allocator(other._allocator), _object(std::exchange(other._object, nullptr)) {}
    Box(Box&& other, Allocator allocator)
        : _allocator(allocator), _object(allocator == other._allocator ? std::exchange(other._object, nullptr)
                                                                       : _allocator.new_object<T>(*other)) {}
    Box& operator=(const Box& other) { return *this = Box(other, _allocator); }
    Box& operator=(Box&& other) {
        Box taken(std::move(other), _allocator);
        std::swap(_object, taken._object);
        return *this;
    }
    ~Box() {
        if (_object != nullptr) {
            _allocator.delete_object(_object);
        }
    }

    const T& operator*() const { return *_object; }
    const T* operator->() const { return _object; }

    friend bool operator==(const Box& left, const Box& right) { return *left == *right; }

private:
    Allocator _allocator;
    T* _object;
};

struct ObjectPath;
struct Instance;

/**
 * A typed CIM value, which may be null.
 *
 * `type` is a CMPI type code, CMPI_ARRAY included where the value is an array; text is always CMPI_string, a date a
 * CMPI_dateTime whose content is the 25 characters of DSP0004. The content's alternative follows from the type.
 *
 * A value that needs no memory, a number for example, has no allocator. To a value that lies in other memory than the
 * heap, therefore, only a value may be assigned that was made in the same memory and is moved.
 */
struct Value {
    using allocator_type = Allocator;
    using Array = std::pmr::vector<Value>;
    using Content = std::variant<std::monostate, bool, char16_t, std::uint64_t, std::int64_t, double, Text,
                                 Box<ObjectPath>, Box<Instance>, Array>;

    CMPIType type = CMPI_null;
    /** std::monostate where the value is null. */
    Content content;

    Value() = default;
    /** A null value. */
    explicit Value(Allocator /*allocator*/) {}
    Value(CMPIType valueType, Content valueContent) : type(valueType), content(std::move(valueContent)) {}
    Value(CMPIType valueType, Content valueContent, Allocator allocator);
    Value(const Value& other);
    Value(const Value& other, Allocator allocator);
    Value(Value&& other) noexcept;
    Value(Value&& other, Allocator allocator);
    Value& operator=(const Value& other);
    Value& operator=(Value&& other);
    ~Value();

    bool isNull() const { return std::holds_alternative<std::monostate>(content); }
};

/** Equal types and contents; text and names in references as `ObjectPath` compares them. */
bool operator==(const Value& left, const Value& right);

Value nullValue(CMPIType type);
Value booleanValue(bool value);
/** `type` is one of CMPI_uint8 to CMPI_uint64. */
Value unsignedValue(CMPIType type, std::uint64_t value);
/** `type` is one of CMPI_sint8 to CMPI_sint64. */
Value signedValue(CMPIType type, std::int64_t value);
/** `type` is CMPI_real32 or CMPI_real64. */
Value realValue(CMPIType type, double value);
Value stringValue(std::string_view value);
/** `value` is a date or interval in the 25-character form of DSP0004. */
Value dateTimeValue(std::string_view value);
Value referenceValue(ObjectPath value);
Value instanceValue(Instance value);
/** `elementType` is the type of every element, without CMPI_ARRAY. */
Value arrayValue(CMPIType elementType, Value::Array elements);

/** A value under a name: a key binding, a property, an argument. */
struct NamedValue {
    using allocator_type = Allocator;

    Text name;
    Value value;

    NamedValue() = default;
    NamedValue(std::string_view valueName, Value&& named, Allocator allocator = {})
        : name(valueName, allocator), value(std::move(named), allocator) {}
    NamedValue(std::string_view valueName, const Value& named, Allocator allocator = {})
        : name(valueName, allocator), value(named, allocator) {}
    NamedValue(const NamedValue& other) = default;
    NamedValue(const NamedValue& other, Allocator allocator)
        : name(other.name, allocator), value(other.value, allocator) {}
    NamedValue(NamedValue&& other) = default;
    NamedValue(NamedValue&& other, Allocator allocator)
        : name(std::move(other.name), allocator), value(std::move(other.value), allocator) {}
    NamedValue& operator=(const NamedValue& other) = default;
    NamedValue& operator=(NamedValue&& other) = default;
    ~NamedValue() = default;
};

/** Equal names, letter case ignored, and values. */
bool operator==(const NamedValue& left, const NamedValue& right);

using NamedValues = std::pmr::vector<NamedValue>;

/** The element called `name`, letter case ignored, or null. */
const NamedValue* find(std::span<const NamedValue> values, std::string_view name);

/** Names an instance, or a class where it has no keys. Key bindings are kept in the order in which they were added. */
struct ObjectPath {
    using allocator_type = Allocator;

    Text host;
    /** Without a leading slash, for example "root/cimv2". */
    Text nameSpace;
    Text className;
    NamedValues keys;

    ObjectPath() = default;
    explicit ObjectPath(Allocator allocator)
        : host(allocator), nameSpace(allocator), className(allocator), keys(allocator) {}
    ObjectPath(std::string_view itsHost, std::string_view itsNameSpace, std::string_view itsClassName,
               NamedValues itsKeys = {})
        : host(itsHost), nameSpace(itsNameSpace), className(itsClassName), keys(std::move(itsKeys)) {}
    ObjectPath(const ObjectPath& other) = default;
    ObjectPath(const ObjectPath& other, Allocator allocator)
        : host(other.host, allocator), nameSpace(other.nameSpace, allocator), className(other.className, allocator),
          keys(other.keys, allocator) {}
    ObjectPath(ObjectPath&& other) = default;
    ObjectPath(ObjectPath&& other, Allocator allocator)
        : host(std::move(other.host), allocator), nameSpace(std::move(other.nameSpace), allocator),
          className(std::move(other.className), allocator), keys(std::move(other.keys), allocator) {}
    ObjectPath& operator=(const ObjectPath& other) = default;
    ObjectPath& operator=(ObjectPath&& other) = default;
    ~ObjectPath() = default;
};

/**
 * Whether two paths name the same object: class name, namespace and the names of keys without regard to letter case,
 * the keys' values exactly, their order not at all. Host names are not compared.
 */
bool operator==(const ObjectPath& left, const ObjectPath& right);

/** Equal paths have equal hashes. */
struct ObjectPathHash {
    std::size_t operator()(const ObjectPath& path) const;
};

struct Instance {
    using allocator_type = Allocator;

    ObjectPath path;
    /** In the order in which they were set. */
    NamedValues properties;

    Instance() = default;
    explicit Instance(Allocator allocator) : path(allocator), properties(allocator) {}
    Instance(ObjectPath itsPath, NamedValues itsProperties)
        : path(std::move(itsPath)), properties(std::move(itsProperties)) {}
    Instance(const Instance& other) = default;
    Instance(const Instance& other, Allocator allocator)
        : path(other.path, allocator), properties(other.properties, allocator) {}
    Instance(Instance&& other) = default;
    Instance(Instance&& other, Allocator allocator)
        : path(std::move(other.path), allocator), properties(std::move(other.properties), allocator) {}
    Instance& operator=(const Instance& other) = default;
    Instance& operator=(Instance&& other) = default;
    ~Instance() = default;
};

/** Equal paths, and equal properties in the same order. */
bool operator==(const Instance& left, const Instance& right);

} // namespace ObjectManager

#endif

/**
 * CIM objects as plain values, which the object manager stores, compares, prints and sends to clients. Each value owns
 * its parts, and can be copied and moved. No value depends on CMPI's function tables.
 */
#ifndef MODEL_MODEL_H
#define MODEL_MODEL_H

#include "cmpidt.h"

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace ObjectManager {

/**
 * Whether two CIM names (of namespaces, classes, properties, keys or methods) are equal. The case of ASCII letters is
 * ignored (DSP0004).
 */
bool equalNames(std::string_view left, std::string_view right);

/** Orders CIM names; `equalNames` says which of them are equal. */
struct NameLess {
    using is_transparent = void;
    bool operator()(std::string_view left, std::string_view right) const;
};

struct ObjectPath;
struct Instance;

/**
 * A CIM value with its type; the value may be null.
 *
 * The type decides which alternative `content` has: bool for CMPI_boolean, char16_t for CMPI_char16, std::uint64_t and
 * std::int64_t for the unsigned and signed integers, double for both real types, std::string for CMPI_string and for
 * CMPI_dateTime (the 25 characters of DSP0004), an object path for CMPI_ref, an instance for CMPI_instance, and
 * Array for a type that includes CMPI_ARRAY. No value has the type CMPI_chars.
 */
struct Value {
    using Array = std::vector<Value>;
    /** Copies of a value share its object path or instance, which never changes. */
    using Content = std::variant<std::monostate, bool, char16_t, std::uint64_t, std::int64_t, double, std::string,
                                 std::shared_ptr<const ObjectPath>, std::shared_ptr<const Instance>, Array>;

    /** A type code of CMPI. A null value has a type, too. */
    CMPIType type = CMPI_null;
    /** std::monostate if the value is null. */
    Content content;

    bool isNull() const { return std::holds_alternative<std::monostate>(content); }
};

/**
 * Whether two values have the same type and equal contents. Strings are compared exactly, references as object paths,
 * and embedded instances by their paths and their properties, whose order matters.
 */
bool operator==(const Value& left, const Value& right);

/* These functions make values. */

Value nullValue(CMPIType type);
Value booleanValue(bool value);
/** `type` is one of CMPI_uint8 to CMPI_uint64. */
Value unsignedValue(CMPIType type, std::uint64_t value);
/** `type` is one of CMPI_sint8 to CMPI_sint64. */
Value signedValue(CMPIType type, std::int64_t value);
/** `type` is CMPI_real32 or CMPI_real64. */
Value realValue(CMPIType type, double value);
Value stringValue(std::string value);
/** `value` is a time or an interval in the form of 25 characters of DSP0004. It is not checked. */
Value dateTimeValue(std::string value);
Value referenceValue(ObjectPath value);
/** `elementType` is the type that all elements have; it does not include CMPI_ARRAY. */
Value arrayValue(CMPIType elementType, Value::Array elements);

/** A value with a name: a key binding, a property or an argument. */
struct NamedValue {
    std::string name;
    Value value;
};

/** The first of `values` whose name equals `name` (`equalNames`); null if there is none. */
const NamedValue* find(const std::vector<NamedValue>& values, std::string_view name);
NamedValue* find(std::vector<NamedValue>& values, std::string_view name);

/** The name of an instance or, if it has no keys, of a class (DSP0004). */
struct ObjectPath {
    /** Empty if the path does not name a host. */
    std::string host;
    /** Without a leading slash, for example "root/cimv2". */
    std::string nameSpace;
    std::string className;
    /** The key bindings, in the order in which they were added. */
    std::vector<NamedValue> keys;
};

/**
 * Whether two paths name the same object: their class names, their namespaces and the names of their keys are equal
 * (`equalNames`), and so are the values of the keys. The order of keys and the host names do not matter.
 */
bool operator==(const ObjectPath& left, const ObjectPath& right);

/** A hash function for object paths; equal paths have equal hashes. */
struct ObjectPathHash {
    std::size_t operator()(const ObjectPath& path) const;
};

struct Instance {
    ObjectPath path;
    /** The properties, in the order in which they were set. */
    std::vector<NamedValue> properties;
};

} // namespace ObjectManager

#endif

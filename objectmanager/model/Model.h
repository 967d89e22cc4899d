/**
 * CIM objects as plain values: what the object manager stores, compares, prints and hands to clients. Everything here
 * is owned by value and can be copied, moved and compared; nothing knows of CMPI's function tables.
 */
#ifndef OBJECTMANAGER_MODEL_H
#define OBJECTMANAGER_MODEL_H

#include "cmpidt.h"

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
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

struct ObjectPath;
struct Instance;

/**
 * A typed CIM value, which may be null.
 *
 * `type` is a CMPI type code, CMPI_ARRAY included where the value is an array; text is always CMPI_string, a date a
 * CMPI_dateTime whose content is the 25 characters of DSP0004. The content's alternative follows from the type.
 */
struct Value {
    using Array = std::vector<Value>;
    /** Object paths and instances are shared because they are never changed once they are values. */
    using Content = std::variant<std::monostate, bool, char16_t, std::uint64_t, std::int64_t, double, std::string,
                                 std::shared_ptr<const ObjectPath>, std::shared_ptr<const Instance>, Array>;

    CMPIType type = CMPI_null;
    /** std::monostate where the value is null. */
    Content content;

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
Value stringValue(std::string value);
/** `value` is a date or interval in the 25-character form of DSP0004. */
Value dateTimeValue(std::string value);
Value referenceValue(ObjectPath value);
/** `elementType` is the type of every element, without CMPI_ARRAY. */
Value arrayValue(CMPIType elementType, Value::Array elements);

/** A value under a name: a key binding, a property, an argument. */
struct NamedValue {
    std::string name;
    Value value;
};

/** The element called `name`, letter case ignored, or null. */
const NamedValue* find(const std::vector<NamedValue>& values, std::string_view name);
NamedValue* find(std::vector<NamedValue>& values, std::string_view name);

/** Names an instance, or a class where it has no keys. Key bindings are kept in the order in which they were added. */
struct ObjectPath {
    std::string host;
    /** Without a leading slash, for example "root/cimv2". */
    std::string nameSpace;
    std::string className;
    std::vector<NamedValue> keys;
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
    ObjectPath path;
    /** In the order in which they were set. */
    std::vector<NamedValue> properties;
};

} // namespace ObjectManager

#endif

/**
 * Class declarations: what an object manager knows of a class beside its provider.
 */
#ifndef CLASSES_CLASS_H
#define CLASSES_CLASS_H

#include "model/Model.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** Qualifiers by name. One without a value is TRUE; numbers are sint64, uint64 or real64. */
using Qualifiers = std::vector<NamedValue>;

/** Whether the boolean qualifier `name` is there and TRUE. */
bool hasFlag(const Qualifiers& qualifiers, std::string_view name);

struct Class;

/** What a property, a parameter and a method's return value have in common. */
struct Element {
    std::string name;
    /** CMPI_ARRAY included where it is an array. */
    CMPIType type = CMPI_null;
    /** The class that is referred to, where the type is CMPI_ref. */
    std::string referenceClass;
    Qualifiers qualifiers;
    /* In a catalogue: the class that declared the element first, and the one whose declaration this is. They differ
       where the element was overridden; a parameter has neither. */
    std::string origin;
    std::string declaredBy;

    bool isDeclaredBy(const Class& owner) const;
};

/**
 * What a value of the element means by its qualifiers ValueMap and Values.
 *
 * @param value no array; of an array element, one of its elements.
 * @return nothing where the element has no such qualifiers or they do not speak of the value.
 */
std::optional<std::string> meaning(const Element& element, const Value& value);

struct Property : Element {
    /** Null where the declaration has none. */
    Value defaultValue;

    bool isKey() const { return hasFlag(qualifiers, "Key"); }
};

struct Parameter : Element {
    /** A parameter is an input unless its qualifier says otherwise. */
    bool isIn() const;
    bool isOut() const { return hasFlag(qualifiers, "Out"); }
};

/** The element is the return value. */
struct Method : Element {
    std::vector<Parameter> parameters;
};

struct Class {
    std::string name;
    /** Empty where there is none. */
    std::string superClass;
    Qualifiers qualifiers;
    /** References included. */
    std::vector<Property> properties;
    std::vector<Method> methods;
    /** Where the declaration stands, "file:line". */
    std::string place;

    const Property* property(std::string_view name) const;
    const Method* method(std::string_view name) const;
    std::vector<const Property*> keys() const;
};

/** The element called `name`, letter case ignored, or null. */
template <typename T>
const T* findElement(const std::vector<T>& elements, std::string_view name) {
    for (const T& element : elements) {
        if (equalNames(element.name, name)) {
            return &element;
        }
    }
    return nullptr;
}

} // namespace ObjectManager

#endif

/**
 * Class declarations: the names, types and qualifiers of a class and of its elements.
 */
#ifndef CLASSES_CLASS_H
#define CLASSES_CLASS_H

#include "model/Model.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** Qualifiers by name. A qualifier that is written without a value is TRUE; numbers are sint64, uint64 or real64. */
using Qualifiers = std::vector<NamedValue>;

/** Whether the boolean qualifier `name` is present and TRUE. */
bool hasFlag(const Qualifiers& qualifiers, std::string_view name);

struct Class;

/** The common members of properties, parameters and methods (whose type is that of the return value). */
struct Element {
    std::string name;
    /** Includes CMPI_ARRAY if the element is an array. */
    CMPIType type = CMPI_null;
    /** The class that a reference refers to; empty unless the type is CMPI_ref. */
    std::string referenceClass;
    Qualifiers qualifiers;
    /* Set in a catalogue only, and not for parameters: the class that declared the element first, and the class whose
       declaration this is. They differ if the element was overridden. */
    std::string origin;
    std::string declaredBy;

    bool isDeclaredBy(const Class& owner) const;
};

/**
 * The meaning of a value of the element, according to its qualifiers ValueMap and Values.
 *
 * @param value one value: for an element that is an array, one element of the array.
 * @return no value if the element has no such qualifiers, or they do not list the value.
 */
std::optional<std::string> meaning(const Element& element, const Value& value);

struct Property : Element {
    /** Null if the declaration gives no default value. */
    Value defaultValue;

    bool isKey() const { return hasFlag(qualifiers, "Key"); }
};

struct Parameter : Element {
    /** A parameter is an input unless its qualifier In is FALSE. */
    bool isIn() const;
    bool isOut() const { return hasFlag(qualifiers, "Out"); }
};

/** A method; as an element, it is the return value. */
struct Method : Element {
    std::vector<Parameter> parameters;
};

struct Class {
    std::string name;
    /** Empty if the class has no superclass. */
    std::string superClass;
    Qualifiers qualifiers;
    /** Properties and references. */
    std::vector<Property> properties;
    std::vector<Method> methods;
    /** The place of the declaration, "file:line". */
    std::string place;

    /* These find elements by their names, letter case ignored; null if the class has no such element. */

    const Property* property(std::string_view name) const;
    const Method* method(std::string_view name) const;

    /** The key properties, in the order of `properties`. */
    std::vector<const Property*> keys() const;
};

/** The element called `name`, letter case ignored; null if there is none. */
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

#include "classes/QualifierType.h"

#include "classes/Literals.h"
#include "classes/MofLexer.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <optional>
#include <string_view>
#include <tuple>
#include <utility>

namespace ObjectManager {

namespace {

/** A row of the table of meta and standard qualifiers in DSP0004. */
struct StandardType {
    std::string_view name;
    CMPIType type;
    bool overridable;
    bool toSubclass;
    bool translatable;
    Scopes scopes;
    /** Null if the qualifier has no default value. */
    const char* defaultValue;
};

constexpr Scopes ofClasses = aClass | anAssociation | anIndication;
constexpr Scopes ofValues = aProperty | aMethod | aParameter;

constexpr StandardType standardTypes[] = {
    // clang-format off
    {"Abstract", CMPI_boolean, true, false, false, ofClasses, "FALSE"},
    {"Aggregate", CMPI_boolean, false, true, false, aReference, "FALSE"},
    {"Aggregation", CMPI_boolean, false, true, false, anAssociation, "FALSE"},
    {"ArrayType", CMPI_string, false, true, false, aProperty | aParameter, "Bag"},
    {"Association", CMPI_boolean, false, true, false, anAssociation, "FALSE"},
    {"BitMap", CMPI_stringA, true, true, false, ofValues, nullptr},
    {"BitValues", CMPI_stringA, true, true, true, ofValues, nullptr},
    {"ClassConstraint", CMPI_stringA, true, true, false, ofClasses, nullptr},
    {"Composition", CMPI_boolean, false, true, false, anAssociation, "FALSE"},
    {"Correlatable", CMPI_stringA, true, true, false, aProperty, nullptr},
    {"Counter", CMPI_boolean, true, true, false, ofValues, "FALSE"},
    {"Deprecated", CMPI_stringA, true, false, false, anyScope, nullptr},
    {"Description", CMPI_string, true, true, true, anyScope, nullptr},
    {"DisplayName", CMPI_string, true, true, true, anyScope, nullptr},
    {"DN", CMPI_boolean, false, true, false, ofValues, "FALSE"},
    {"EmbeddedInstance", CMPI_string, true, true, false, ofValues, nullptr},
    {"EmbeddedObject", CMPI_boolean, false, true, false, ofValues, "FALSE"},
    {"Exception", CMPI_boolean, false, true, false, aClass | anIndication, "FALSE"},
    {"Experimental", CMPI_boolean, true, false, false, anyScope, "FALSE"},
    {"Gauge", CMPI_boolean, true, true, false, ofValues, "FALSE"},
    {"In", CMPI_boolean, false, true, false, aParameter, "TRUE"},
    {"Indication", CMPI_boolean, false, true, false, aClass | anIndication, "FALSE"},
    {"IsPUnit", CMPI_boolean, true, true, false, ofValues, "FALSE"},
    {"Key", CMPI_boolean, false, true, false, aReference | aProperty, "FALSE"},
    {"MappingStrings", CMPI_stringA, true, true, false, anyScope, nullptr},
    {"Max", CMPI_uint32, true, true, false, aReference, nullptr},
    {"MaxLen", CMPI_uint32, true, true, false, ofValues, nullptr},
    {"MaxValue", CMPI_sint64, true, true, false, ofValues, nullptr},
    {"MethodConstraint", CMPI_stringA, true, true, false, aMethod, nullptr},
    {"Min", CMPI_uint32, true, true, false, aReference, "0"},
    {"MinLen", CMPI_uint32, true, true, false, ofValues, "0"},
    {"MinValue", CMPI_sint64, true, true, false, ofValues, nullptr},
    {"ModelCorrespondence", CMPI_stringA, true, true, false, anyScope, nullptr},
    {"NullValue", CMPI_string, false, true, false, aProperty, nullptr},
    {"OctetString", CMPI_boolean, false, true, false, ofValues, "FALSE"},
    {"Out", CMPI_boolean, false, true, false, aParameter, "FALSE"},
    {"Override", CMPI_string, true, false, false, aReference | aProperty | aMethod, nullptr},
    {"Propagated", CMPI_string, false, true, false, aProperty, nullptr},
    {"PropertyConstraint", CMPI_stringA, true, true, false, aReference | aProperty, nullptr},
    {"PUnit", CMPI_string, true, true, false, ofValues, nullptr},
    {"Read", CMPI_boolean, true, true, false, aProperty, "TRUE"},
    {"Reference", CMPI_string, true, true, false, aProperty, nullptr},
    {"Required", CMPI_boolean, false, true, false, aReference | aProperty | aMethod | aParameter, "FALSE"},
    {"Revision", CMPI_string, true, true, true, ofClasses, nullptr},
    {"Schema", CMPI_string, false, true, true, aProperty | aMethod, nullptr},
    {"Static", CMPI_boolean, false, true, false, aProperty | aMethod, "FALSE"},
    {"Structure", CMPI_boolean, false, true, false, aClass | anIndication, "FALSE"},
    {"Terminal", CMPI_boolean, true, true, false, ofClasses, "FALSE"},
    {"UMLPackagePath", CMPI_string, true, true, false, ofClasses, nullptr},
    {"Units", CMPI_string, true, true, true, ofValues, nullptr},
    {"ValueMap", CMPI_stringA, true, true, false, ofValues, nullptr},
    {"Values", CMPI_stringA, true, true, true, ofValues, nullptr},
    {"Version", CMPI_string, true, false, true, ofClasses, nullptr},
    {"Weak", CMPI_boolean, false, true, false, aReference, "FALSE"},
    {"Write", CMPI_boolean, true, true, false, aProperty, "FALSE"},
    {"XMLNamespaceName", CMPI_string, true, true, false, ofValues, nullptr},
    // clang-format on
};

bool isSame(const QualifierType& left, const QualifierType& right) {
    const auto asTuple = [](const QualifierType& type) {
        return std::tuple(type.type, type.overridable, type.toSubclass, type.translatable, type.scopes);
    };
    return asTuple(left) == asTuple(right) && left.defaultValue == right.defaultValue;
}

/** The value, converted to a type that is not an array; no value if it does not fit the type. */
std::optional<Value> scalarOf(const Value& value, CMPIType type) {
    if (value.isNull()) {
        return nullValue(type);
    }
    if (value.type == type) {
        return value;
    }
    if (!isInteger(value.type) || !(isInteger(type) || isReal(type))) {
        return std::nullopt;
    }
    const auto* number = std::get_if<std::int64_t>(&value.content);
    try {
        return valueOfText(
            number != nullptr ? std::to_string(*number) : std::to_string(std::get<std::uint64_t>(value.content)), type);
    } catch (const LiteralError&) {
        return std::nullopt;
    }
}

std::optional<Value> valueOf(const Value& value, CMPIType type) {
    const auto elementType = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    const auto* elements = std::get_if<Value::Array>(&value.content);
    if (elementType == type || value.isNull()) {
        return elements == nullptr ? scalarOf(value, type) : std::nullopt;
    }
    if (elements == nullptr) {
        return std::nullopt;
    }
    Value::Array converted;
    for (const Value& element : *elements) {
        std::optional<Value> of = scalarOf(element, elementType);
        if (!of) {
            return std::nullopt;
        }
        converted.push_back(std::move(*of));
    }
    return arrayValue(elementType, std::move(converted));
}

} // namespace

QualifierTypes::QualifierTypes(const std::vector<QualifierType>& declared) {
    for (const StandardType& type : standardTypes) {
        const std::string name(type.name);
        _types.emplace(name, QualifierType{name,
                                           type.type,
                                           type.overridable,
                                           type.toSubclass,
                                           type.translatable,
                                           type.scopes,
                                           type.defaultValue == nullptr ? nullValue(type.type)
                                                                        : valueOfText(type.defaultValue, type.type),
                                           {}});
    }
    for (const QualifierType& type : declared) {
        QualifierType& known = _types.try_emplace(type.name, type).first->second;
        if (!known.place.empty() && !isSame(known, type)) {
            throw SchemaError(
                type.place,
                fmt::format(
                    "found another declaration of the qualifier type {}, expected one that is equal to that at {}",
                    type.name, known.place));
        }
        known = type;
    }
}

const QualifierType* QualifierTypes::find(std::string_view name) const {
    const auto found = _types.find(name);
    return found == _types.end() ? nullptr : &found->second;
}

std::vector<const QualifierType*> QualifierTypes::all() const {
    std::vector<const QualifierType*> types;
    types.reserve(_types.size());
    for (const auto& [name, type] : _types) {
        types.push_back(&type);
    }
    return types;
}

void QualifierTypes::convert(Qualifiers& qualifiers, const std::string& place) const {
    for (NamedValue& qualifier : qualifiers) {
        const QualifierType* type = find(qualifier.name);
        if (type == nullptr) {
            continue;
        }
        std::optional<Value> converted = valueOf(qualifier.value, type->type);
        if (!converted) {
            throw SchemaError(place, fmt::format("found {} as value of the qualifier {}, expected {}",
                                                 typeName(qualifier.value.type), qualifier.name, typeName(type->type)));
        }
        qualifier.value = std::move(*converted);
    }
}

Qualifiers QualifierTypes::merged(const Qualifiers& inherited, Qualifiers own) const {
    std::copy_if(inherited.begin(), inherited.end(), std::back_inserter(own), [&](const NamedValue& qualifier) {
        const QualifierType* type = find(qualifier.name);
        return (type == nullptr || type->toSubclass) && ObjectManager::find(own, qualifier.name) == nullptr;
    });
    return own;
}

} // namespace ObjectManager

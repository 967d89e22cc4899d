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

/** Of the meta and standard qualifiers of DSP0004. */
struct StandardType {
    std::string_view name;
    CMPIType type;
    bool overridable;
    bool toSubclass;
    bool translatable;
};

constexpr StandardType standardTypes[] = {
    // clang-format off
    {"Abstract", CMPI_boolean, true, false, false},
    {"Aggregate", CMPI_boolean, false, true, false},
    {"Aggregation", CMPI_boolean, false, true, false},
    {"ArrayType", CMPI_string, false, true, false},
    {"Association", CMPI_boolean, false, true, false},
    {"BitMap", CMPI_stringA, true, true, false},
    {"BitValues", CMPI_stringA, true, true, true},
    {"ClassConstraint", CMPI_stringA, true, true, false},
    {"Composition", CMPI_boolean, false, true, false},
    {"Correlatable", CMPI_stringA, true, true, false},
    {"Counter", CMPI_boolean, true, true, false},
    {"Deprecated", CMPI_stringA, true, false, false},
    {"Description", CMPI_string, true, true, true},
    {"DisplayName", CMPI_string, true, true, true},
    {"DN", CMPI_boolean, false, true, false},
    {"EmbeddedInstance", CMPI_string, true, true, false},
    {"EmbeddedObject", CMPI_boolean, false, true, false},
    {"Exception", CMPI_boolean, false, true, false},
    {"Experimental", CMPI_boolean, true, false, false},
    {"Gauge", CMPI_boolean, true, true, false},
    {"In", CMPI_boolean, false, true, false},
    {"Indication", CMPI_boolean, false, true, false},
    {"IsPUnit", CMPI_boolean, true, true, false},
    {"Key", CMPI_boolean, false, true, false},
    {"MappingStrings", CMPI_stringA, true, true, false},
    {"Max", CMPI_uint32, true, true, false},
    {"MaxLen", CMPI_uint32, true, true, false},
    {"MaxValue", CMPI_sint64, true, true, false},
    {"MethodConstraint", CMPI_stringA, true, true, false},
    {"Min", CMPI_uint32, true, true, false},
    {"MinLen", CMPI_uint32, true, true, false},
    {"MinValue", CMPI_sint64, true, true, false},
    {"ModelCorrespondence", CMPI_stringA, true, true, false},
    {"NullValue", CMPI_string, false, true, false},
    {"OctetString", CMPI_boolean, false, true, false},
    {"Out", CMPI_boolean, false, true, false},
    {"Override", CMPI_string, true, false, false},
    {"Propagated", CMPI_string, false, true, false},
    {"PropertyConstraint", CMPI_stringA, true, true, false},
    {"PUnit", CMPI_string, true, true, false},
    {"Read", CMPI_boolean, true, true, false},
    {"Reference", CMPI_string, true, true, false},
    {"Required", CMPI_boolean, false, true, false},
    {"Revision", CMPI_string, true, true, true},
    {"Schema", CMPI_string, false, true, true},
    {"Static", CMPI_boolean, false, true, false},
    {"Structure", CMPI_boolean, false, true, false},
    {"Terminal", CMPI_boolean, true, true, false},
    {"UMLPackagePath", CMPI_string, true, true, false},
    {"Units", CMPI_string, true, true, true},
    {"ValueMap", CMPI_stringA, true, true, false},
    {"Values", CMPI_stringA, true, true, true},
    {"Version", CMPI_string, true, false, true},
    {"Weak", CMPI_boolean, false, true, false},
    {"Write", CMPI_boolean, true, true, false},
    {"XMLNamespaceName", CMPI_string, true, true, false},
    // clang-format on
};

bool isSame(const QualifierType& left, const QualifierType& right) {
    const auto asTuple = [](const QualifierType& type) {
        return std::tuple(type.type, type.overridable, type.toSubclass, type.translatable);
    };
    return asTuple(left) == asTuple(right);
}

/** The value in a type that is no array, or nothing where it is none of it. */
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
        _types.emplace(name, QualifierType{name, type.type, type.overridable, type.toSubclass, type.translatable, {}});
    }
    for (const QualifierType& type : declared) {
        QualifierType& known = _types.try_emplace(type.name, type).first->second;
        if (!known.place.empty() && !isSame(known, type)) {
            throw SchemaError(type.place,
                              fmt::format("found another declaration of the qualifier type {}, expected it as in {}",
                                          type.name, known.place));
        }
        known = type;
    }
}

const QualifierType* QualifierTypes::find(std::string_view name) const {
    const auto found = _types.find(name);
    return found == _types.end() ? nullptr : &found->second;
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

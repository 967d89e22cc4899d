#include "text/MofText.h"

#include "classes/Literals.h"
#include "text/Layout.h"
#include "text/ObjectPathText.h"

#include <fmt/format.h>

#include <utility>
#include <vector>

namespace ObjectManager {

namespace {

constexpr std::size_t indentWidth = 4;

struct Literal {
    CMPIType type;

    std::string operator()(std::monostate) const { return "NULL"; }
    std::string operator()(bool value) const { return value ? "TRUE" : "FALSE"; }
    std::string operator()(char16_t value) const { return inQuotes(utf8(value), '\''); }
    std::string operator()(std::uint64_t value) const { return std::to_string(value); }
    std::string operator()(std::int64_t value) const { return std::to_string(value); }
    std::string operator()(double value) const {
        // A real32 is written with no more digits than it has.
        return type == CMPI_real32 ? fmt::format("{:#}", static_cast<float>(value)) : fmt::format("{:#}", value);
    }
    std::string operator()(const std::string& value) const { return inQuotes(value); }
    std::string operator()(const std::shared_ptr<const ObjectPath>& value) const {
        return inQuotes(formatObjectPath(*value));
    }
    std::string operator()(const std::shared_ptr<const Instance>& value) const { return inQuotes(mofInstance(*value)); }
    std::string operator()(const Value::Array& value) const {
        std::string elements;
        for (const Value& element : value) {
            elements += (elements.empty() ? "" : ", ") + mofLiteral(element);
        }
        return '{' + elements + '}';
    }
};

/** `indent` is the column in which the value begins. */
std::string qualifierText(const NamedValue& qualifier, std::size_t indent) {
    const auto* array = std::get_if<Value::Array>(&qualifier.value.content);
    if (array == nullptr) {
        return qualifier.value == booleanValue(true) ? qualifier.name
                                                     : qualifier.name + '(' + mofLiteral(qualifier.value) + ')';
    }
    std::vector<std::string> elements;
    for (const Value& element : *array) {
        elements.push_back(mofLiteral(element) + (&element == &array->back() ? "}" : ","));
    }
    return elements.empty() ? qualifier.name + "{}"
                            : qualifier.name + '{' + filled(elements, indent + qualifier.name.size() + 1);
}

/** The qualifiers, each on a line of its own, and a line end; empty if there are none. */
std::string qualifierList(const Qualifiers& qualifiers, std::size_t indent) {
    std::string text;
    for (const NamedValue& qualifier : qualifiers) {
        text += text.empty() ? std::string(indent, ' ') + '[' : ",\n" + std::string(indent + 1, ' ');
        text += qualifierText(qualifier, indent + 1);
    }
    return text.empty() ? text : text + "]\n";
}

/** The qualifiers, type and name of an element. */
std::string elementText(const Element& element, std::size_t indent) {
    const bool array = (element.type & CMPI_ARRAY) != 0;
    const std::string type = element.referenceClass.empty()
                                 ? typeName(static_cast<CMPIType>(element.type & ~CMPI_ARRAY))
                                 : element.referenceClass + " REF";
    return qualifierList(element.qualifiers, indent) + std::string(indent, ' ') + type + ' ' + element.name +
           (array ? "[]" : "");
}

std::string methodText(const Method& method) {
    std::string text = elementText(method, indentWidth) + '(';
    for (const Parameter& parameter : method.parameters) {
        text += &parameter == &method.parameters.front() ? "\n" : ",\n";
        text += elementText(parameter, 2 * indentWidth);
    }
    return text + ");\n";
}

} // namespace

std::string mofLiteral(const Value& value) {
    return std::visit(Literal{value.type}, value.content);
}

std::string mofInstance(const Instance& instance) {
    std::string text = "instance of " + instance.path.className + " {\n";
    for (const NamedValue& property : instance.properties) {
        text += std::string(indentWidth, ' ') + property.name + " = " + mofLiteral(property.value) + ";\n";
    }
    return text + "};\n";
}

std::string mofClass(const Class& declared) {
    std::string text = qualifierList(declared.qualifiers, 0) + "class " + declared.name +
                       (declared.superClass.empty() ? "" : " : " + declared.superClass) + " {\n";
    const char* separator = "";
    for (const Property& property : declared.properties) {
        text += std::exchange(separator, "\n") + elementText(property, indentWidth);
        text += property.defaultValue.isNull() ? ";\n" : " = " + mofLiteral(property.defaultValue) + ";\n";
    }
    for (const Method& method : declared.methods) {
        text += std::exchange(separator, "\n") + methodText(method);
    }
    return text + "};\n";
}

} // namespace ObjectManager

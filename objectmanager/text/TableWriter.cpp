#include "classes/Literals.h"
#include "text/Layout.h"
#include "text/MofText.h"
#include "text/ObjectPathText.h"
#include "text/Writers.h"

#include <algorithm>
#include <iterator>

namespace ObjectManager {

namespace {

/** How many columns details are indented below the line that they belong to. */
constexpr std::size_t step = 2;

/** The text on one line. A text with control characters becomes a quoted literal, in which they are escaped. */
std::string oneLine(const std::string& text) {
    const bool plain = std::none_of(text.begin(), text.end(),
                                    [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7f; });
    return plain ? text : inQuotes(text);
}

std::string joined(const std::vector<std::string>& texts) {
    std::string result;
    for (const std::string& text : texts) {
        result += (&text == &texts.front() ? "" : ", ") + text;
    }
    return result;
}

std::string embeddedText(const Instance& instance) {
    std::vector<std::string> properties;
    for (const NamedValue& property : instance.properties) {
        properties.push_back(property.name + "=" + plainText(property.value, nullptr));
    }
    return instance.path.className + " {" + joined(properties) + "}";
}

/** The text of a value, as pieces between which a line may be broken. */
std::vector<std::string> piecesOf(const Value& value, const Element* element) {
    const auto* array = std::get_if<Value::Array>(&value.content);
    if (array == nullptr) {
        return wordsOf(plainText(value, element));
    }
    std::vector<std::string> pieces;
    for (const Value& each : *array) {
        pieces.push_back(plainText(each, element) + (&each == &array->back() ? "" : ","));
    }
    return pieces;
}

} // namespace

std::string plainText(const Value& value, const Element* element) {
    if (const auto* array = std::get_if<Value::Array>(&value.content)) {
        std::vector<std::string> elements;
        std::transform(array->begin(), array->end(), std::back_inserter(elements),
                       [element](const Value& v) { return plainText(v, element); });
        return joined(elements);
    }
    if (const auto* text = std::get_if<std::string>(&value.content)) {
        return oneLine(*text);
    }
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.content)) {
        return formatLocalPath(**path);
    }
    if (const auto* instance = std::get_if<std::shared_ptr<const Instance>>(&value.content)) {
        return embeddedText(**instance);
    }
    const auto means = element == nullptr ? std::nullopt : meaning(*element, value);
    return means ? mofLiteral(value) + " (" + *means + ")" : mofLiteral(value);
}

void TableWriter::names(const std::vector<ObjectPath>& paths) {
    for (const ObjectPath& path : paths) {
        _out << formatLocalPath(path) << '\n';
    }
}

void TableWriter::instances(const std::vector<Instance>& instances) {
    write(instances, 0);
}

void TableWriter::instance(const Instance& instance) {
    write({instance}, 0);
}

/* The name of each association class is followed by the objects to which its associations lead. */

void TableWriter::associatedNames(const std::vector<Associated<ObjectPath>>& found) {
    for (const Associated<ObjectPath>& each : found) {
        _out << each.associationClass << '\n';
        for (const ObjectPath& path : each.objects) {
            _out << std::string(step, ' ') << formatLocalPath(path) << '\n';
        }
    }
}

void TableWriter::associatedInstances(const std::vector<Associated<Instance>>& found) {
    const char* separator = "";
    for (const Associated<Instance>& each : found) {
        _out << separator << each.associationClass << '\n';
        write(each.objects, step);
        separator = "\n";
    }
}

void TableWriter::write(const std::vector<Instance>& instances, std::size_t indent) {
    const char* separator = "";
    for (const Instance& instance : instances) {
        const Class* known = _catalogue.find(instance.path.className);
        std::vector<Row> rows;
        for (const NamedValue& property : instance.properties) {
            const Property* declared = known == nullptr ? nullptr : known->property(property.name);
            const bool key = declared != nullptr && declared->isKey();
            rows.push_back({{(key ? "* " : "  ") + property.name}, piecesOf(property.value, declared)});
        }
        _out << separator << std::string(indent, ' ') << instance.path.nameSpace << ':' << instance.path.className
             << '\n'
             << aligned(rows, indent + step);
        separator = "\n";
    }
}

void TableWriter::classes(const std::vector<Class>& classes) {
    std::vector<Row> rows = {rowOf({"CLASS", "SUPERCLASS", "METHODS"})};
    for (const Class& each : classes) {
        std::vector<std::string> methods;
        for (const Method& method : each.methods) {
            methods.push_back(method.name);
        }
        rows.push_back(rowOf({each.name, each.superClass, joined(methods)}));
    }
    _out << aligned(rows);
}

void TableWriter::methodResult(const Method& method, const Value& returnValue, const std::vector<NamedValue>& outputs) {
    std::vector<Row> rows = {{{"ReturnValue"}, piecesOf(returnValue, &method)}};
    for (const NamedValue& output : outputs) {
        rows.push_back({{output.name}, piecesOf(output.value, findElement(method.parameters, output.name))});
    }
    constexpr std::size_t indent = 4;
    _out << method.name << '\n' << aligned(rows, indent);
}

void TableWriter::summary(const std::vector<std::vector<std::string>>& rows,
                          const std::vector<Instance>& /*instances*/) {
    std::vector<Row> lines;
    std::transform(rows.begin(), rows.end(), std::back_inserter(lines), rowOf);
    _out << aligned(lines);
}

} // namespace ObjectManager

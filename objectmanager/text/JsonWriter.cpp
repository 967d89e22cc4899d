#include "classes/Literals.h"
#include "text/ObjectPathText.h"
#include "text/Writers.h"

#include <nlohmann/json.hpp>

namespace ObjectManager {

namespace {

/** Members stay in the order in which they are added. */
using Json = nlohmann::ordered_json;

Json toJson(const Class& known);
Json toJson(const Instance& instance);
Json toJson(const Method& method);
Json toJson(const ObjectPath& path);
Json toJson(const Property& property);
Json toJson(const std::vector<NamedValue>& values);

struct ToJson {
    Json operator()(std::monostate) const { return nullptr; }
    Json operator()(char16_t value) const { return utf8(value); }
    Json operator()(const std::shared_ptr<const ObjectPath>& value) const { return formatObjectPath(*value); }
    Json operator()(const std::shared_ptr<const Instance>& value) const { return toJson(*value); }
    Json operator()(const Value::Array& value) const {
        Json elements = Json::array();
        for (const Value& element : value) {
            elements.push_back(std::visit(*this, element.content));
        }
        return elements;
    }
    template <typename T>
    Json operator()(const T& value) const {
        return value;
    }
};

Json toJson(const Value& value) {
    return std::visit(ToJson(), value.content);
}

Json toJson(const std::vector<NamedValue>& values) {
    Json members = Json::object();
    for (const NamedValue& value : values) {
        members[value.name] = toJson(value.value);
    }
    return members;
}

Json toJson(const ObjectPath& path) {
    return {{"path", formatLocalPath(path)},
            {"host", path.host},
            {"namespace", path.nameSpace},
            {"class", path.className},
            {"keys", toJson(path.keys)}};
}

Json toJson(const Instance& instance) {
    return {{"path", formatLocalPath(instance.path)},
            {"host", instance.path.host},
            {"namespace", instance.path.nameSpace},
            {"class", instance.path.className},
            {"properties", toJson(instance.properties)}};
}

Json toJson(const Element& element) {
    Json json = {{"name", element.name}, {"type", typeName(element.type)}};
    if (!element.referenceClass.empty()) {
        json["class"] = element.referenceClass;
    }
    json["qualifiers"] = toJson(element.qualifiers);
    return json;
}

template <typename T>
Json toJsonArray(const std::vector<T>& elements) {
    Json json = Json::array();
    for (const T& element : elements) {
        json.push_back(toJson(element));
    }
    return json;
}

template <typename T>
Json toJson(const std::vector<Associated<T>>& found, const char* objects) {
    Json json = Json::array();
    for (const Associated<T>& each : found) {
        json.push_back({{"association", each.associationClass}, {objects, toJsonArray(each.objects)}});
    }
    return json;
}

Json toJson(const Property& property) {
    Json json = toJson(static_cast<const Element&>(property));
    json["default"] = toJson(property.defaultValue);
    return json;
}

Json toJson(const Method& method) {
    Json json = toJson(static_cast<const Element&>(method));
    json["parameters"] = Json::array();
    for (const Parameter& parameter : method.parameters) {
        json["parameters"].push_back(toJson(static_cast<const Element&>(parameter)));
    }
    return json;
}

Json toJson(const Class& known) {
    return {{"class", known.name},
            {"superclass", known.superClass},
            {"qualifiers", toJson(known.qualifiers)},
            {"properties", toJsonArray(known.properties)},
            {"methods", toJsonArray(known.methods)}};
}

void write(std::ostream& out, const Json& json) {
    constexpr int indent = 2;
    // A provider's text that is not valid UTF-8 must not make the whole answer fail.
    out << json.dump(indent, ' ', false, Json::error_handler_t::replace) << '\n';
}

} // namespace

void JsonWriter::names(const std::vector<ObjectPath>& paths) {
    write(_out, toJsonArray(paths));
}

void JsonWriter::instances(const std::vector<Instance>& instances) {
    write(_out, toJsonArray(instances));
}

void JsonWriter::instance(const Instance& instance) {
    write(_out, toJson(instance));
}

void JsonWriter::associatedNames(const std::vector<Associated<ObjectPath>>& found) {
    write(_out, toJson(found, "names"));
}

void JsonWriter::associatedInstances(const std::vector<Associated<Instance>>& found) {
    write(_out, toJson(found, "instances"));
}

void JsonWriter::classes(const std::vector<Class>& classes) {
    write(_out, toJsonArray(classes));
}

void JsonWriter::methodResult(const Method& method, const Value& returnValue, const std::vector<NamedValue>& outputs) {
    write(_out, {{"method", method.name}, {"returnValue", toJson(returnValue)}, {"outputs", toJson(outputs)}});
}

void JsonWriter::summary(const std::vector<std::vector<std::string>>& /*rows*/,
                         const std::vector<Instance>& instances) {
    this->instances(instances);
}

} // namespace ObjectManager

#include "cimxml/Parameters.h"

#include "cimxml/Markup.h"

#include <algorithm>

namespace ObjectManager::CimXml {

namespace {

[[noreturn]] void invalid(const std::string& message) {
    throw CimError(CMPI_RC_ERR_INVALID_PARAMETER, message);
}

bool takes(const ParameterNames& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(),
                       [&](std::string_view other) { return !other.empty() && equalNames(other, name); });
}

} // namespace

Parameters::Parameters(const Message& message, const Catalogue& catalogue, const ParameterNames& names)
    : _message(message), _reader(catalogue, message.nameSpace()) {
    const auto& arguments = message.arguments();
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
        if (!takes(names, argument->name)) {
            invalid("found the parameter " + argument->name + ", which " + message.method() + " does not have");
        }
        if (std::any_of(arguments.begin(), argument,
                        [&](const Argument& other) { return equalNames(other.name, argument->name); })) {
            invalid("found the parameter " + argument->name + " twice, expected it once");
        }
    }
}

const XmlElement* Parameters::optional(std::string_view name, std::initializer_list<std::string_view> elements) const {
    const auto& arguments = _message.arguments();
    const auto found = std::find_if(arguments.begin(), arguments.end(),
                                    [&](const Argument& argument) { return equalNames(argument.name, name); });
    if (found == arguments.end() || found->content == nullptr) {
        return nullptr;
    }
    if (std::find(elements.begin(), elements.end(), found->content->name) == elements.end()) {
        invalid("found a " + found->content->name + " for the parameter " + std::string(name) + ", expected a " +
                std::string(*elements.begin()));
    }
    return found->content;
}

const XmlElement& Parameters::required(std::string_view name, std::initializer_list<std::string_view> elements) const {
    const XmlElement* const found = optional(name, elements);
    if (found == nullptr) {
        invalid("found no parameter " + std::string(name) + ", expected it with " + _message.method());
    }
    return *found;
}

bool Parameters::flag(std::string_view name, bool otherwise) const {
    const XmlElement* const found = optional(name, {"VALUE"});
    return found == nullptr ? otherwise
                            : std::get<bool>(_reader.value(*found, CMPI_boolean, std::string(name)).content);
}

std::optional<std::uint32_t> Parameters::optionalNumber(std::string_view name) const {
    const XmlElement* const found = optional(name, {"VALUE"});
    if (found == nullptr) {
        return std::nullopt;
    }
    const Value value = _reader.value(*found, CMPI_uint32, std::string(name));
    return static_cast<std::uint32_t>(std::get<std::uint64_t>(value.content));
}

std::uint32_t Parameters::number(std::string_view name) const {
    required(name, {"VALUE"});
    return *optionalNumber(name);
}

std::string Parameters::text(std::string_view name) const {
    return required(name, {"VALUE"}).text;
}

std::string Parameters::optionalText(std::string_view name) const {
    const XmlElement* const found = optional(name, {"VALUE"});
    return found == nullptr ? std::string() : found->text;
}

ObjectPath Parameters::className(std::string_view name) const {
    return _reader.className(required(name, {"CLASSNAME"}));
}

std::string Parameters::optionalClassName(std::string_view name) const {
    const XmlElement* const found = optional(name, {"CLASSNAME"});
    return found == nullptr ? std::string() : _reader.className(*found).className;
}

ObjectPath Parameters::instanceName(std::string_view name) const {
    return _reader.instanceName(required(name, {"INSTANCENAME"}));
}

bool Parameters::isClassName(std::string_view name) const {
    return required(name, {"INSTANCENAME", "CLASSNAME"}).name == "CLASSNAME";
}

PropertyList Parameters::propertyList() const {
    constexpr std::string_view name = "PropertyList";
    const XmlElement* const found = optional(name, {"VALUE.ARRAY"});
    if (found == nullptr) {
        return std::nullopt;
    }
    PropertyList properties(std::in_place);
    const Value value = _reader.value(*found, CMPI_stringA, std::string(name));
    for (const Value& element : std::get<Value::Array>(value.content)) {
        const auto* property = std::get_if<std::string>(&element.content);
        if (property == nullptr || std::any_of(properties->begin(), properties->end(), [&](const std::string& other) {
                return equalNames(other, *property);
            })) {
            continue;
        }
        if (properties->size() == maximumNames) {
            invalid("found more than " + std::to_string(maximumNames) + " properties in " + std::string(name));
        }
        properties->push_back(*property);
    }
    return properties;
}

Instance Parameters::instance(std::string_view name) const {
    return _reader.instance(required(name, {"INSTANCE"}), CMPI_RC_ERR_INVALID_PARAMETER);
}

Instance Parameters::namedInstance(std::string_view name) const {
    const XmlElement& found = required(name, {"VALUE.NAMEDINSTANCE"});
    ObjectPath path = _reader.instanceName(requiredChild(found, {"INSTANCENAME"}));
    Instance instance = _reader.instance(requiredChild(found, {"INSTANCE"}), CMPI_RC_ERR_NO_SUCH_PROPERTY);
    if (!equalNames(instance.path.className, path.className)) {
        invalid("found an instance of " + instance.path.className + " under the name of one of " + path.className);
    }
    instance.path = std::move(path);
    return instance;
}

Value Parameters::value(std::string_view name, CMPIType type) const {
    const XmlElement* const found = optional(name, {"VALUE", "VALUE.ARRAY", "VALUE.REFERENCE"});
    return found == nullptr ? nullValue(type) : _reader.value(*found, type, std::string(name));
}

} // namespace ObjectManager::CimXml

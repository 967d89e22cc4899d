#include "cimxml/ValueReader.h"

#include "basics/Trimmed.h"
#include "cimxml/Markup.h"
#include "cimxml/ProtocolError.h"
#include "cimxml/RequestReader.h"
#include "classes/Literals.h"
#include "text/ObjectPathText.h"

#include <algorithm>
#include <optional>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

[[noreturn]] void invalid(const std::string& message) {
    throw CimError(CMPI_RC_ERR_INVALID_PARAMETER, message);
}

/** Throws if there are too many names: each name is compared with all others. */
void requireRoom(std::size_t count, const std::string& what) {
    if (count == maximumNames) {
        invalid("found more than " + std::to_string(maximumNames) + ' ' + what);
    }
}

/** An integer of CIM-XML, decimal or hexadecimal, in the form of a literal, which has no leading zeros. */
std::optional<std::string> integerLiteral(std::string_view text) {
    const bool isSigned = text.starts_with('-') || text.starts_with('+');
    const std::string_view digits = text.substr(isSigned ? 1 : 0);
    if (digits.starts_with("0x") || digits.starts_with("0X")) {
        return std::string(text);
    }
    if (digits.empty() || digits.find_first_not_of("0123456789") != std::string_view::npos) {
        return std::nullopt;
    }
    const std::size_t significant = std::min(digits.find_first_not_of('0'), digits.size() - 1);
    return std::string(text.substr(0, isSigned ? 1 : 0)) + std::string(digits.substr(significant));
}

/** The type that an attribute names; no value if the attribute is missing. */
std::optional<CMPIType> typeOfAttribute(const XmlElement& element, std::string_view attribute) {
    const std::string* const name = element.attribute(attribute);
    if (name == nullptr) {
        return std::nullopt;
    }
    const auto type = typeByName(*name);
    if (!name->empty() && !type && !equalNames(*name, "reference")) {
        invalid("found the type \"" + *name + "\", expected a type of CIM");
    }
    return type;
}

/** The value of a key whose class is unknown. */
Value untypedKey(const XmlElement& keyValue, const std::string& text) {
    if (const auto type = typeOfAttribute(keyValue, "TYPE")) {
        return valueOfWireText(text, *type);
    }
    const std::string* const given = keyValue.attribute("VALUETYPE");
    const std::string_view kind = given == nullptr ? std::string_view("string") : *given;
    if (kind == "boolean") {
        return valueOfWireText(text, CMPI_boolean);
    }
    if (kind == "numeric") {
        const auto integer = integerLiteral(trimmed(text));
        return integer ? valueOfUntypedText(*integer).value_or(stringValue(text)) : valueOfWireText(text, CMPI_real64);
    }
    return stringValue(text);
}

} // namespace

Value valueOfWireText(const std::string& text, CMPIType type) {
    const bool exact = type == CMPI_string || type == CMPI_char16;
    const std::string_view meant = exact ? std::string_view(text) : trimmed(text);
    const std::optional<std::string> literal = isInteger(type) ? integerLiteral(meant) : std::string(meant);
    if (!literal) {
        invalid("found '" + text + "', expected a " + typeName(type));
    }
    try {
        return valueOfText(*literal, type);
    } catch (const LiteralError& error) {
        invalid(error.what());
    }
}

ObjectPath ValueReader::className(const XmlElement& element) const {
    ObjectPath path;
    path.nameSpace = _nameSpace;
    path.className = requiredAttribute(element, "NAME");
    if (const std::string* declared = _catalogue.declaredName(path.className)) {
        path.className = *declared;
    }
    return path;
}

ObjectPath ValueReader::instanceName(const XmlElement& element) const {
    return instanceName(element, _nameSpace);
}

ObjectPath ValueReader::instanceName(const XmlElement& element, const std::string& nameSpace) const {
    ObjectPath path;
    path.nameSpace = nameSpace;
    path.className = requiredAttribute(element, "CLASSNAME");
    const Class* declared = _catalogue.find(path.className);
    if (declared != nullptr) {
        path.className = declared->name;
    }
    for (const XmlElement& binding : element.children) {
        if (binding.name != "KEYBINDING") {
            continue;
        }
        std::string name = requiredAttribute(binding, "NAME");
        const Property* key = declared == nullptr ? nullptr : declared->property(name);
        if (declared != nullptr && (key == nullptr || !key->isKey())) {
            invalid("found the key " + name + ", expected a key of " + declared->name);
        }
        if (find(path.keys, name) != nullptr) {
            invalid("found the key " + name + " twice, expected it once");
        }
        requireRoom(path.keys.size(), "keys");
        name = key == nullptr ? name : key->name;
        path.keys.push_back({name, keyValue(requiredChild(binding, {"KEYVALUE", "VALUE.REFERENCE"}), key, name)});
    }
    // If a class has only one key, its name may be left out.
    const XmlElement* const single = optionalChild(element, {"KEYVALUE", "VALUE.REFERENCE"});
    if (single != nullptr && path.keys.empty()) {
        const auto names = _catalogue.keyNames(path.className);
        if (names.size() != 1) {
            invalid("found a key without a name in a name of the class " + path.className +
                    ", expected it only where the class has one key");
        }
        path.keys.push_back({names.front(), keyValue(*single, declared->property(names.front()), names.front())});
    }
    requireKeys(path);
    return path;
}

void ValueReader::requireKeys(const ObjectPath& path) const {
    for (const std::string& name : _catalogue.keyNames(path.className)) {
        if (find(path.keys, name) == nullptr) {
            invalid("found no key " + name + ", expected every key of " + path.className);
        }
    }
}

Value ValueReader::keyValue(const XmlElement& element, const Property* declared, const std::string& what) const {
    const bool isReference = element.name == "VALUE.REFERENCE";
    if (declared != nullptr && isReference != (declared->type == CMPI_ref)) {
        invalid("found a " + element.name + " for " + what + ", expected a " + typeName(declared->type));
    }
    if (isReference) {
        return referenceValue(reference(element));
    }
    return declared == nullptr ? untypedKey(element, element.text) : valueOfWireText(element.text, declared->type);
}

ObjectPath ValueReader::reference(const XmlElement& valueReference) const {
    const XmlElement& element = requiredChild(valueReference, {"INSTANCEPATH", "LOCALINSTANCEPATH", "INSTANCENAME",
                                                               "CLASSPATH", "LOCALCLASSPATH", "CLASSNAME"});
    const std::string_view kind = element.name;
    const XmlElement* local = &element;
    std::string host;
    if (kind == "INSTANCEPATH" || kind == "CLASSPATH") {
        local = &requiredChild(element, {"NAMESPACEPATH"});
        host = requiredChild(*local, {"HOST"}).text;
    }
    const bool isName = kind == "INSTANCENAME" || kind == "CLASSNAME";
    const std::string nameSpace = isName ? _nameSpace : nameSpaceOf(requiredChild(*local, {"LOCALNAMESPACEPATH"}));
    const bool isClass = kind == "CLASSPATH" || kind == "LOCALCLASSPATH" || kind == "CLASSNAME";
    const XmlElement& name = isName ? element : requiredChild(element, {isClass ? "CLASSNAME" : "INSTANCENAME"});
    ObjectPath path = isClass ? className(name) : instanceName(name, nameSpace);
    path.nameSpace = nameSpace;
    path.host = trimmed(host);
    return path;
}

Value ValueReader::value(const XmlElement& element, CMPIType type, const std::string& what) const {
    const std::string_view kind = element.name;
    const auto elementType = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    const bool isArray = (type & CMPI_ARRAY) != 0;
    const std::string_view expected = elementType == CMPI_ref ? (isArray ? "VALUE.REFARRAY" : "VALUE.REFERENCE")
                                                              : (isArray ? "VALUE.ARRAY" : "VALUE");
    if (kind != expected) {
        invalid("found a " + std::string(kind) + " for " + what + ", expected a " + std::string(expected) +
                " of the type " + typeName(type));
    }
    try {
        return isArray            ? array(element, elementType, what)
               : type == CMPI_ref ? referenceValue(reference(element))
                                  : valueOfWireText(element.text, type);
    } catch (const CimError& error) {
        invalid(what + ": " + error.what());
    }
}

Value ValueReader::argument(const XmlElement& element, const Parameter& parameter) const {
    Value read;
    if (parameter.type == CMPI_ref && element.name == "VALUE") {
        try {
            read = referenceValue(parseObjectPath(trimmed(element.text), _catalogue, _nameSpace));
        } catch (const ObjectPathError& error) {
            invalid(parameter.name + ": " + error.what());
        }
    } else {
        read = value(element, parameter.type, parameter.name);
    }
    const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&read.content);
    if (path != nullptr && _catalogue.find((*path)->className) != nullptr &&
        !_catalogue.isA((*path)->className, parameter.referenceClass)) {
        invalid(parameter.name + ": found a " + (*path)->className + ", expected a " + parameter.referenceClass);
    }
    return read;
}

Value ValueReader::array(const XmlElement& element, CMPIType elementType, const std::string& what) const {
    Value::Array elements;
    for (const XmlElement& child : element.children) {
        const std::string_view kind = child.name;
        if (kind == "VALUE.NULL") {
            elements.push_back(nullValue(elementType));
        } else if (kind == "VALUE" || kind == "VALUE.REFERENCE") {
            elements.push_back(value(child, elementType, what));
        }
    }
    return arrayValue(elementType, std::move(elements));
}

NamedValue ValueReader::property(const XmlElement& element, const Class* declared, CMPIrc unknown) const {
    const std::string_view kind = element.name;
    const std::string name = requiredAttribute(element, "NAME");
    const Property* known = declared == nullptr ? nullptr : declared->property(name);
    if (declared != nullptr && known == nullptr) {
        throw CimError(unknown, declared->name + " has no property " + name);
    }
    CMPIType type = CMPI_ref;
    if (known != nullptr) {
        type = known->type;
    } else if (kind != "PROPERTY.REFERENCE") {
        requiredAttribute(element, "TYPE");
        const auto named = typeOfAttribute(element, "TYPE");
        type = static_cast<CMPIType>(named.value_or(CMPI_string) | (kind == "PROPERTY.ARRAY" ? CMPI_ARRAY : 0));
    }
    const XmlElement* const content = optionalChild(element, {"VALUE", "VALUE.ARRAY", "VALUE.REFERENCE"});
    return {known == nullptr ? name : known->name, content == nullptr ? nullValue(type) : value(*content, type, name)};
}

Instance ValueReader::instance(const XmlElement& element, CMPIrc unknownProperty) const {
    Instance instance;
    instance.path.nameSpace = _nameSpace;
    instance.path.className = requiredAttribute(element, "CLASSNAME");
    const Class* declared = _catalogue.find(instance.path.className);
    if (declared != nullptr) {
        instance.path.className = declared->name;
    }
    for (const XmlElement& child : element.children) {
        const std::string_view kind = child.name;
        if (kind != "PROPERTY" && kind != "PROPERTY.ARRAY" && kind != "PROPERTY.REFERENCE") {
            continue;
        }
        NamedValue read = property(child, declared, unknownProperty);
        if (find(instance.properties, read.name) != nullptr) {
            invalid("found the property " + read.name + " twice, expected it once");
        }
        requireRoom(instance.properties.size(), "properties");
        const Property* known = declared == nullptr ? nullptr : declared->property(read.name);
        if (known != nullptr && known->isKey() && !read.value.isNull()) {
            instance.path.keys.push_back(read);
        }
        instance.properties.push_back(std::move(read));
    }
    return instance;
}

} // namespace ObjectManager::CimXml

#include "cimxml/ResponseWriter.h"

#include "cimxml/Characters.h"
#include "cimxml/StatusCodes.h"
#include "classes/Literals.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

template <typename Number>
void appendNumber(std::string& text, Number number) {
    std::array<char, 32> digits{};
    const auto end = std::to_chars(digits.data(), digits.data() + digits.size(), number).ptr;
    text.append(digits.data(), end);
}

/** Writes a real with a point, and with digits on both sides of it. */
template <typename Real>
void appendReal(std::string& text, Real real) {
    if (!std::isfinite(real)) {
        text += std::isnan(real) ? "NaN" : real < 0 ? "-INF" : "INF";
        return;
    }
    const std::size_t start = text.size();
    appendNumber(text, real);
    if (text.find('.', start) == std::string::npos) {
        text.insert(std::min(text.find('e', start), text.size()), ".0");
    }
}

bool contains(const std::vector<std::string>& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [&](const std::string& other) { return equalNames(other, name); });
}

bool isWanted(const Selection& selection, std::string_view property) {
    return (!selection.properties || contains(*selection.properties, property)) &&
           (selection.within == nullptr || selection.within->property(property) != nullptr);
}

/** Whether values of the type are embedded instances, which CIM-XML writes as text. */
bool isEmbedded(CMPIType type) {
    return (type & ~CMPI_ARRAY) == CMPI_instance;
}

/** A type without "[]", as TYPE and PARAMTYPE name it. */
std::string elementTypeName(CMPIType type) {
    const auto elementType = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    return elementType == CMPI_null || isEmbedded(elementType) ? "string" : typeName(elementType);
}

/** The kind of a key's value. */
std::string_view valueKind(CMPIType type) {
    return type == CMPI_boolean ? "boolean" : isInteger(type) || isReal(type) ? "numeric" : "string";
}

} // namespace

void ResponseWriter::send() {
    _stream->send(_text);
    _text.clear();
}

void ResponseWriter::objects(std::string_view written) {
    if (_stream == nullptr || written.size() < Server::Outlet::pieceBytes) {
        raw(written);
        return;
    }
    send();
    for (; !written.empty(); written.remove_prefix(std::min(written.size(), Server::Outlet::pieceBytes))) {
        _stream->send(written.substr(0, Server::Outlet::pieceBytes));
    }
}

void ResponseWriter::attribute(std::string_view name, std::string_view value) {
    _text += ' ';
    _text += name;
    _text += "=\"";
    appendAttributeText(_text, value);
    _text += '"';
}

void ResponseWriter::error(CMPIrc code, std::string_view description) {
    raw("<ERROR CODE=\"");
    appendNumber(_text, static_cast<int>(sentCode(code)));
    raw("\"");
    attribute("DESCRIPTION", description);
    raw("/>\n");
}

void ResponseWriter::className(std::string_view name) {
    raw("<CLASSNAME");
    attribute("NAME", name);
    raw("/>\n");
    pass();
}

void ResponseWriter::localNameSpacePath(const std::string& nameSpace) {
    raw("<LOCALNAMESPACEPATH>");
    const std::string_view whole = nameSpace.empty() ? _nameSpace : nameSpace;
    for (std::size_t start = 0; start <= whole.size();) {
        const std::size_t end = std::min(whole.find('/', start), whole.size());
        raw("<NAMESPACE");
        attribute("NAME", whole.substr(start, end - start));
        raw("/>");
        start = end + 1;
    }
    raw("</LOCALNAMESPACEPATH>\n");
}

void ResponseWriter::key(const NamedValue& key) {
    raw("<KEYBINDING");
    attribute("NAME", key.name);
    raw(">");
    if (std::holds_alternative<std::shared_ptr<const ObjectPath>>(key.value.content)) {
        value(key.value);
    } else {
        raw("<KEYVALUE");
        attribute("VALUETYPE", valueKind(key.value.type));
        attribute("TYPE", elementTypeName(key.value.type));
        raw(">");
        scalar(key.value);
        raw("</KEYVALUE>");
    }
    raw("</KEYBINDING>\n");
}

void ResponseWriter::instanceName(const ObjectPath& path) {
    raw("<INSTANCENAME");
    attribute("CLASSNAME", path.className);
    raw(">\n");
    for (const NamedValue& binding : path.keys) {
        key(binding);
    }
    raw("</INSTANCENAME>\n");
    pass();
}

void ResponseWriter::nameSpacePath(const std::string& nameSpace) {
    raw("<NAMESPACEPATH>\n<HOST>");
    appendText(_text, _host);
    raw("</HOST>\n");
    localNameSpacePath(nameSpace);
    raw("</NAMESPACEPATH>\n");
}

void ResponseWriter::classPath(const std::string& name) {
    raw("<CLASSPATH>\n");
    nameSpacePath(_nameSpace);
    className(name);
    raw("</CLASSPATH>\n");
}

void ResponseWriter::instancePath(const ObjectPath& path) {
    raw("<INSTANCEPATH>\n");
    nameSpacePath(path.nameSpace);
    instanceName(path);
    raw("</INSTANCEPATH>\n");
}

void ResponseWriter::objectPath(const ObjectPath& path) {
    raw("<OBJECTPATH>\n");
    instancePath(path);
    raw("</OBJECTPATH>\n");
}

void ResponseWriter::classObjectPath(const std::string& name) {
    raw("<OBJECTPATH>\n");
    classPath(name);
    raw("</OBJECTPATH>\n");
}

/** A path without keys is the path of a class. */
void ResponseWriter::reference(const ObjectPath& path) {
    const bool isClass = path.keys.empty();
    raw("<VALUE.REFERENCE>\n");
    raw(isClass ? "<LOCALCLASSPATH>\n" : "<LOCALINSTANCEPATH>\n");
    localNameSpacePath(path.nameSpace);
    isClass ? className(path.className) : instanceName(path);
    raw(isClass ? "</LOCALCLASSPATH>\n" : "</LOCALINSTANCEPATH>\n");
    raw("</VALUE.REFERENCE>\n");
}

/** Writes the text of a value that is no array, no reference and not null. */
void ResponseWriter::scalar(const Value& value) {
    if (const auto* truth = std::get_if<bool>(&value.content)) {
        raw(*truth ? "TRUE" : "FALSE");
    } else if (const auto* natural = std::get_if<std::uint64_t>(&value.content)) {
        appendNumber(_text, *natural);
    } else if (const auto* integer = std::get_if<std::int64_t>(&value.content)) {
        appendNumber(_text, *integer);
    } else if (const auto* text = std::get_if<std::string>(&value.content)) {
        appendText(_text, *text);
    } else if (const auto* real = std::get_if<double>(&value.content)) {
        value.type == CMPI_real32 ? appendReal(_text, static_cast<float>(*real)) : appendReal(_text, *real);
    } else if (const auto* character = std::get_if<char16_t>(&value.content)) {
        appendText(_text, utf8(*character));
    } else if (const auto* embedded = std::get_if<std::shared_ptr<const Instance>>(&value.content)) {
        ResponseWriter inner(_catalogue, _host, _nameSpace);
        inner.instance(**embedded, {});
        appendText(_text, inner._text);
    }
}

void ResponseWriter::value(const Value& value) {
    if (value.isNull()) {
        return;
    }
    if (const auto* elements = std::get_if<Value::Array>(&value.content)) {
        const bool references = (value.type & ~CMPI_ARRAY) == CMPI_ref;
        raw(references ? "<VALUE.REFARRAY>\n" : "<VALUE.ARRAY>");
        for (const Value& element : *elements) {
            element.isNull() ? raw("<VALUE.NULL/>") : this->value(element);
        }
        raw(references ? "</VALUE.REFARRAY>" : "</VALUE.ARRAY>");
    } else if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.content)) {
        reference(**path);
    } else {
        raw("<VALUE>");
        scalar(value);
        raw("</VALUE>");
    }
}

void ResponseWriter::property(const NamedValue& property, const Class* declared, const Selection& selection) {
    const Property* known = declared == nullptr ? nullptr : declared->property(property.name);
    const CMPIType type = property.value.type == CMPI_null && known != nullptr ? known->type : property.value.type;
    const bool isArray = (type & CMPI_ARRAY) != 0;
    const std::string_view element = type == CMPI_ref ? "PROPERTY.REFERENCE" : isArray ? "PROPERTY.ARRAY" : "PROPERTY";
    raw("<");
    raw(element);
    attribute("NAME", property.name);
    if (type == CMPI_ref) {
        if (known != nullptr && !known->referenceClass.empty()) {
            attribute("REFERENCECLASS", known->referenceClass);
        }
    } else {
        attribute("TYPE", elementTypeName(type));
        if (isEmbedded(type)) {
            attribute("EmbeddedObject", "instance");
        }
    }
    if (selection.classOrigin && known != nullptr) {
        attribute("CLASSORIGIN", known->origin);
    }
    raw(">");
    value(property.value);
    raw("</");
    raw(element);
    raw(">\n");
}

void ResponseWriter::instance(const Instance& instance, const Selection& selection) {
    const Class* declared = _catalogue.find(instance.path.className);
    raw("<INSTANCE");
    attribute("CLASSNAME", instance.path.className);
    raw(">\n");
    for (const NamedValue& element : instance.properties) {
        if (isWanted(selection, element.name)) {
            property(element, declared, selection);
        }
    }
    if (declared != nullptr) {
        for (const Property& absent : declared->properties) {
            if (isWanted(selection, absent.name) && find(instance.properties, absent.name) == nullptr) {
                property({absent.name, nullValue(absent.type)}, declared, selection);
            }
        }
    }
    raw("</INSTANCE>\n");
    pass();
}

void ResponseWriter::namedInstance(const Instance& instance, const Selection& selection) {
    raw("<VALUE.NAMEDINSTANCE>\n");
    instanceName(instance.path);
    this->instance(instance, selection);
    raw("</VALUE.NAMEDINSTANCE>\n");
}

void ResponseWriter::objectWithPath(const Instance& instance, const Selection& selection) {
    raw("<VALUE.OBJECTWITHPATH>\n");
    instancePath(instance.path);
    this->instance(instance, selection);
    raw("</VALUE.OBJECTWITHPATH>\n");
}

void ResponseWriter::instanceWithPath(const Instance& instance, const Selection& selection) {
    raw("<VALUE.INSTANCEWITHPATH>\n");
    instancePath(instance.path);
    this->instance(instance, selection);
    raw("</VALUE.INSTANCEWITHPATH>\n");
}

void ResponseWriter::classWithPath(const Class& declared, const Selection& selection) {
    raw("<VALUE.OBJECTWITHPATH>\n");
    classPath(declared.name);
    classDeclaration(declared, selection);
    raw("</VALUE.OBJECTWITHPATH>\n");
}

void ResponseWriter::returnValue(const Value& returned) {
    raw("<RETURNVALUE");
    attribute("PARAMTYPE", elementTypeName(returned.type));
    raw(">");
    value(returned);
    raw("</RETURNVALUE>\n");
}

void ResponseWriter::parameter(const NamedValue& parameter) {
    raw("<PARAMVALUE");
    attribute("NAME", parameter.name);
    attribute("PARAMTYPE", elementTypeName(parameter.value.type));
    raw(">");
    value(parameter.value);
    raw("</PARAMVALUE>\n");
}

void ResponseWriter::qualifiers(const Qualifiers& qualifiers, const Selection& selection) {
    if (!selection.qualifiers) {
        return;
    }
    for (const NamedValue& qualifier : qualifiers) {
        const QualifierType* type = _catalogue.qualifierTypes().find(qualifier.name);
        raw("<QUALIFIER");
        attribute("NAME", qualifier.name);
        attribute("TYPE", elementTypeName(qualifier.value.type));
        if (type != nullptr) {
            flavors(*type);
        }
        raw(">");
        value(qualifier.value);
        raw("</QUALIFIER>\n");
    }
}

void ResponseWriter::flavors(const QualifierType& type) {
    attribute("OVERRIDABLE", type.overridable ? "true" : "false");
    attribute("TOSUBCLASS", type.toSubclass ? "true" : "false");
    attribute("TRANSLATABLE", type.translatable ? "true" : "false");
}

void ResponseWriter::qualifierDeclaration(const QualifierType& type) {
    raw("<QUALIFIER.DECLARATION");
    attribute("NAME", type.name);
    attribute("TYPE", elementTypeName(type.type));
    attribute("ISARRAY", (type.type & CMPI_ARRAY) != 0 ? "true" : "false");
    flavors(type);
    raw(">\n<SCOPE");
    for (const auto& [scopeName, scope] : scopeNames) {
        std::string name(scopeName);
        std::transform(name.begin(), name.end(), name.begin(), [](char c) { return static_cast<char>(c - 'a' + 'A'); });
        attribute(name, (type.scopes & scope) != 0 ? "true" : "false");
    }
    raw("/>\n");
    value(type.defaultValue);
    raw("</QUALIFIER.DECLARATION>\n");
    pass();
}

void ResponseWriter::origin(const Element& element, const Class& owner, const Selection& selection) {
    if (selection.classOrigin) {
        attribute("CLASSORIGIN", element.origin);
    }
    attribute("PROPAGATED", element.isDeclaredBy(owner) ? "false" : "true");
}

void ResponseWriter::propertyDeclaration(const Property& property, const Class& owner, const Selection& selection) {
    const bool isArray = (property.type & CMPI_ARRAY) != 0;
    const std::string_view element = property.type == CMPI_ref ? "PROPERTY.REFERENCE"
                                     : isArray                 ? "PROPERTY.ARRAY"
                                                               : "PROPERTY";
    raw("<");
    raw(element);
    attribute("NAME", property.name);
    if (property.type == CMPI_ref) {
        attribute("REFERENCECLASS", property.referenceClass);
    } else {
        attribute("TYPE", elementTypeName(property.type));
    }
    origin(property, owner, selection);
    raw(">\n");
    qualifiers(property.qualifiers, selection);
    value(property.defaultValue);
    raw("</");
    raw(element);
    raw(">\n");
}

void ResponseWriter::parameterDeclaration(const Parameter& parameter, const Selection& selection) {
    const bool isArray = (parameter.type & CMPI_ARRAY) != 0;
    const bool isReference = (parameter.type & ~CMPI_ARRAY) == CMPI_ref;
    const std::string_view element = isReference ? (isArray ? "PARAMETER.REFARRAY" : "PARAMETER.REFERENCE")
                                                 : (isArray ? "PARAMETER.ARRAY" : "PARAMETER");
    raw("<");
    raw(element);
    attribute("NAME", parameter.name);
    if (isReference) {
        attribute("REFERENCECLASS", parameter.referenceClass);
    } else {
        attribute("TYPE", elementTypeName(parameter.type));
    }
    raw(">\n");
    qualifiers(parameter.qualifiers, selection);
    raw("</");
    raw(element);
    raw(">\n");
}

void ResponseWriter::methodDeclaration(const Method& method, const Class& owner, const Selection& selection) {
    raw("<METHOD");
    attribute("NAME", method.name);
    attribute("TYPE", elementTypeName(method.type));
    origin(method, owner, selection);
    raw(">\n");
    qualifiers(method.qualifiers, selection);
    for (const Parameter& parameter : method.parameters) {
        parameterDeclaration(parameter, selection);
    }
    raw("</METHOD>\n");
}

void ResponseWriter::classDeclaration(const Class& declared, const Selection& selection) {
    raw("<CLASS");
    attribute("NAME", declared.name);
    if (!declared.superClass.empty()) {
        attribute("SUPERCLASS", declared.superClass);
    }
    raw(">\n");
    qualifiers(declared.qualifiers, selection);
    for (const Property& property : declared.properties) {
        if (isWanted(selection, property.name) && (!selection.localOnly || property.isDeclaredBy(declared))) {
            propertyDeclaration(property, declared, selection);
        }
    }
    for (const Method& method : declared.methods) {
        if (!selection.localOnly || method.isDeclaredBy(declared)) {
            methodDeclaration(method, declared, selection);
        }
    }
    raw("</CLASS>\n");
    pass();
}

} // namespace ObjectManager::CimXml

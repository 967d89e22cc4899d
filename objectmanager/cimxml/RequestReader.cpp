#include "cimxml/RequestReader.h"

#include "cimxml/Markup.h"
#include "cimxml/ProtocolError.h"

#include <algorithm>

namespace ObjectManager::CimXml {

namespace {

/** Throws if the version in an attribute does not begin with the expected major version. */
void requireVersion(const std::string& version, std::string_view major, const char* what, const char* cimError) {
    if (!version.starts_with(major)) {
        throw ProtocolError(Http::notImplemented, cimError,
                            "found the " + std::string(what) + " \"" + version + "\", expected " + std::string(major) +
                                'x');
    }
}

std::string namesOf(std::initializer_list<std::string_view> names) {
    std::string list;
    for (const std::string_view name : names) {
        list += (list.empty() ? "" : ", ") + std::string(name);
    }
    return list;
}

} // namespace

const XmlElement* optionalChild(const XmlElement& element, std::initializer_list<std::string_view> names) {
    const XmlElement* found = nullptr;
    for (const XmlElement& child : element.children) {
        if (std::find(names.begin(), names.end(), child.name) == names.end()) {
            continue;
        }
        if (found != nullptr) {
            throw notLooselyValid("found " + found->name + " and " + child.name + " in " + element.name +
                                  ", expected one of " + namesOf(names));
        }
        found = &child;
    }
    return found;
}

const XmlElement& requiredChild(const XmlElement& element, std::initializer_list<std::string_view> names) {
    const XmlElement* found = optionalChild(element, names);
    if (found == nullptr) {
        throw notLooselyValid("found nothing in " + element.name + ", expected " + namesOf(names));
    }
    return *found;
}

const std::string& requiredAttribute(const XmlElement& element, std::string_view name) {
    const std::string* attribute = element.attribute(name);
    if (attribute == nullptr) {
        throw notLooselyValid("found no attribute " + std::string(name) + " of " + element.name);
    }
    return *attribute;
}

std::string nameSpaceOf(const XmlElement& localNameSpacePath) {
    std::string path;
    for (const XmlElement& part : localNameSpacePath.children) {
        if (part.name == "NAMESPACE") {
            path += (path.empty() ? "" : "/") + requiredAttribute(part, "NAME");
        }
    }
    if (path.empty()) {
        throw notLooselyValid("found no NAMESPACE in LOCALNAMESPACEPATH");
    }
    return path;
}

Message::Message(std::string_view body) : _root(parseMarkup(body)) {
    if (_root.name != "CIM") {
        throw notLooselyValid("found the root " + _root.name + ", expected CIM");
    }
    requireVersion(requiredAttribute(_root, "CIMVERSION"), "2.", "CIMVERSION", "unsupported-cim-version");
    requireVersion(requiredAttribute(_root, "DTDVERSION"), "2.", "DTDVERSION", "unsupported-dtd-version");
    const XmlElement& message = requiredChild(_root, {"MESSAGE"});
    _id = requiredAttribute(message, "ID");
    _protocolVersion = requiredAttribute(message, "PROTOCOLVERSION");
    requireVersion(_protocolVersion, "1.", "PROTOCOLVERSION", "unsupported-protocol-version");
    readOperation(requiredChild(message, {"SIMPLEREQ", "MULTIREQ", "SIMPLEEXPREQ", "MULTIEXPREQ"}));
}

void Message::readOperation(const XmlElement& request) {
    if (request.name == "MULTIREQ") {
        throw ProtocolError(Http::notImplemented, "multiple-requests-unsupported",
                            "found several operations in one request, expected one");
    }
    if (request.name != "SIMPLEREQ") {
        throw ProtocolError(Http::notImplemented, "unsupported-operation", "found an export, expected an operation");
    }
    const XmlElement& call = requiredChild(request, {"IMETHODCALL", "METHODCALL"});
    _method = requiredAttribute(call, "NAME");
    _intrinsic = call.name == "IMETHODCALL";
    if (_intrinsic) {
        _nameSpace = nameSpaceOf(requiredChild(call, {"LOCALNAMESPACEPATH"}));
        readArguments(call, "IPARAMVALUE");
    } else {
        readMethodCall(call);
    }
}

void Message::readMethodCall(const XmlElement& call) {
    const XmlElement& path = requiredChild(call, {"LOCALINSTANCEPATH", "LOCALCLASSPATH"});
    _nameSpace = nameSpaceOf(requiredChild(path, {"LOCALNAMESPACEPATH"}));
    const bool instance = path.name == "LOCALINSTANCEPATH";
    _target = &requiredChild(path, {instance ? "INSTANCENAME" : "CLASSNAME"});
    readArguments(call, "PARAMVALUE");
}

void Message::readArguments(const XmlElement& call, std::string_view element) {
    for (const XmlElement& parameter : call.children) {
        if (parameter.name != element) {
            continue;
        }
        _arguments.push_back({requiredAttribute(parameter, "NAME"),
                              optionalChild(parameter, {"VALUE", "VALUE.ARRAY", "VALUE.REFERENCE", "VALUE.REFARRAY",
                                                        "CLASSNAME", "INSTANCENAME", "CLASS", "INSTANCE",
                                                        "VALUE.NAMEDINSTANCE", "QUALIFIER.DECLARATION"})});
    }
}

} // namespace ObjectManager::CimXml

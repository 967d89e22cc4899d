#include "cimxml/RequestReader.h"

#include "cimxml/Markup.h"
#include "cimxml/ProtocolError.h"

#include <algorithm>

namespace ObjectManager::CimXml {

namespace {

/** Throws where the attribute names a version whose part before the point is another. */
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

pugi::xml_node optionalChild(const pugi::xml_node& element, std::initializer_list<std::string_view> names) {
    pugi::xml_node found;
    for (const pugi::xml_node& child : element) {
        if (std::find(names.begin(), names.end(), std::string_view(child.name())) == names.end()) {
            continue;
        }
        if (found) {
            throw notLooselyValid(std::string("found ") + found.name() + " and " + child.name() + " in " +
                                  element.name() + ", expected one of " + namesOf(names));
        }
        found = child;
    }
    return found;
}

pugi::xml_node requiredChild(const pugi::xml_node& element, std::initializer_list<std::string_view> names) {
    pugi::xml_node found = optionalChild(element, names);
    if (!found) {
        throw notLooselyValid(std::string("found nothing in ") + element.name() + ", expected " + namesOf(names));
    }
    return found;
}

std::string requiredAttribute(const pugi::xml_node& element, const char* name) {
    const pugi::xml_attribute attribute = element.attribute(name);
    if (!attribute) {
        throw notLooselyValid(std::string("found no attribute ") + name + " of " + element.name());
    }
    return attribute.value();
}

std::string nameSpaceOf(const pugi::xml_node& localNameSpacePath) {
    std::string path;
    for (const pugi::xml_node& part : localNameSpacePath.children("NAMESPACE")) {
        path += (path.empty() ? "" : "/") + requiredAttribute(part, "NAME");
    }
    if (path.empty()) {
        throw notLooselyValid("found no NAMESPACE in LOCALNAMESPACEPATH");
    }
    return path;
}

Message::Message(std::string_view body) {
    parseMarkup(body, _document);
    const pugi::xml_node root = _document.document_element();
    if (std::string_view(root.name()) != "CIM") {
        throw notLooselyValid(std::string("found the root ") + root.name() + ", expected CIM");
    }
    requireVersion(requiredAttribute(root, "CIMVERSION"), "2.", "CIMVERSION", "unsupported-cim-version");
    requireVersion(requiredAttribute(root, "DTDVERSION"), "2.", "DTDVERSION", "unsupported-dtd-version");
    const pugi::xml_node message = requiredChild(root, {"MESSAGE"});
    _id = requiredAttribute(message, "ID");
    _protocolVersion = requiredAttribute(message, "PROTOCOLVERSION");
    requireVersion(_protocolVersion, "1.", "PROTOCOLVERSION", "unsupported-protocol-version");
    const pugi::xml_node request = requiredChild(message, {"SIMPLEREQ", "MULTIREQ", "SIMPLEEXPREQ", "MULTIEXPREQ"});
    readOperation(request);
}

void Message::readOperation(const pugi::xml_node& request) {
    const std::string_view kind = request.name();
    if (kind == "MULTIREQ") {
        throw ProtocolError(Http::notImplemented, "multiple-requests-unsupported",
                            "found several operations in one request, expected one");
    }
    if (kind != "SIMPLEREQ") {
        throw ProtocolError(Http::notImplemented, "unsupported-operation", "found an export, expected an operation");
    }
    const pugi::xml_node call = requiredChild(request, {"IMETHODCALL", "METHODCALL"});
    _method = requiredAttribute(call, "NAME");
    _intrinsic = std::string_view(call.name()) == "IMETHODCALL";
    if (_intrinsic) {
        _nameSpace = nameSpaceOf(requiredChild(call, {"LOCALNAMESPACEPATH"}));
        readArguments(call, "IPARAMVALUE");
    } else {
        readMethodCall(call);
    }
}

void Message::readMethodCall(const pugi::xml_node& call) {
    const pugi::xml_node path = requiredChild(call, {"LOCALINSTANCEPATH", "LOCALCLASSPATH"});
    _nameSpace = nameSpaceOf(requiredChild(path, {"LOCALNAMESPACEPATH"}));
    const bool instance = std::string_view(path.name()) == "LOCALINSTANCEPATH";
    _target = instance ? requiredChild(path, {"INSTANCENAME"}) : requiredChild(path, {"CLASSNAME"});
    readArguments(call, "PARAMVALUE");
}

void Message::readArguments(const pugi::xml_node& call, const char* element) {
    for (const pugi::xml_node& parameter : call.children(element)) {
        _arguments.push_back({requiredAttribute(parameter, "NAME"),
                              optionalChild(parameter, {"VALUE", "VALUE.ARRAY", "VALUE.REFERENCE", "VALUE.REFARRAY",
                                                        "CLASSNAME", "INSTANCENAME", "CLASS", "INSTANCE",
                                                        "VALUE.NAMEDINSTANCE", "QUALIFIER.DECLARATION"})});
    }
}

} // namespace ObjectManager::CimXml

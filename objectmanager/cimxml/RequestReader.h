/** The CIM document of a request. */
#ifndef CIMXML_REQUESTREADER_H
#define CIMXML_REQUESTREADER_H

#include <pugixml.hpp>

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::CimXml {

/** An IPARAMVALUE or PARAMVALUE. */
struct Argument {
    std::string name;
    /** What it holds; null where it is null. */
    pugi::xml_node content;
};

/** One operation, as far as it can be read without knowing which. */
class Message {
public:
    /** @throws ProtocolError where the document is none that asks for one operation. */
    explicit Message(std::string_view body);
    Message(const Message&) = delete;
    Message& operator=(const Message&) = delete;

    const std::string& id() const { return _id; }
    const std::string& protocolVersion() const { return _protocolVersion; }
    /** Whether the operation is one of the object manager's, and no class's own method. */
    bool isIntrinsic() const { return _intrinsic; }
    const std::string& method() const { return _method; }
    /** For example "root/cimv2". */
    const std::string& nameSpace() const { return _nameSpace; }
    /** The CLASSNAME or INSTANCENAME whose method is called; null for intrinsic methods. */
    const pugi::xml_node& target() const { return _target; }
    /** In the order of the document. */
    const std::vector<Argument>& arguments() const { return _arguments; }

private:
    void readOperation(const pugi::xml_node& request);
    void readMethodCall(const pugi::xml_node& call);
    void readArguments(const pugi::xml_node& call, const char* element);

    pugi::xml_document _document;
    std::string _id;
    std::string _protocolVersion;
    bool _intrinsic = false;
    std::string _method;
    std::string _nameSpace;
    pugi::xml_node _target;
    std::vector<Argument> _arguments;
};

/* Elements that nobody knows are passed over. All throw ProtocolError. */

/** The one child with one of these names, or null where there is none. */
pugi::xml_node optionalChild(const pugi::xml_node& element, std::initializer_list<std::string_view> names);
/** The one child with one of these names. */
pugi::xml_node requiredChild(const pugi::xml_node& element, std::initializer_list<std::string_view> names);
/** The value of an attribute that must be there. */
std::string requiredAttribute(const pugi::xml_node& element, const char* name);
/** The namespace that a LOCALNAMESPACEPATH names. */
std::string nameSpaceOf(const pugi::xml_node& localNameSpacePath);

} // namespace ObjectManager::CimXml

#endif

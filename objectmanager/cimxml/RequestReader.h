/** Reads the CIM document of a request. */
#ifndef CIMXML_REQUESTREADER_H
#define CIMXML_REQUESTREADER_H

#include "cimxml/Markup.h"

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::CimXml {

/** An IPARAMVALUE or PARAMVALUE. */
struct Argument {
    std::string name;
    /** The element with the value; null for a null value. It belongs to the message. */
    const XmlElement* content;
};

/** One operation, read as far as that does not depend on which operation it is. */
class Message {
public:
    /** @throws ProtocolError if the document does not ask for exactly one operation. */
    explicit Message(std::string_view body);
    Message(const Message&) = delete;
    Message& operator=(const Message&) = delete;

    const std::string& id() const { return _id; }
    const std::string& protocolVersion() const { return _protocolVersion; }
    /** Whether the operation is one of the object manager's own, and not a method of a class. */
    bool isIntrinsic() const { return _intrinsic; }
    const std::string& method() const { return _method; }
    /** The namespace, for example "root/cimv2". */
    const std::string& nameSpace() const { return _nameSpace; }
    /** The CLASSNAME or INSTANCENAME whose method is called. Not for intrinsic methods. */
    const XmlElement& target() const { return *_target; }
    /** The arguments in the order of the document. */
    const std::vector<Argument>& arguments() const { return _arguments; }

private:
    void readOperation(const XmlElement& request);
    void readMethodCall(const XmlElement& call);
    void readArguments(const XmlElement& call, std::string_view element);

    XmlElement _root;
    std::string _id;
    std::string _protocolVersion;
    bool _intrinsic = false;
    std::string _method;
    std::string _nameSpace;
    /** Null for intrinsic methods. */
    const XmlElement* _target = nullptr;
    std::vector<Argument> _arguments;
};

/* These functions ignore unknown elements. All throw ProtocolError. */

/** The only child with one of these names; null if there is none. */
const XmlElement* optionalChild(const XmlElement& element, std::initializer_list<std::string_view> names);
/** The only child with one of these names, which must exist. */
const XmlElement& requiredChild(const XmlElement& element, std::initializer_list<std::string_view> names);
/** The value of an attribute, which must exist. */
const std::string& requiredAttribute(const XmlElement& element, std::string_view name);
/** The namespace that a LOCALNAMESPACEPATH names. */
std::string nameSpaceOf(const XmlElement& localNameSpacePath);

} // namespace ObjectManager::CimXml

#endif

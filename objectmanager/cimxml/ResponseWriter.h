/** CIM objects as CIM-XML writes them, one behind the other. */
#ifndef CIMXML_RESPONSEWRITER_H
#define CIMXML_RESPONSEWRITER_H

#include "cimxml/ReplyStream.h"
#include "classes/Catalogue.h"
#include "model/Operations.h"

#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** What is written of an instance or class. */
struct Selection {
    /** The properties wanted; nothing means all. */
    PropertyList properties;
    /** The class whose properties are wanted, its ancestors' included; null means all. */
    const Class* within = nullptr;
    bool classOrigin = false;
    /* Of classes only. */
    bool localOnly = false;
    bool qualifiers = false;
};

class ResponseWriter {
public:
    /**
     * The catalogue outlives the writer.
     *
     * @param host what the client calls the host. Every path has it, also where a provider named another, so that the
     *             client can follow the path.
     * @param nameSpace of paths that name none.
     * @param stream takes what is written whenever there is enough of it; null where all of it is kept.
     */
    ResponseWriter(const Catalogue& catalogue, std::string host, std::string nameSpace, ReplyStream* stream = nullptr)
        : _catalogue(catalogue), _host(std::move(host)), _nameSpace(std::move(nameSpace)), _stream(stream) {}

    /** One that writes the same, and keeps all of it. */
    ResponseWriter another() const { return {_catalogue, _host, _nameSpace}; }

    /** What was written, and is not gone already. */
    std::string take() { return std::move(_text); }
    std::size_t size() const { return _text.size(); }
    /** Drops what was written behind the first `size` bytes, where nothing is gone. */
    void truncate(std::size_t size) { _text.resize(size); }

    /** Appends markup as it is. */
    void raw(std::string_view markup) { _text += markup; }
    /** The same for what was written before, which may be much. */
    void objects(std::string_view written);
    /** Appends ` name="value"`. */
    void attribute(std::string_view name, std::string_view value);

    void error(CMPIrc code, std::string_view description);

    /** A CLASSNAME. */
    void className(std::string_view name);
    /** An INSTANCENAME. */
    void instanceName(const ObjectPath& path);
    /** An INSTANCEPATH. */
    void instancePath(const ObjectPath& path);
    /** An OBJECTPATH. */
    void objectPath(const ObjectPath& path);
    /** The OBJECTPATH of a class. */
    void classObjectPath(const std::string& name);

    /** An INSTANCE. Properties that its class declares and it has no value of are there without one. */
    void instance(const Instance& instance, const Selection& selection);
    /** A VALUE.NAMEDINSTANCE. */
    void namedInstance(const Instance& instance, const Selection& selection);
    /** A VALUE.OBJECTWITHPATH. */
    void objectWithPath(const Instance& instance, const Selection& selection);
    /** A VALUE.INSTANCEWITHPATH. */
    void instanceWithPath(const Instance& instance, const Selection& selection);

    /** A VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY; nothing where the value is null. */
    void value(const Value& value);
    /** A RETURNVALUE. */
    void returnValue(const Value& returned);
    /** A PARAMVALUE. */
    void parameter(const NamedValue& parameter);

    /** A CLASS. */
    void classDeclaration(const Class& declared, const Selection& selection);
    /** A QUALIFIER.DECLARATION. */
    void qualifierDeclaration(const QualifierType& type);
    /** A VALUE.OBJECTWITHPATH of a class. */
    void classWithPath(const Class& declared, const Selection& selection);

private:
    /** To be called where what can come many times has been written. */
    void pass() {
        if (_stream != nullptr && _text.size() >= Server::Outlet::pieceBytes) {
            send();
        }
    }
    void send();
    void localNameSpacePath(const std::string& nameSpace);
    void nameSpacePath(const std::string& nameSpace);
    void classPath(const std::string& name);
    void reference(const ObjectPath& path);
    void scalar(const Value& value);
    void key(const NamedValue& key);
    void property(const NamedValue& property, const Class* declared, const Selection& selection);
    void propertyDeclaration(const Property& property, const Class& owner, const Selection& selection);
    void methodDeclaration(const Method& method, const Class& owner, const Selection& selection);
    void parameterDeclaration(const Parameter& parameter, const Selection& selection);
    void qualifiers(const Qualifiers& qualifiers, const Selection& selection);
    void flavors(const QualifierType& type);
    void origin(const Element& element, const Class& owner, const Selection& selection);

    const Catalogue& _catalogue;
    std::string _host;
    std::string _nameSpace;
    ReplyStream* _stream;
    std::string _text;
};

} // namespace ObjectManager::CimXml

#endif

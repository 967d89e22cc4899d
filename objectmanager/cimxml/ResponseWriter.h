/** Writes CIM objects as elements of CIM-XML (DSP0201). */
#ifndef CIMXML_RESPONSEWRITER_H
#define CIMXML_RESPONSEWRITER_H

#include "cimxml/ReplyStream.h"
#include "classes/Catalogue.h"
#include "model/Operations.h"

#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** The parts of an instance or class that are written. */
struct Selection {
    /** The names of the properties; no value for all. */
    PropertyList properties;
    /** If not null, only properties that this class has, declared or inherited, are written. */
    const Class* within = nullptr;
    bool classOrigin = false;
    /* For classes only. */
    bool localOnly = false;
    bool qualifiers = false;
};

class ResponseWriter {
public:
    /**
     * The catalogue and the stream must outlive the writer.
     *
     * @param host the name that the client uses for the host. It is written in every path, even if a provider named
     *             another host, so that the client can follow the path.
     * @param nameSpace is written in paths that have no namespace.
     * @param stream gets the text, a piece at a time; if it is null, the writer keeps all text.
     */
    ResponseWriter(const Catalogue& catalogue, std::string host, std::string nameSpace, ReplyStream* stream = nullptr)
        : _catalogue(catalogue), _host(std::move(host)), _nameSpace(std::move(nameSpace)), _stream(stream) {}

    /** A writer with the same catalogue, host and namespace, which keeps all text. */
    ResponseWriter another() const { return {_catalogue, _host, _nameSpace}; }

    /** The text that was written and not passed to the stream. */
    std::string take() { return std::move(_text); }
    std::size_t size() const { return _text.size(); }
    /** Drops all text after the first `size` bytes. Not allowed if the stream has already got a piece. */
    void truncate(std::size_t size) { _text.resize(size); }

    /** Appends markup as it is. */
    void raw(std::string_view markup) { _text += markup; }
    /** Appends objects that another writer has written. */
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

    /** An INSTANCE. A property of its class for which it has no value is written without a value. */
    void instance(const Instance& instance, const Selection& selection);
    /** A VALUE.NAMEDINSTANCE. */
    void namedInstance(const Instance& instance, const Selection& selection);
    /** A VALUE.OBJECTWITHPATH. */
    void objectWithPath(const Instance& instance, const Selection& selection);
    /** A VALUE.INSTANCEWITHPATH. */
    void instanceWithPath(const Instance& instance, const Selection& selection);

    /** A VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY; writes nothing for null. */
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
    /** Sends the text if it is large enough. Called after each element that a reply can contain many times. */
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

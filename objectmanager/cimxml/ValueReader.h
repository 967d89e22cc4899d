/** Reads values, object names and instances in the form of CIM-XML. */
#ifndef CIMXML_VALUEREADER_H
#define CIMXML_VALUEREADER_H

#include "cimxml/Markup.h"
#include "classes/Catalogue.h"
#include "model/CimError.h"

#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** The limit for the keys, for the properties and for the property names in one list of a request. */
constexpr std::size_t maximumNames = 1000;

/**
 * The value of a given type that a text stands for. White space around numbers, booleans and datetimes is ignored.
 *
 * @param type any type but arrays, references and instances.
 * @throws CimError with CMPI_RC_ERR_INVALID_PARAMETER if the text is not a value of the type.
 */
Value valueOfWireText(const std::string& text, CMPIType type);

/**
 * Reads elements whose types depend on classes. The class in the catalogue decides the types; for an unknown class, the
 * document does. The names of known classes and properties are returned in the spelling of their declarations.
 *
 * Every function throws ProtocolError if an element lacks something that the document type requires, and CimError with
 * CMPI_RC_ERR_INVALID_PARAMETER if its content is wrong.
 */
class ValueReader {
public:
    /** Both arguments must outlive the reader. `nameSpace` is used for names that have no namespace. */
    ValueReader(const Catalogue& catalogue, const std::string& nameSpace)
        : _catalogue(catalogue), _nameSpace(nameSpace) {}

    /** Reads a CLASSNAME. */
    ObjectPath className(const XmlElement& element) const;
    /** Reads an INSTANCENAME. If its class is known, it must have every key. */
    ObjectPath instanceName(const XmlElement& element) const;
    /** Reads the path in a VALUE.REFERENCE. */
    ObjectPath reference(const XmlElement& valueReference) const;

    /** Reads a VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY of a type. @param what names it in messages. */
    Value value(const XmlElement& element, CMPIType type, const std::string& what) const;

    /**
     * Reads the value of a parameter from a PARAMVALUE. A reference may also be given as text, in the URI form of
     * object paths.
     */
    Value argument(const XmlElement& element, const Parameter& parameter) const;

    /**
     * Reads an INSTANCE. Its path has the keys that are among its properties. @param unknownProperty the status code
     * for a property that the class lacks: in DSP0200, it depends on the operation.
     */
    Instance instance(const XmlElement& element, CMPIrc unknownProperty) const;

private:
    ObjectPath instanceName(const XmlElement& element, const std::string& nameSpace) const;
    Value keyValue(const XmlElement& element, const Property* declared, const std::string& what) const;
    Value array(const XmlElement& element, CMPIType elementType, const std::string& what) const;
    NamedValue property(const XmlElement& element, const Class* declared, CMPIrc unknown) const;
    void requireKeys(const ObjectPath& path) const;

    const Catalogue& _catalogue;
    const std::string& _nameSpace;
};

} // namespace ObjectManager::CimXml

#endif

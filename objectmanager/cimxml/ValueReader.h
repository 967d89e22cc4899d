/** Values, object names and instances as CIM-XML writes them. */
#ifndef CIMXML_VALUEREADER_H
#define CIMXML_VALUEREADER_H

#include "cimxml/Markup.h"
#include "classes/Catalogue.h"
#include "model/CimError.h"

#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** How many keys, properties and names of properties a request may list. */
constexpr std::size_t maximumNames = 1000;

/**
 * The value that a text means in a type. White space around numbers, truth values and dates does not matter.
 *
 * @param type no array, no reference and no instance.
 * @throws CimError with CMPI_RC_ERR_INVALID_PARAMETER where the text says no value of the type.
 */
Value valueOfWireText(const std::string& text, CMPIType type);

/**
 * Reads what names classes decide the types of: the catalogue's class does, and what the document says where it knows
 * none. Names of known classes and properties are spelled as they are declared.
 *
 * Everything throws ProtocolError where an element lacks what the document type demands, and CimError with
 * CMPI_RC_ERR_INVALID_PARAMETER where what it says is wrong.
 */
class ValueReader {
public:
    /** Both outlive the reader. `nameSpace` is that of names that say none. */
    ValueReader(const Catalogue& catalogue, const std::string& nameSpace)
        : _catalogue(catalogue), _nameSpace(nameSpace) {}

    /** A CLASSNAME. */
    ObjectPath className(const XmlElement& element) const;
    /** An INSTANCENAME; of a known class, with every key. */
    ObjectPath instanceName(const XmlElement& element) const;
    /** What a VALUE.REFERENCE holds. */
    ObjectPath reference(const XmlElement& valueReference) const;

    /** A VALUE, VALUE.ARRAY, VALUE.REFERENCE or VALUE.REFARRAY of a type; `what` it is the value of. */
    Value value(const XmlElement& element, CMPIType type, const std::string& what) const;

    /**
     * What a PARAMVALUE holds, as the value of the parameter. A reference may also come as a text, in the form in which
     * people write object paths.
     */
    Value argument(const XmlElement& element, const Parameter& parameter) const;

    /**
     * An INSTANCE. Its path has the keys that are among its properties. For a property that its class lacks, DSP0200
     * has a code with one operation that it has not with another: it is `unknownProperty`.
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

/** The parameters of an intrinsic method. */
#ifndef CIMXML_PARAMETERS_H
#define CIMXML_PARAMETERS_H

#include "cimxml/RequestReader.h"
#include "cimxml/ValueReader.h"
#include "model/Operations.h"

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager::CimXml {

/** The names of a method's parameters; the rest of the array is empty. */
using ParameterNames = std::array<std::string_view, 12>;

/**
 * The parameters of a request. Every function throws CimError with CMPI_RC_ERR_INVALID_PARAMETER if a parameter has a
 * value of another kind, or if it is missing and has no default; it throws ProtocolError if an element lacks something
 * that the document type requires. A parameter without a value counts as missing.
 */
class Parameters {
public:
    /**
     * Message and catalogue must outlive this object. Throws if a parameter is not among the names, or is given twice.
     */
    Parameters(const Message& message, const Catalogue& catalogue, const ParameterNames& names);

    bool flag(std::string_view name, bool otherwise) const;
    /** A uint32; no value if the parameter is missing. */
    std::optional<std::uint32_t> optionalNumber(std::string_view name) const;
    std::uint32_t number(std::string_view name) const;
    std::string text(std::string_view name) const;
    /** Empty if the parameter is missing. */
    std::string optionalText(std::string_view name) const;
    /** A class, as a path without keys. */
    ObjectPath className(std::string_view name) const;
    /** Empty if the parameter is missing. */
    std::string optionalClassName(std::string_view name) const;
    ObjectPath instanceName(std::string_view name) const;
    /** Whether a parameter that names a class or an instance names a class. */
    bool isClassName(std::string_view name) const;
    PropertyList propertyList() const;
    Instance instance(std::string_view name) const;
    /**
     * An instance, with its own name as its path. Throws CMPI_RC_ERR_NO_SUCH_PROPERTY for a property that its class
     * lacks.
     */
    Instance namedInstance(std::string_view name) const;
    /** The value of a property; null if the parameter is missing. */
    Value value(std::string_view name, CMPIType type) const;

private:
    const XmlElement* optional(std::string_view name, std::initializer_list<std::string_view> elements) const;
    const XmlElement& required(std::string_view name, std::initializer_list<std::string_view> elements) const;

    const Message& _message;
    ValueReader _reader;
};

} // namespace ObjectManager::CimXml

#endif

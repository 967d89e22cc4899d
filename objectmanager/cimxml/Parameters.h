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

/** What a method takes; the rest is empty. */
using ParameterNames = std::array<std::string_view, 12>;

/**
 * Every function throws CimError with CMPI_RC_ERR_INVALID_PARAMETER where a parameter is no such value or, if it has no
 * default, is missing; ProtocolError where an element lacks what the document type demands. A parameter without a value
 * is the same as none.
 */
class Parameters {
public:
    /** Both outlive the parameters. Throws where a parameter is none of the names, or comes twice. */
    Parameters(const Message& message, const Catalogue& catalogue, const ParameterNames& names);

    bool flag(std::string_view name, bool otherwise) const;
    /** A uint32; nothing where it is missing. */
    std::optional<std::uint32_t> optionalNumber(std::string_view name) const;
    std::uint32_t number(std::string_view name) const;
    std::string text(std::string_view name) const;
    /** Empty where it is missing. */
    std::string optionalText(std::string_view name) const;
    /** A class as a path without keys. */
    ObjectPath className(std::string_view name) const;
    /** Empty where it is missing. */
    std::string optionalClassName(std::string_view name) const;
    ObjectPath instanceName(std::string_view name) const;
    /** Whether the parameter, the name of a class or of an instance, is that of a class. */
    bool isClassName(std::string_view name) const;
    PropertyList propertyList() const;
    Instance instance(std::string_view name) const;
    /** An instance, with its own name as its path. A property that its class lacks is CMPI_RC_ERR_NO_SUCH_PROPERTY. */
    Instance namedInstance(std::string_view name) const;
    /** The value of a property, null where the parameter is missing. */
    Value value(std::string_view name, CMPIType type) const;

private:
    const XmlElement* optional(std::string_view name, std::initializer_list<std::string_view> elements) const;
    const XmlElement& required(std::string_view name, std::initializer_list<std::string_view> elements) const;

    const Message& _message;
    ValueReader _reader;
};

} // namespace ObjectManager::CimXml

#endif

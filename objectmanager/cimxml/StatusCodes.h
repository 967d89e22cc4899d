/** The status codes of CIM (DSP0200). Those that CMPI has no names for are returned by no provider. */
#ifndef CIMXML_STATUSCODES_H
#define CIMXML_STATUSCODES_H

#include "model/CimError.h"

namespace ObjectManager::CimXml {

constexpr auto invalidEnumerationContext = static_cast<CMPIrc>(21);
constexpr auto invalidOperationTimeout = static_cast<CMPIrc>(22);
constexpr auto filteredEnumerationNotSupported = static_cast<CMPIrc>(25);
constexpr auto continuationOnErrorNotSupported = static_cast<CMPIrc>(26);

/** A code as clients are told it: what is none of CIM's is a failure. */
constexpr CMPIrc sentCode(CMPIrc code) {
    const bool known = (code > CMPI_RC_OK && code <= CMPI_RC_ERR_METHOD_NOT_FOUND) ||
                       (code >= invalidEnumerationContext && code <= serverLimitsExceeded);
    return known ? code : CMPI_RC_ERR_FAILED;
}

} // namespace ObjectManager::CimXml

#endif

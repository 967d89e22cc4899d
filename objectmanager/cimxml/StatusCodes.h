/** The status codes of CIM (DSP0200) for which CMPI has no names. No provider returns them. */
#ifndef CIMXML_STATUSCODES_H
#define CIMXML_STATUSCODES_H

#include "model/CimError.h"

namespace ObjectManager::CimXml {

constexpr auto invalidEnumerationContext = static_cast<CMPIrc>(21);
constexpr auto invalidOperationTimeout = static_cast<CMPIrc>(22);
constexpr auto filteredEnumerationNotSupported = static_cast<CMPIrc>(25);
constexpr auto continuationOnErrorNotSupported = static_cast<CMPIrc>(26);

/** The status code that a client gets: a code that DSP0200 does not define becomes CIM_ERR_FAILED. */
constexpr CMPIrc sentCode(CMPIrc code) {
    const bool known = (code > CMPI_RC_OK && code <= CMPI_RC_ERR_METHOD_NOT_FOUND) ||
                       (code >= invalidEnumerationContext && code <= serverLimitsExceeded);
    return known ? code : CMPI_RC_ERR_FAILED;
}

} // namespace ObjectManager::CimXml

#endif

/** The status codes of CIM (DSP0200) that CMPI has no names for, since no provider returns them. */
#ifndef CIMXML_STATUSCODES_H
#define CIMXML_STATUSCODES_H

#include "cmpidt.h"

namespace ObjectManager::CimXml {

constexpr auto invalidEnumerationContext = static_cast<CMPIrc>(21);
constexpr auto invalidOperationTimeout = static_cast<CMPIrc>(22);
constexpr auto filteredEnumerationNotSupported = static_cast<CMPIrc>(25);
constexpr auto continuationOnErrorNotSupported = static_cast<CMPIrc>(26);
constexpr auto serverLimitsExceeded = static_cast<CMPIrc>(27);

} // namespace ObjectManager::CimXml

#endif

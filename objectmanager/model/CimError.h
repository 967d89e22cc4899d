/** How a CIM operation fails. */
#ifndef OBJECTMANAGER_CIMERROR_H
#define OBJECTMANAGER_CIMERROR_H

#include "cmpidt.h"

#include <stdexcept>
#include <string>
#include <vector>

namespace ObjectManager {

/** The status code CIM_ERR_SERVER_LIMITS_EXCEEDED (DSP0200), which CMPI has no name for. */
constexpr auto serverLimitsExceeded = static_cast<CMPIrc>(27);

/** An operation that failed; what() is one line for the person who asked. */
struct CimError : std::runtime_error {
    CimError(CMPIrc failure, const std::string& message) : std::runtime_error(message), code(failure) {}

    /** Never CMPI_RC_OK. */
    CMPIrc code;
    /** A method was refused, though the provider tells of no failure: what() and the reasons say all there is to say.
     */
    bool refused = false;
    /** What the provider logged as failures meanwhile, in that order. */
    std::vector<std::string> reasons;
};

} // namespace ObjectManager

#endif

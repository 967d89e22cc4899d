/** The exception with which a CIM operation fails. */
#ifndef MODEL_CIMERROR_H
#define MODEL_CIMERROR_H

#include "cmpidt.h"

#include <stdexcept>
#include <string>
#include <vector>

namespace ObjectManager {

/** The status code CIM_ERR_SERVER_LIMITS_EXCEEDED (DSP0200), for which CMPI has no name. */
constexpr auto serverLimitsExceeded = static_cast<CMPIrc>(27);

/** The failure of an operation. what() says in one line what went wrong, for the person who asked for the operation. */
struct CimError : std::runtime_error {
    CimError(CMPIrc failure, const std::string& message) : std::runtime_error(message), code(failure) {}

    /** A status code of DSP0200, or a return code of CMPI; never CMPI_RC_OK. */
    CMPIrc code;
    /**
     * Whether a call of a method was refused although the provider reported no failure. The user needs no code then:
     * what() and `reasons` say everything.
     */
    bool refused = false;
    /** The messages of the failures that the provider logged during the operation, in the order of the log. */
    std::vector<std::string> reasons;
};

} // namespace ObjectManager

#endif

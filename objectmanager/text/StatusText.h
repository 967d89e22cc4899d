/**
 * The names of return codes.
 */
#ifndef TEXT_STATUSTEXT_H
#define TEXT_STATUSTEXT_H

#include "cmpidt.h"

#include <string>

namespace ObjectManager {

/**
 * The code by name and number: "CIM_ERR_NOT_FOUND (6)" for those of CIM operations, "CMPI_RC_ERROR_SYSTEM (100)" for
 * those of the provider interface, "return code (1234)" for any other.
 */
std::string statusText(CMPIrc code);

} // namespace ObjectManager

#endif

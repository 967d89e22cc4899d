/**
 * Why an operation failed, in words.
 */
#ifndef TEXT_STATUSTEXT_H
#define TEXT_STATUSTEXT_H

#include "cmpidt.h"

#include <string>
#include <vector>

namespace ObjectManager {

/**
 * The code by name and number: "CIM_ERR_NOT_FOUND (6)" for those of CIM operations, "CMPI_RC_ERROR_SYSTEM (100)" for
 * those of the provider interface, "return code (1234)" for any other.
 */
std::string statusText(CMPIrc code);

/** What failures the messages tell of, each said once; begins with `introduction` where they tell of any. */
std::string reasonsText(const std::vector<std::string>& messages, const char* introduction);

} // namespace ObjectManager

#endif

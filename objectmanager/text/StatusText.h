/**
 * The reasons of failed operations in words.
 */
#ifndef TEXT_STATUSTEXT_H
#define TEXT_STATUSTEXT_H

#include "cmpidt.h"

#include <string>
#include <vector>

namespace ObjectManager {

/**
 * The name and number of a code: "CIM_ERR_NOT_FOUND (6)" for status codes of CIM operations, "CMPI_RC_ERROR_SYSTEM
 * (100)" for codes of CMPI, "return code (1234)" for any other number.
 */
std::string statusText(CMPIrc code);

/** Joins the messages, each of them once, behind `introduction`; empty if there are no messages. */
std::string reasonsText(const std::vector<std::string>& messages, const char* introduction);

} // namespace ObjectManager

#endif

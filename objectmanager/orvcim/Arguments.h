/**
 * Method arguments from the command line.
 */
#ifndef ORVCIM_ARGUMENTS_H
#define ORVCIM_ARGUMENTS_H

#include "classes/Catalogue.h"
#include "model/Model.h"

#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::Orvcim {

/**
 * Parses input arguments of the form NAME=VALUE. @return them in the order of the method's parameters. For an array
 * parameter, NAME=VALUE is given once for each element.
 *
 * @param nameSpace is used for references that name no namespace.
 * @throws UsageError if a text is not of the form NAME=VALUE; CimError with CMPI_RC_ERR_INVALID_PARAMETER if the method
 *         has no such input parameter, a required one is missing, one that is not an array is given twice, or a value
 *         does not fit its type.
 */
std::vector<NamedValue> parseArguments(const std::vector<std::string>& texts, const Method& method,
                                       const Catalogue& catalogue, std::string_view nameSpace);

} // namespace ObjectManager::Orvcim

#endif

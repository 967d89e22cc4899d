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
 * The input arguments that texts of the form NAME=VALUE say, in the order of the method's parameters. An argument for
 * an array parameter is given once for each element.
 *
 * @param nameSpace of references that name none.
 * @throws UsageError where a text has another form; CimError with CMPI_RC_ERR_INVALID_PARAMETER where there is no such
 *         input parameter, one that is required is missing, one that is no array is given twice, or a value is none of
 *         its type.
 */
std::vector<NamedValue> parseArguments(const std::vector<std::string>& texts, const Method& method,
                                       const Catalogue& catalogue, std::string_view nameSpace);

} // namespace ObjectManager::Orvcim

#endif

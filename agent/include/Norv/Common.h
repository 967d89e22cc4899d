/**
 * Functions that all parts of the management agent share: liborvcommon.so.1.
 */
#ifndef NORV_COMMON_H
#define NORV_COMMON_H

#include "cmpidt.h"

#include <string>

namespace Norv {

/**
 * The managed system's name: the configured name, else the fully qualified host name.
 *
 * @return the name, which is never empty and stays the same until the process ends.
 */
std::string getSystemName();

/**
 * Whether two object paths name the same instance (DSP0004, "naming"): their class names, namespaces, and keys are
 * equal. Letter case does not matter in names, but does in values of keys. Reference keys are compared as object paths.
 *
 * @param left,right the paths, which are neither changed nor kept. A null path, or one that holds nothing, is equal to
 * no path.
 * @param flag if true, host names and namespaces do not matter in reference keys, since object managers set them
 *             differently.
 */
bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool flag);

} // namespace Norv

#endif

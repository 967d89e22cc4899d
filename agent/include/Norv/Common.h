/**
 * Services that every part of the management agent shares: liborvcommon.so.1.
 */
#ifndef NORV_COMMON_H
#define NORV_COMMON_H

#include "cmpidt.h"

#include <string>

namespace Norv {

/**
 * The managed system's name: the configured one, else the fully qualified host name.
 *
 * @return the name, the same one for the life of the process; never empty.
 */
std::string getSystemName();

/**
 * Whether two object paths name the same instance (DSP0004, "naming"): equal class names and namespaces without regard
 * to letter case, and the same keys, their names without regard to letter case and their values exactly. Reference keys
 * are compared as object paths.
 *
 * @param left,right the paths, not changed and not kept. A null path, or one that holds nothing, equals no path.
 * @param flag true leaves host names and namespaces out of the comparison of reference keys, since object managers
 *             fill them differently.
 */
bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool flag);

} // namespace Norv

#endif

/**
 * Reads class declarations in the Managed Object Format (DSP0004).
 */
#ifndef CLASSES_MOFREADER_H
#define CLASSES_MOFREADER_H

#include "classes/Class.h"
#include "classes/MofLexer.h"

#include <string_view>
#include <vector>

namespace ObjectManager {

/**
 * The classes that a text declares, in its order. Nothing but class declarations is understood; compiler directives are
 * skipped, and the flavors of qualifiers read over.
 *
 * @param file the name that errors give.
 * @throws SchemaError
 */
std::vector<Class> readMof(std::string_view text, std::string_view file);

} // namespace ObjectManager

#endif

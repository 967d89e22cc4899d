/**
 * Reads declarations of classes and qualifier types in the Managed Object Format (DSP0004).
 */
#ifndef CLASSES_MOFREADER_H
#define CLASSES_MOFREADER_H

#include "classes/Class.h"
#include "classes/MofLexer.h"
#include "classes/QualifierType.h"

#include <string_view>
#include <vector>

namespace ObjectManager {

/** What a text declares, each kind in its order. */
struct Declarations {
    std::vector<Class> classes;
    std::vector<QualifierType> qualifierTypes;
};

/**
 * The classes and qualifier types that a text declares. Compiler directives, and flavors where a qualifier is used, are
 * read over.
 *
 * @param file the name that errors give.
 * @throws SchemaError also where the text has anything else than declarations of classes and qualifier types.
 */
Declarations readMof(std::string_view text, std::string_view file);

} // namespace ObjectManager

#endif

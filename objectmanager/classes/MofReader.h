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

/** The declarations in a text; each kind in the order of the text. */
struct Declarations {
    std::vector<Class> classes;
    std::vector<QualifierType> qualifierTypes;
};

/**
 * Reads the classes and qualifier types that a text declares. Compiler directives are ignored, and so are flavors that
 * stand behind a qualifier of a class or of an element.
 *
 * @param file the file's name, for error messages.
 * @throws SchemaError if the text has mistakes, or contains anything but declarations of classes and qualifier types.
 */
Declarations readMof(std::string_view text, std::string_view file);

} // namespace ObjectManager

#endif

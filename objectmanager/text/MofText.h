/**
 * Values, instances and classes in the Managed Object Format (DSP0004).
 */
#ifndef TEXT_MOFTEXT_H
#define TEXT_MOFTEXT_H

#include "classes/Class.h"
#include "model/Model.h"

#include <string>

namespace ObjectManager {

/**
 * The value as a literal: 5, "text", TRUE, {1, 2} or NULL. A reference or an embedded instance becomes a text in
 * quotes.
 */
std::string mofLiteral(const Value& value);

/** "instance of CLASS { ... };" and a line end. */
std::string mofInstance(const Instance& instance);

/** The class declaration and a line end. */
std::string mofClass(const Class& declared);

} // namespace ObjectManager

#endif

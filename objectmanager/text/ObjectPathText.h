/**
 * Object paths in the text form that people write:
 *
 *     [//HOST/][NAMESPACE:]CLASS[.KEY=VALUE,KEY=VALUE...]
 *
 * A VALUE is a string, a datetime or an object path in double quotes, a character in single quotes, or a number, TRUE
 * or FALSE without quotes. Within quotes, a backslash stands before each quote and each backslash.
 */
#ifndef TEXT_OBJECTPATHTEXT_H
#define TEXT_OBJECTPATHTEXT_H

#include "classes/Catalogue.h"
#include "model/Model.h"

#include <stdexcept>
#include <string>
#include <string_view>

namespace ObjectManager {

/**
 * A text that is not an object path. what() is one line that names the text, the position of the mistake (from 1), and
 * what was expected there.
 */
class ObjectPathError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/**
 * The object path that a text names.
 *
 * @param catalogue decides the types of the keys and the letter case of names. If it does not know the class, a value
 * in double quotes is a string, and a number is an sint64, uint64 or real64.
 * @param defaultNameSpace is used if the text names no namespace; a path within a key has the outer path's namespace
 * then.
 * @throws ObjectPathError if the text is not an object path, or if a known class has no such key or one of another
 * type.
 */
ObjectPath parseObjectPath(std::string_view text, const Catalogue& catalogue, std::string_view defaultNameSpace);

/** The path as text, with the host names that it has. `parseObjectPath` reads this form. */
std::string formatObjectPath(const ObjectPath& path);

/** The path as text, without its host name and the host names of paths in its keys. */
std::string formatLocalPath(const ObjectPath& path);

} // namespace ObjectManager

#endif

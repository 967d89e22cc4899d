/**
 * Object paths in the form in which people write them:
 *
 *     [//HOST/][NAMESPACE:]CLASS[.KEY=VALUE,KEY=VALUE...]
 *
 * A value is a string, a datetime or an object path in double quotes, a character in single quotes, or a number, TRUE
 * or FALSE without quotes. In quotes, a quote or backslash has a backslash before it.
 */
#ifndef TEXT_OBJECTPATHTEXT_H
#define TEXT_OBJECTPATHTEXT_H

#include "classes/Catalogue.h"
#include "model/Model.h"

#include <stdexcept>
#include <string>
#include <string_view>

namespace ObjectManager {

/** A text that is no object path. what() is one line naming the text, the position (from 1), and what was expected. */
class ObjectPathError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/**
 * The object path that a text names.
 *
 * @param catalogue decides the types of the keys and the letter case of names. In a class that it does not know what
 * stands in double quotes is a string, and a number an sint64, uint64 or real64.
 * @param defaultNameSpace of a text that names none; in reference keys, the namespace of the outer path.
 * @throws ObjectPathError also where a known class has no such key, or its type is another.
 */
ObjectPath parseObjectPath(std::string_view text, const Catalogue& catalogue, std::string_view defaultNameSpace);

/** The path as text, host names included where they are known. `parseObjectPath` reads it back. */
std::string formatObjectPath(const ObjectPath& path);

/** The path as text without its host name; so are the paths in its keys. */
std::string formatLocalPath(const ObjectPath& path);

} // namespace ObjectManager

#endif

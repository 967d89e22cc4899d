/**
 * Reads provider registrations: which library serves which class. Files have one section a class,
 *
 *     [CLASS]
 *        provider: NAME
 *        location: NAME
 *        type: instance method association property indication
 *        namespace: NAMESPACE NAMESPACE
 *        methods: METHOD METHOD
 *
 * with lines in any order, and comments behind #. Without "methods", the provider is taken to implement every method of
 * the class. "unload" and "group" are for object managers that run providers in processes of their own; they are read
 * over.
 */
#ifndef REGISTRY_REGISTRATIONREADER_H
#define REGISTRY_REGISTRATIONREADER_H

#include "registry/Registry.h"

#include <filesystem>
#include <string_view>
#include <vector>

namespace ObjectManager {

/**
 * The registrations in a text, in its order.
 *
 * @param file the name that errors give.
 * @throws SchemaError
 */
std::vector<Registration> readRegistrations(std::string_view text, std::string_view file);

/**
 * The registrations in all .reg files of a folder.
 *
 * @throws SchemaError also where the folder or a file cannot be read.
 */
std::vector<Registration> readRegistrations(const std::filesystem::path& folder);

} // namespace ObjectManager

#endif

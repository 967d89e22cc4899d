/**
 * Reads provider registrations: which library serves which class. A file has one section for each class,
 *
 *     [CLASS]
 *        provider: NAME
 *        location: NAME
 *        type: instance method association property indication
 *        namespace: NAMESPACE NAMESPACE
 *        methods: METHOD METHOD
 *
 * with lines in any order, and comments behind #. Without "methods", the provider counts as one that implements every
 * method of the class. The keys "unload" and "group" are for object managers that run providers in separate processes;
 * they are ignored here.
 */
#ifndef REGISTRY_REGISTRATIONREADER_H
#define REGISTRY_REGISTRATIONREADER_H

#include "registry/Registry.h"

#include <filesystem>
#include <string_view>
#include <vector>

namespace ObjectManager {

/**
 * The registrations in a text, in the order of the text.
 *
 * @param file the file's name, for error messages.
 * @throws SchemaError
 */
std::vector<Registration> readRegistrations(std::string_view text, std::string_view file);

/**
 * The registrations in all .reg files of a folder.
 *
 * @throws SchemaError if a file has mistakes, or the folder or a file cannot be read.
 */
std::vector<Registration> readRegistrations(const std::filesystem::path& folder);

} // namespace ObjectManager

#endif

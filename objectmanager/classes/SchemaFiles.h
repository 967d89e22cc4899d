/**
 * The files of a schema folder.
 */
#ifndef CLASSES_SCHEMAFILES_H
#define CLASSES_SCHEMAFILES_H

#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/**
 * The files of a folder whose names end in `extension`, sorted by name.
 *
 * @throws SchemaError if the folder cannot be read.
 */
std::vector<std::filesystem::path> filesOf(const std::filesystem::path& folder, std::string_view extension);

/** The content of a file. @throws SchemaError if it cannot be read. */
std::string readFile(const std::filesystem::path& file);

} // namespace ObjectManager

#endif

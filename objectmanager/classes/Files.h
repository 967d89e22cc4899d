/**
 * The files of a schema folder.
 */
#ifndef CLASSES_FILES_H
#define CLASSES_FILES_H

#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/**
 * The files of a folder that end in `extension`, by name.
 *
 * @throws SchemaError where the folder cannot be read.
 */
std::vector<std::filesystem::path> filesOf(const std::filesystem::path& folder, std::string_view extension);

/** @throws SchemaError where the file cannot be read. */
std::string readFile(const std::filesystem::path& file);

} // namespace ObjectManager

#endif

/** Reads files. */
#ifndef BASICS_FILES_H
#define BASICS_FILES_H

#include <filesystem>
#include <string>

namespace ObjectManager {

/** The content of a file. @throws std::system_error if it cannot be read; its code is the reason. */
std::string contentOf(const std::filesystem::path& file);

} // namespace ObjectManager

#endif

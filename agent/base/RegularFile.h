#ifndef BASE_REGULARFILE_H
#define BASE_REGULARFILE_H

#include "FileSignature.h"

#include <filesystem>
#include <optional>
#include <string>

namespace Norv::Agent {

/** What a file holds, and what tells it from what it holds at other times. */
struct FileContent {
    FileSignature signature;
    std::string text;
};

/** More than any file has that a person or the agent writes, in bytes. */
inline constexpr off_t largestFile = off_t{16} * 1024 * 1024;

/**
 * Reads a regular file of `largestFile` bytes at most. What is none, such as a pipe, is not waited for.
 *
 * @return nothing where there is no file.
 * @throws std::system_error where it cannot be read: EINVAL where it is no regular file, EFBIG where it is larger;
 *         what() names the file. std::bad_alloc where memory is short, and nothing else then.
 */
std::optional<FileContent> readRegularFile(const std::filesystem::path& file);

} // namespace Norv::Agent

#endif

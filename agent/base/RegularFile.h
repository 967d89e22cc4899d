#ifndef BASE_REGULARFILE_H
#define BASE_REGULARFILE_H

#include "FileSignature.h"

#include <filesystem>
#include <optional>
#include <string>

namespace Norv::Agent {

/** The content of a file, and a signature by which a later change can be noticed. */
struct FileContent {
    FileSignature signature;
    std::string text;
};

/** The largest file that is read, in bytes: larger than any file that a person or the agent writes. */
inline constexpr off_t largestFile = off_t{16} * 1024 * 1024;

/**
 * Reads a regular file of `largestFile` bytes at most. Does not wait for another kind of file, such as a pipe.
 *
 * @return no value if the file does not exist.
 * @throws std::system_error if the file cannot be read: with EINVAL if it is not a regular file, with EFBIG if it is
 *         too large; what() names the file. std::bad_alloc if there is too little memory, and then nothing else.
 */
std::optional<FileContent> readRegularFile(const std::filesystem::path& file);

} // namespace Norv::Agent

#endif

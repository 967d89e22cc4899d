#ifndef BASE_LOCKFILE_H
#define BASE_LOCKFILE_H

#include "Deadline.h"
#include "Descriptor.h"

#include <filesystem>

namespace Norv::Agent {

/**
 * A file that one thread of one process has at a time. It is made where it is missing, for the owner of its folder
 * only, so that nobody else can take it and keep the owner waiting; what others have put in its place is refused.
 * Whoever has the file is named in it.
 */
class LockFile {
public:
    /**
     * Waits until nobody else has the file.
     *
     * @throws std::system_error where the file cannot be used, or somebody has it until the deadline; what() names him.
     */
    LockFile(const std::filesystem::path& file, const Deadline& deadline);
    ~LockFile();
    LockFile(const LockFile&) = delete;
    LockFile& operator=(const LockFile&) = delete;

private:
    Descriptor _file;
};

} // namespace Norv::Agent

#endif

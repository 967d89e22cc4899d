#ifndef BASE_LOCKFILE_H
#define BASE_LOCKFILE_H

#include "Deadline.h"
#include "Descriptor.h"

#include <filesystem>

namespace Norv::Agent {

/**
 * A lock on a file, which one thread of one process holds at a time. A missing file is made, for the owner of its
 * folder only, so that no other user can lock it and keep the owner waiting; a file that another user has put in its
 * place is refused. The process that holds the lock is named in the file.
 */
class LockFile {
public:
    /**
     * Waits until no other thread or process holds the lock, and takes it.
     *
     * @throws std::system_error if the file cannot be used, or another process holds the lock until the deadline;
     * what() names the file and that process.
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

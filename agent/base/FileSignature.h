#ifndef BASE_FILESIGNATURE_H
#define BASE_FILESIGNATURE_H

#include <chrono>

#include <sys/stat.h>

namespace Norv::Agent {

/** Identifies the content of a file: it differs if another file has taken the name or the content was changed. */
struct FileSignature {
    dev_t device;
    ino_t inode;
    off_t size;
    /** The time of the last change, since 1970 (UTC). */
    std::chrono::nanoseconds modified;

    explicit FileSignature(const struct stat& status)
        : device(status.st_dev), inode(status.st_ino), size(status.st_size),
          modified(std::chrono::seconds(status.st_mtim.tv_sec) + std::chrono::nanoseconds(status.st_mtim.tv_nsec)) {}

    bool operator==(const FileSignature&) const = default;
};

} // namespace Norv::Agent

#endif

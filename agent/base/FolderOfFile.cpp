#include "FolderOfFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

namespace Norv::Agent {

namespace {

constexpr int folderFlags = O_PATH | O_DIRECTORY | O_CLOEXEC;

/**
 * Whether a user other than root may make links in an open folder that root would follow. In a folder with the sticky
 * bit, such as /tmp, the kernel lets a process follow only links of its own user.
 */
bool isOthers(const Descriptor& folder) {
    struct stat status {};
    return ::fstat(folder.number(), &status) != 0 || status.st_uid != 0 ||
           ((status.st_mode & (S_IWGRP | S_IWOTH)) != 0 && (status.st_mode & S_ISVTX) == 0);
}

/**
 * Opens the folder of a file step by step. `isGuarded` becomes true at the first folder in which another user may make
 * links.
 */
Descriptor enterFolder(const std::string& file, bool& isGuarded) {
    Descriptor folder(::open("/", folderFlags));
    std::size_t begin = file.find_first_not_of('/');
    for (std::size_t end = file.find('/', begin); folder.isOpen() && end != std::string::npos;
         end = file.find('/', begin)) {
        const std::string name = file.substr(begin, end - begin);
        folder = Descriptor(::openat(folder.number(), name.c_str(), folderFlags | (isGuarded ? O_NOFOLLOW : 0)));
        isGuarded = isGuarded || (folder.isOpen() && isOthers(folder));
        begin = file.find_first_not_of('/', end);
    }
    return folder;
}

Descriptor openFolder(const std::string& file, bool& isGuarded) {
    return ::geteuid() == 0 ? enterFolder(file, isGuarded)
                            : Descriptor(::open(file.substr(0, file.rfind('/') + 1).c_str(), folderFlags));
}

} // namespace

FolderOfFile::FolderOfFile(const std::string& file)
    : _name(file.substr(file.rfind('/') + 1)), _folder(openFolder(file, _isGuarded)) {}

Descriptor FolderOfFile::openFile(int flags, mode_t mode) const {
    Descriptor file(::openat(_folder.number(), _name.c_str(), flags | (_isGuarded ? O_NOFOLLOW : 0), mode));
    struct stat status {};
    if (file.isOpen() && _isGuarded && ::fstat(file.number(), &status) == 0 && status.st_nlink > 1) {
        file = Descriptor(-1);
        errno = EMLINK;
    }
    return file;
}

} // namespace Norv::Agent

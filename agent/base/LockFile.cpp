#include "LockFile.h"

#include "Folders.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <ctime>
#include <string>
#include <system_error>

namespace Norv::Agent {

namespace {

/** @throws std::system_error with the number in errno. */
[[noreturn]] void fail(const std::filesystem::path& path, const char* problem) {
    throw std::system_error(errno, std::generic_category(), path.string() + ": " + problem);
}

/** The same with another error number. */
[[noreturn]] void fail(const std::filesystem::path& path, const std::string& problem, int error) {
    throw std::system_error(error, std::generic_category(), path.string() + ": " + problem);
}

/**
 * Writes into the file which process has locked it, for the messages of others. A failure is ignored: the file is
 * locked without the text, too.
 */
void writeHolder(const Descriptor& file) {
    const std::string holder = std::string(program_invocation_short_name) + ", process " + std::to_string(getpid());
    if (::ftruncate(file.number(), 0) == 0) {
        [[maybe_unused]] const ssize_t written = ::pwrite(file.number(), holder.data(), holder.size(), 0);
    }
}

/** The process that has locked the file, for people. */
std::string holderIn(const Descriptor& file) {
    std::array<char, 100> text{};
    const ssize_t size = ::pread(file.number(), text.data(), text.size(), 0);
    std::string holder(text.data(), static_cast<std::size_t>(std::max<ssize_t>(size, 0)));
    std::ranges::replace_if(
        holder, [](unsigned char character) { return character < 0x20 || character == 0x7f; }, ' ');
    return holder.empty() ? "a process that is not named in it" : holder;
}

// The name may have been replaced by a symbolic link or a named pipe: the former must not be followed, and opening the
// latter must not wait.
constexpr int openFlags = O_RDWR | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY;
constexpr mode_t forOwnerOnly = 0600;

/** The owner of the file's folder. Root may use a lock file that belongs to this user. */
uid_t ownerOfFolder(const std::filesystem::path& file) {
    struct stat folder {};
    if (::stat(file.parent_path().c_str(), &folder) != 0) {
        fail(file.parent_path(), "cannot be read");
    }
    return folder.st_uid;
}

/** Makes the file. @return a descriptor that is not open if the file exists, or cannot be made. */
Descriptor make(const std::filesystem::path& file) {
    Descriptor made(::open(file.c_str(), openFlags | O_CREAT | O_EXCL, forOwnerOnly));
    if (made.isOpen() && !giveToOwnerOfFolder(made, file)) {
        fail(file, "cannot be given to the owner of its folder");
    }
    return made;
}

/**
 * Refuses an existing file that need not be a lock file of ours: one that another user owns, or that has a second name.
 */
void requireOwn(const Descriptor& found, const std::filesystem::path& file) {
    struct stat status {};
    if (::fstat(found.number(), &status) != 0) {
        fail(file, "cannot be opened");
    }
    if (!S_ISREG(status.st_mode) || status.st_nlink != 1) {
        fail(file, "is not a regular file with a single name: remove it", EINVAL);
    }
    if (status.st_uid != ::geteuid() && status.st_uid != ownerOfFolder(file)) {
        fail(file, "belongs to uid " + std::to_string(status.st_uid) + ": remove it", EPERM);
    }
    if ((status.st_mode & ~S_IFMT) != forOwnerOnly && ::fchmod(found.number(), forOwnerOnly) != 0) {
        fail(file, "is open to others");
    }
}

Descriptor openOwn(const std::filesystem::path& file) {
    if (Descriptor made = make(file); made.isOpen()) {
        return made;
    }
    if (errno != EEXIST) {
        fail(file, "cannot be created");
    }
    Descriptor found(::open(file.c_str(), openFlags));
    if (!found.isOpen()) {
        fail(file, errno == ELOOP ? "is a link: remove it" : "cannot be opened");
    }
    requireOwn(found, file);
    return found;
}

} // namespace

LockFile::LockFile(const std::filesystem::path& file, const Deadline& deadline) : _file(openOwn(file)) {
    while (::flock(_file.number(), LOCK_EX | LOCK_NB) != 0) {
        if (errno != EWOULDBLOCK && errno != EINTR) {
            fail(file, "cannot be locked");
        }
        if (deadline.remaining().count() == 0) {
            fail(file, "locked by " + holderIn(_file), EWOULDBLOCK);
        }
        constexpr timespec pause{.tv_sec = 0, .tv_nsec = 5'000'000};
        ::nanosleep(&pause, nullptr);
    }
    writeHolder(_file);
}

LockFile::~LockFile() {
    // Closing the descriptor is not enough: a child process that the host has just forked holds the same lock.
    ::flock(_file.number(), LOCK_UN);
}

} // namespace Norv::Agent

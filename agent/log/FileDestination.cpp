#include "Destination.h"
#include "LineWriter.h"

#include "base/Descriptor.h"
#include "base/FolderOfFile.h"
#include "base/Folders.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <utility>

namespace OrvLog {

using Norv::Agent::Descriptor;
using Norv::Agent::FolderOfFile;

namespace {

constexpr int flags = O_WRONLY | O_APPEND | O_CLOEXEC | O_NOCTTY | O_NONBLOCK;
constexpr mode_t mode = 0640;

Descriptor openToAppend(const FolderOfFile& folder, const std::string& path) {
    if (!folder.isOpen()) {
        return Descriptor(-1);
    }
    Descriptor existing = folder.openFile(flags);
    if (existing.isOpen() || errno != ENOENT) {
        return existing;
    }
    Descriptor made = folder.openFile(flags | O_CREAT | O_EXCL, mode);
    if (made.isOpen()) {
        // If this fails, the file stays root's, and root's records are written all the same.
        Norv::Agent::giveToOwnerOfFolder(made, path);
    } else if (errno == EEXIST) {
        // Another process has just made the file, or the name is a symbolic link to a file that does not exist.
        return folder.openFile(flags | O_CREAT, mode);
    }
    return made;
}

// The file is opened for each line: a host that closes all of its descriptors can neither break the log nor let it
// write into another file, and a file that was removed or renamed is made again at once.
class FileDestination final : public Destination {
public:
    explicit FileDestination(const Norv::Agent::LogSettings& settings)
        : _path(settings.file), _rotateSize(settings.rotateSize), _rotateCount(settings.rotateCount) {}

    std::string name() const override { return _path; }

    int write(const Line& line) override {
        {
            const FolderOfFile folder(_path);
            const Descriptor file = openToAppend(folder, _path);
            if (!file.isOpen()) {
                return errno;
            }
            if (!isFull(file, line.whole().size())) {
                return _writer.write(file.number(), line);
            }
            rotate(folder, file);
        }
        return append(line);
    }

private:
    int append(const Line& line) {
        const Descriptor file = openToAppend(FolderOfFile(_path), _path);
        return !file.isOpen() ? errno : _writer.write(file.number(), line);
    }

    bool isFull(const Descriptor& file, std::size_t more) const {
        struct stat status {};
        return _rotateSize != 0 && fstat(file.number(), &status) == 0 && S_ISREG(status.st_mode) &&
               status.st_size > 0 && static_cast<std::uint64_t>(status.st_size) + more > _rotateSize;
    }

    // The process that gets the lock rotates. Lines that others write meanwhile go into the file that is being renamed,
    // and are not lost.
    void rotate(const FolderOfFile& folder, const Descriptor& file) {
        if (flock(file.number(), LOCK_EX | LOCK_NB) != 0) {
            return;
        }
        // If another file has this name now, another process has just rotated.
        struct stat opened {};
        struct stat named {};
        const bool isDue = fstat(file.number(), &opened) == 0 &&
                           fstatat(folder.number(), folder.name().c_str(), &named, 0) == 0 &&
                           named.st_dev == opened.st_dev && named.st_ino == opened.st_ino;
        const int error = isDue ? shiftFiles(folder) : 0;
        // Closing the descriptor is not enough: a child process that the host has just forked holds the same lock.
        flock(file.number(), LOCK_UN);
        if (isDue && _rotationError.exchange(error) != error && error != 0) {
            append(Line(ownRecord(_path + ": cannot be rotated, and grows: " + strerrordesc_np(error))));
        }
    }

    // Returns 0 or an error number. Stops at the first failure, since the next step would overwrite a file.
    int shiftFiles(const FolderOfFile& folder) const {
        const int in = folder.number();
        const auto rotated = [&folder](unsigned int number) { return folder.name() + '.' + std::to_string(number); };
        // The first free number; if there is none, the last number, whose file is overwritten.
        unsigned int number = 1;
        while (number < _rotateCount && faccessat(in, rotated(number).c_str(), F_OK, AT_SYMLINK_NOFOLLOW) == 0) {
            ++number;
        }
        for (; number > 1; --number) {
            if (renameat(in, rotated(number - 1).c_str(), in, rotated(number).c_str()) != 0) {
                return errno;
            }
        }
        const int result = _rotateCount > 0 ? renameat(in, folder.name().c_str(), in, rotated(1).c_str())
                                            : unlinkat(in, folder.name().c_str(), 0);
        return result == 0 ? 0 : errno;
    }

    const std::string _path;
    const std::uint64_t _rotateSize;
    const unsigned int _rotateCount;
    LineWriter _writer;
    // The error number of the last rotation; it is reported when it changes.
    std::atomic<int> _rotationError = 0;
};

} // namespace

std::unique_ptr<Destination> fileDestination(const Norv::Agent::LogSettings& settings) {
    return std::make_unique<FileDestination>(settings);
}

} // namespace OrvLog

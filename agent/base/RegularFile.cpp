#include "RegularFile.h"

#include "Descriptor.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstddef>
#include <system_error>
#include <utility>

namespace Norv::Agent {

namespace {

[[noreturn]] void fail(const std::filesystem::path& file, int error, const std::string& problem) {
    throw std::system_error(error, std::system_category(), file.string() + ": " + problem);
}

[[noreturn]] void failOnSize(const std::filesystem::path& file) {
    fail(file, EFBIG, "is larger than " + std::to_string(largestFile) + " bytes");
}

std::string readAll(const Descriptor& open, const std::filesystem::path& file, off_t expectedSize) {
    std::string text;
    text.reserve(static_cast<std::size_t>(expectedSize));
    std::array<char, 65536> block;
    for (;;) {
        const ssize_t size = ::read(open.number(), block.data(), block.size());
        if (size > 0) {
            text.append(block.data(), static_cast<std::size_t>(size));
            if (std::cmp_greater(text.size(), largestFile)) {
                failOnSize(file);
            }
        } else if (size == 0) {
            return text;
        } else if (errno != EINTR) {
            fail(file, errno, "cannot be read");
        }
    }
}

} // namespace

std::optional<FileContent> readRegularFile(const std::filesystem::path& file) {
    // O_NONBLOCK: opening a pipe must not wait for its other end.
    const Descriptor open(::open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (!open.isOpen()) {
        if (errno == ENOENT) {
            return std::nullopt;
        }
        fail(file, errno, "cannot be read");
    }
    struct stat status {};
    if (::fstat(open.number(), &status) != 0) {
        fail(file, errno, "cannot be read");
    }
    if (!S_ISREG(status.st_mode)) {
        fail(file, EINVAL, "is not a regular file");
    }
    if (status.st_size > largestFile) {
        failOnSize(file);
    }
    return FileContent{FileSignature(status), readAll(open, file, status.st_size)};
}

} // namespace Norv::Agent

/*
 * For LD_PRELOAD: writes to files in the folder that the environment variable TEST_FULL_FOLDER names fail as on a full
 * disk, until there is a file named "room" in it.
 */
#include <dlfcn.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <string>
#include <string_view>

namespace {

bool isOnFullDisk(int file) {
    const char* const folder = std::getenv("TEST_FULL_FOLDER");
    std::array<char, 4096> path{};
    const ssize_t size = readlink(("/proc/self/fd/" + std::to_string(file)).c_str(), path.data(), path.size());
    return folder != nullptr && size > 0 &&
           std::string_view(path.data(), static_cast<std::size_t>(size)).starts_with(folder) &&
           access((std::string(folder) + "/room").c_str(), F_OK) != 0;
}

} // namespace

extern "C" ssize_t write(int file, const void* bytes, std::size_t size) {
    static auto* const original = reinterpret_cast<decltype(&write)>(dlsym(RTLD_NEXT, "write"));
    if (isOnFullDisk(file)) {
        errno = ENOSPC;
        return -1;
    }
    return original(file, bytes, size);
}

#include "Folders.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

namespace Norv::Agent {

void createMissingFolders(const std::filesystem::path& folder) {
    std::error_code ignored;
    if (std::filesystem::is_directory(folder, ignored)) {
        return;
    }
    createMissingFolders(folder.parent_path());
    if (::mkdir(folder.c_str(), 0755) != 0 && errno != EEXIST) {
        throw std::system_error(errno, std::generic_category(), folder.string() + ": cannot be created");
    }
}

void requireWritable(std::filesystem::path folder) {
    while (!std::filesystem::exists(folder)) {
        folder = folder.parent_path();
    }
    if (::access(folder.c_str(), W_OK) != 0) {
        throw std::system_error(errno, std::generic_category(), folder.string() + ": cannot be written");
    }
}

bool giveToOwnerOfFolder(const Descriptor& made, const std::string& path) {
    if (::geteuid() != 0) {
        return true;
    }
    struct stat folder {};
    return ::stat(path.substr(0, path.rfind('/') + 1).c_str(), &folder) == 0 &&
           ::fchown(made.number(), folder.st_uid, folder.st_gid) == 0;
}

} // namespace Norv::Agent

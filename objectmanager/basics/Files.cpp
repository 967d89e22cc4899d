#include "basics/Files.h"

#include <cerrno>
#include <fstream>
#include <iterator>
#include <system_error>

namespace ObjectManager {

std::string contentOf(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    std::string content{std::istreambuf_iterator<char>(stream), {}};
    if (!stream.is_open() || stream.bad()) {
        throw std::system_error(errno, std::generic_category(), file.string());
    }
    return content;
}

} // namespace ObjectManager

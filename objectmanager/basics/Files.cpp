#include "basics/Files.h"

#include <array>
#include <cerrno>
#include <cstddef>
#include <fstream>
#include <system_error>

namespace ObjectManager {

std::string contentOf(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    std::string content;
    std::array<char, 4096> block{};
    do {
        stream.read(block.data(), block.size());
        content.append(block.data(), static_cast<std::size_t>(stream.gcount()));
    } while (stream);
    if (!stream.is_open() || stream.bad()) {
        throw std::system_error(errno, std::generic_category(), file.string());
    }
    return content;
}

} // namespace ObjectManager

/**
 * Helpers for the tests of the agent's libraries.
 */
#ifndef TESTS_AGENT_TESTSUPPORT_H
#define TESTS_AGENT_TESTSUPPORT_H

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

#include <unistd.h>

namespace AgentTest {

/** A temporary folder, which is removed when the object is destroyed. */
class TemporaryFolder {
public:
    TemporaryFolder() {
        std::string name = (std::filesystem::temp_directory_path() / "orv-test-XXXXXX").string();
        if (mkdtemp(name.data()) == nullptr) {
            throw std::system_error(errno, std::system_category(), name);
        }
        _path = name;
    }
    ~TemporaryFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(_path, ignored);
    }
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    std::filesystem::path operator/(const std::string& name) const { return _path / name; }

    /** Names of the files in the folder that begin with a text. */
    std::vector<std::string> filesThatBegin(const std::string& beginning) const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator(_path)) {
            if (std::string name = entry.path().filename().string(); name.starts_with(beginning)) {
                names.push_back(std::move(name));
            }
        }
        return names;
    }

private:
    std::filesystem::path _path;
};

inline void writeFile(const std::filesystem::path& file, const std::string& text) {
    std::ofstream stream(file, std::ios::binary | std::ios::trunc);
    if (!(stream << text).flush()) {
        throw std::runtime_error(file.string() + ": cannot be written");
    }
}

inline std::string contentOf(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    if (!stream) {
        throw std::runtime_error(file.string() + ": cannot be read");
    }
    return {std::istreambuf_iterator<char>(stream), {}};
}

/** The lines that a shell command writes to its standard output. @throws std::runtime_error if it fails. */
inline std::vector<std::string> linesOf(const std::string& command) {
    std::FILE* pipe = popen(command.c_str(), "re");
    if (pipe == nullptr) {
        throw std::system_error(errno, std::system_category(), command);
    }
    std::stringstream output;
    char block[4096];
    while (const std::size_t size = std::fread(block, 1, sizeof block, pipe)) {
        output.write(block, static_cast<std::streamsize>(size));
    }
    if (const int status = pclose(pipe); status != 0) {
        throw std::runtime_error(command + ": status " + std::to_string(status) + ", output: " + output.str());
    }
    std::vector<std::string> lines;
    for (std::string line; std::getline(output, line);) {
        lines.push_back(line);
    }
    return lines;
}

/** The names, as the linker knows them, that a shared library exports. */
inline std::vector<std::string> exportedSymbols(const std::string& library) {
    return linesOf("nm -D --defined-only --format=just-symbols '" + library + "'");
}

} // namespace AgentTest

#endif

#include "classes/SchemaFiles.h"

#include "basics/Files.h"
#include "classes/MofLexer.h"

#include <algorithm>
#include <system_error>

namespace ObjectManager {

std::vector<std::filesystem::path> filesOf(const std::filesystem::path& folder, std::string_view extension) {
    std::vector<std::filesystem::path> files;
    try {
        for (const auto& entry : std::filesystem::directory_iterator(folder)) {
            if (entry.path().extension() == extension) {
                files.push_back(entry.path());
            }
        }
    } catch (const std::filesystem::filesystem_error& error) {
        throw SchemaError(folder.string(), "cannot be read: " + error.code().message());
    }
    std::sort(files.begin(), files.end());
    return files;
}

std::string readFile(const std::filesystem::path& file) {
    try {
        return contentOf(file);
    } catch (const std::system_error& error) {
        throw SchemaError(file.string(), "cannot be read: " + error.code().message());
    }
}

} // namespace ObjectManager

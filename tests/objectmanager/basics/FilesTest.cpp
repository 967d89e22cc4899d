#include "basics/Files.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <system_error>

namespace ObjectManager {
namespace {

/** The reason why a file cannot be read. */
std::errc problemOf(const std::filesystem::path& file) {
    try {
        contentOf(file);
    } catch (const std::system_error& error) {
        return static_cast<std::errc>(error.code().value());
    }
    return {};
}

TEST(FilesTest, GivesTheWholeContent) {
    const std::filesystem::path file = std::filesystem::path(testing::TempDir()) / "orv-files-test";
    const std::string content("a\r\n\0b\n", 6);
    std::ofstream(file, std::ios::binary) << content;
    EXPECT_EQ(contentOf(file), content);
    std::filesystem::remove(file);
}

TEST(FilesTest, SaysWhyAFileCannotBeRead) {
    EXPECT_EQ(problemOf("/nonexistent/file"), std::errc::no_such_file_or_directory);
    EXPECT_EQ(problemOf("/"), std::errc::is_a_directory);
}

} // namespace
} // namespace ObjectManager

#include "base/FolderOfFile.h"

#include "TestSupport.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <string>

namespace {

namespace fs = std::filesystem;
using AgentTest::TemporaryFolder;
using AgentTest::writeFile;
using Norv::Agent::FolderOfFile;

constexpr uid_t somebody = 64998;

class FolderOfFileTest : public testing::Test {
protected:
    FolderOfFileTest() {
        writeFile(folder / "target", "");
        fs::create_directory(folder / "inner");
    }

    /** What opening a file to write to it gives: 0 or an error number. */
    static int openingOf(const fs::path& file, int more = 0) {
        const FolderOfFile opened(file);
        if (!opened.isOpen()) {
            return errno;
        }
        return opened.openFile(O_WRONLY | more, 0600).isOpen() ? 0 : errno;
    }

    void giveInnerFolderAway() const { ASSERT_EQ(chown((folder / "inner").c_str(), somebody, somebody), 0); }

    const TemporaryFolder folder;
};

/** What concerns the superuser, and can be tried by nobody else. */
class SuperusersFolderTest : public FolderOfFileTest {
protected:
    void SetUp() override {
        if (geteuid() != 0) {
            GTEST_SKIP() << "only root follows no links of others";
        }
    }
};

TEST_F(FolderOfFileTest, HasTheNameOfTheFile) {
    const FolderOfFile opened(folder / "inner/file");
    EXPECT_TRUE(opened.isOpen());
    EXPECT_EQ(opened.name(), "file");
    EXPECT_EQ(faccessat(opened.number(), "../target", F_OK, 0), 0);
}

TEST_F(FolderOfFileTest, SaysWhyAFolderCannotBeOpened) {
    EXPECT_EQ(openingOf(folder / "missing/file"), ENOENT);
    EXPECT_EQ(openingOf(folder / "missing/inner/file"), ENOENT);
    EXPECT_EQ(openingOf(folder / "target/file"), ENOTDIR);
}

TEST_F(FolderOfFileTest, MakesAFile) {
    EXPECT_EQ(openingOf(folder / "inner//file"), ENOENT);
    EXPECT_EQ(openingOf(folder / "inner//file", O_CREAT), 0);
    EXPECT_TRUE(fs::exists(folder / "inner/file"));
}

TEST_F(FolderOfFileTest, LinksInOnesOwnFolderLeadSomewhere) {
    fs::create_symlink(folder / "target", folder / "inner/link");
    fs::create_hard_link(folder / "target", folder / "inner/name");
    fs::create_directory_symlink(folder / "inner", folder / "way");
    EXPECT_EQ(openingOf(folder / "inner/link"), 0);
    EXPECT_EQ(openingOf(folder / "inner/name"), 0);
    EXPECT_EQ(openingOf(folder / "way/link"), 0);
}

TEST_F(SuperusersFolderTest, LinksInTheFolderOfAnotherLeadNowhere) {
    fs::create_symlink(folder / "target", folder / "inner/link");
    fs::create_symlink(folder / "missing", folder / "inner/dangling");
    fs::create_hard_link(folder / "target", folder / "inner/name");
    giveInnerFolderAway();
    EXPECT_EQ(openingOf(folder / "inner/link"), ELOOP);
    EXPECT_EQ(openingOf(folder / "inner/dangling", O_CREAT), ELOOP);
    EXPECT_FALSE(fs::exists(folder / "missing"));
    EXPECT_EQ(openingOf(folder / "inner/name"), EMLINK);
    EXPECT_EQ(openingOf(folder / "inner/file", O_CREAT), 0);
    EXPECT_EQ(openingOf(folder / "inner/file"), 0) << "a file of its own";
}

TEST_F(SuperusersFolderTest, LinksInAFolderThatOthersMayWriteToLeadNowhere) {
    fs::create_symlink(folder / "target", folder / "inner/link");
    for (const mode_t mode : {0770, 0707}) {
        ASSERT_EQ(chmod((folder / "inner").c_str(), mode), 0);
        EXPECT_EQ(openingOf(folder / "inner/link"), ELOOP) << mode;
    }
}

TEST_F(SuperusersFolderTest, LinksBelowTheFolderOfAnotherLeadNowhere) {
    fs::create_directory(folder / "elsewhere");
    fs::create_directory(folder / "inner/own");
    fs::create_directory_symlink(folder / "elsewhere", folder / "inner/way");
    fs::create_symlink(folder / "target", folder / "inner/own/link");
    giveInnerFolderAway();
    EXPECT_EQ(openingOf(folder / "inner/way/file", O_CREAT), ENOTDIR);
    EXPECT_TRUE(fs::is_empty(folder / "elsewhere"));
    EXPECT_EQ(openingOf(folder / "inner/own/link"), ELOOP);
}

TEST_F(SuperusersFolderTest, ALinkOfHisOwnLeadsToTheFolderOfAnother) {
    fs::create_directory_symlink(folder / "inner", folder / "way");
    giveInnerFolderAway();
    EXPECT_EQ(openingOf(folder / "way/file", O_CREAT), 0);
}

} // namespace

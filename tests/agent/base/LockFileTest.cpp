#include "base/LockFile.h"

#include "TestSupport.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <atomic>
#include <memory>
#include <thread>
#include <vector>

namespace {

using namespace Norv::Agent;
using namespace std::chrono_literals;
using AgentTest::contentOf;
using AgentTest::TemporaryFolder;
using AgentTest::writeFile;
using testing::HasSubstr;
using testing::StartsWith;

class LockFileTest : public testing::Test {
protected:
    /** Why the lock cannot be taken within a time; "had" if it can. */
    std::string attempt(std::chrono::milliseconds patience = 0ms) const {
        try {
            const LockFile held(file, Deadline(patience));
            return "had";
        } catch (const std::system_error& error) {
            return error.what();
        }
    }

    mode_t mode() const {
        struct stat status {};
        EXPECT_EQ(stat(file.c_str(), &status), 0);
        return status.st_mode & 07777;
    }

    const TemporaryFolder folder;
    const std::filesystem::path file = folder / "lock";
};

TEST_F(LockFileTest, IsMadeForItsOwnerOnly) {
    const mode_t mask = umask(0);
    EXPECT_EQ(attempt(), "had");
    umask(mask);
    EXPECT_EQ(mode(), 0600);
    EXPECT_EQ(attempt(), "had") << "a second time";
}

TEST_F(LockFileTest, IsHeldByOneAtATimeWhoIsNamed) {
    const auto held = std::make_unique<LockFile>(file, Deadline(0ms));
    EXPECT_THAT(attempt(20ms),
                StartsWith(file.string() + ": locked by agent_base_test, process " + std::to_string(getpid()) + ": "));
}

TEST_F(LockFileTest, IsWaitedForUntilTheDeadline) {
    auto held = std::make_unique<LockFile>(file, Deadline(0ms));
    std::thread waiting([&] { EXPECT_EQ(attempt(1min), "had"); });
    held.reset();
    waiting.join();
}

TEST_F(LockFileTest, IsHeldByOneOfManyThreads) {
    std::vector<std::thread> threads;
    std::atomic<int> holders = 0;
    threads.reserve(8);
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 20; ++round) {
                const LockFile held(file, Deadline(1min));
                EXPECT_EQ(++holders, 1);
                --holders;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

TEST_F(LockFileTest, IsFreeAgainThoughAChildOfItsHolderLivesOn) {
    int pipe[2];
    ASSERT_EQ(::pipe(pipe), 0);
    auto held = std::make_unique<LockFile>(file, Deadline(0ms));
    const pid_t child = fork();
    if (child == 0) {
        char end = 0;
        close(pipe[1]);
        _exit(read(pipe[0], &end, 1) == 0 ? 0 : 1);
    }
    held.reset();
    EXPECT_EQ(attempt(), "had");
    close(pipe[0]);
    close(pipe[1]);
    waitpid(child, nullptr, 0);
}

TEST_F(LockFileTest, IsClosedToOthersWhereItWasOpenToThem) {
    writeFile(file, "");
    chmod(file.c_str(), 0666);
    EXPECT_EQ(attempt(), "had");
    EXPECT_EQ(mode(), 0600);
}

TEST_F(LockFileTest, IsNotFollowedToAnotherFile) {
    writeFile(folder / "other", "precious");
    std::filesystem::create_symlink(folder / "other", file);
    EXPECT_THAT(attempt(), StartsWith(file.string() + ": is a link: remove it"));
    std::filesystem::remove(file);
    std::filesystem::create_hard_link(folder / "other", file);
    EXPECT_THAT(attempt(), StartsWith(file.string() + ": is not a regular file with a single name: remove it"));
    EXPECT_EQ(contentOf(folder / "other"), "precious");
}

TEST_F(LockFileTest, IsNotWaitedForWhereItIsNoFile) {
    ASSERT_EQ(mkfifo(file.c_str(), 0666), 0);
    EXPECT_THAT(attempt(), StartsWith(file.string() + ": is not a regular file with a single name: remove it"));
    std::filesystem::remove(file);
    std::filesystem::create_directory(file);
    EXPECT_THAT(attempt(), StartsWith(file.string() + ": cannot be opened"));
}

TEST_F(LockFileTest, OfSomebodyElseIsRefused) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only the superuser can give a file away";
    }
    writeFile(file, "");
    ASSERT_EQ(chown(file.c_str(), 12345, static_cast<gid_t>(-1)), 0);
    EXPECT_THAT(attempt(), StartsWith(file.string() + ": belongs to uid 12345: remove it"));
}

TEST_F(LockFileTest, OfTheSuperuserIsGivenToTheOwnerOfTheFolder) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only the superuser can give a file away";
    }
    ASSERT_EQ(chown(file.parent_path().c_str(), 12345, static_cast<gid_t>(-1)), 0);
    EXPECT_EQ(attempt(), "had");
    struct stat status {};
    ASSERT_EQ(stat(file.c_str(), &status), 0);
    EXPECT_EQ(status.st_uid, 12345U);
    EXPECT_EQ(attempt(), "had") << "by the superuser once more";
}

TEST_F(LockFileTest, WithoutItsFolderIsRefused) {
    std::filesystem::remove_all(file.parent_path());
    EXPECT_THAT(attempt(), StartsWith(file.string() + ": cannot be created: No such file or directory"));
}

} // namespace

#include "Hanging.h"
#include "LogProcess.h"
#include "PassingTime.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <fstream>
#include <map>
#include <regex>
#include <set>
#include <string>
#include <thread>
#include <vector>

namespace {

namespace fs = std::filesystem;

using LogTest::linesOfFile;
using LogTest::LogProcess;
using LogTest::textsOf;
using LogTest::writeLog;
using testing::ElementsAre;
using testing::Le;
using testing::UnorderedElementsAreArray;

// Every writer's records, numbered.
std::vector<std::string> expectedTexts(int writers, int records) {
    std::vector<std::string> texts;
    for (int writer = 0; writer < writers; ++writer) {
        for (int record = 0; record < records; ++record) {
            texts.push_back("writer " + std::to_string(writer) + " record " + std::to_string(record));
        }
    }
    return texts;
}

void writeRecords(int writer, int records) {
    for (int record = 0; record < records; ++record) {
        writeLog(6000, "writer " + std::to_string(writer) + " record " + std::to_string(record));
    }
}

// Texts of the log file and of all that were rotated.
std::vector<std::string> allTexts(const LogProcess& process) {
    std::vector<std::string> texts;
    for (const std::string& name : process.folder.filesThatBegin("agent.log")) {
        std::ranges::move(textsOf(linesOfFile(process.folder / name)), std::back_inserter(texts));
    }
    return texts;
}

TEST(FileTest, AFileThatRootMakesBelongsToWhomTheFolderBelongs) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can make files for others";
    }
    constexpr uid_t owner = 64998;
    constexpr gid_t group = 64999;
    const LogProcess process;
    process.configureFile("rotate-size = 1");
    ASSERT_EQ(chown(process.file().parent_path().c_str(), owner, group), 0);
    process.run([] {
        writeLog(6000, "in the first file");
        writeLog(6000, "in the next one");
    });
    for (const std::string& name : process.folder.filesThatBegin("agent.log")) {
        struct stat status {};
        ASSERT_EQ(stat((process.folder / name).c_str(), &status), 0) << name;
        EXPECT_EQ(status.st_uid, owner) << name;
        EXPECT_EQ(status.st_gid, group) << name;
        EXPECT_EQ(status.st_mode & 07777U, 0640U) << name;
    }
    EXPECT_EQ(process.folder.filesThatBegin("agent.log").size(), 2U);
}

TEST(FileTest, ALinkToAFileThatIsMissingLeadsToANewOne) {
    const LogProcess process;
    process.configureFile();
    const fs::path target = process.folder / "elsewhere.log";
    fs::create_symlink(target, process.file());
    process.run([] { writeLog(6000, "over there"); });
    EXPECT_THAT(textsOf(linesOfFile(target)), ElementsAre("over there"));
}

TEST(FileTest, RootIsNotLedElsewhereByTheOwnerOfTheFolder) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root has something to lose";
    }
    constexpr uid_t owner = 64998;
    const LogProcess process;
    process.configureFile();
    const AgentTest::TemporaryFolder elsewhere;
    AgentTest::writeFile(elsewhere / "precious", "precious\n");
    ASSERT_EQ(chown(process.file().parent_path().c_str(), owner, owner), 0);
    process.run([&] {
        for (const char* target : {"precious", "missing"}) {
            fs::create_symlink(elsewhere / target, process.file());
            writeLog(6000, "attacked");
            fs::remove(process.file());
        }
        writeLog(6000, "in its place");
    });
    EXPECT_THAT(linesOfFile(elsewhere / "precious"), ElementsAre("precious"));
    EXPECT_FALSE(fs::exists(elsewhere / "missing"));
    EXPECT_THAT(textsOf(linesOfFile(process.file())),
                ElementsAre("2 records lost: " + process.file().string() + ": Too many levels of symbolic links",
                            "in its place"));
}

TEST(FileTest, ThreadsWriteWholeLinesIntoOneFile) {
    constexpr int threadCount = 8;
    constexpr int records = 500;
    const LogProcess process;
    process.configureFile();
    process.run([] {
        std::vector<std::thread> threads;
        for (int number = 0; number < threadCount; ++number) {
            threads.emplace_back([number] { writeRecords(number, records); });
        }
        for (auto& thread : threads) {
            thread.join();
        }
    });
    EXPECT_THAT(textsOf(linesOfFile(process.file())), UnorderedElementsAreArray(expectedTexts(threadCount, records)));
}

TEST(FileTest, ProcessesAndThreadsWriteAndRotateOneFileWithoutLosingALine) {
    constexpr int processCount = 4;
    constexpr int threadCount = 2;
    constexpr int records = 250;
    const LogProcess process;
    process.configureFile("rotate-size = 4000\nrotate-count = 1000\n");

    std::vector<pid_t> children;
    for (int child = 0; child < processCount; ++child) {
        children.push_back(process.start([child] {
            std::thread second([child] { writeRecords(threadCount * child + 1, records); });
            writeRecords(threadCount * child, records);
            second.join();
        }));
    }
    for (const pid_t child : children) {
        LogProcess::wait(child);
    }

    EXPECT_GT(process.folder.filesThatBegin("agent.log.").size(), 2U);
    EXPECT_THAT(allTexts(process), UnorderedElementsAreArray(expectedTexts(processCount * threadCount, records)));
}

TEST(FileTest, RotationKeepsTheNewestFilesEachWithinItsSize) {
    const LogProcess process;
    process.configureFile("rotate-size = 1000\nrotate-count = 2\n");
    process.run([] { writeRecords(0, 100); });

    EXPECT_THAT(process.folder.filesThatBegin("agent.log"),
                testing::UnorderedElementsAre("agent.log", "agent.log.1", "agent.log.2"));
    std::vector<std::string> texts;
    for (const char* name : {"agent.log.2", "agent.log.1", "agent.log"}) {
        EXPECT_THAT(fs::file_size(process.folder / name), Le(1000U));
        std::ranges::move(textsOf(linesOfFile(process.folder / name)), std::back_inserter(texts));
    }
    const auto expected = expectedTexts(1, 100);
    EXPECT_EQ(texts,
              std::vector<std::string>(expected.end() - static_cast<std::ptrdiff_t>(texts.size()), expected.end()));
}

TEST(FileTest, WithoutRotatedFilesTheFileBeginsAnew) {
    const LogProcess process;
    process.configureFile("rotate-size = 1000\nrotate-count = 0\n");
    process.run([] { writeRecords(0, 100); });

    EXPECT_THAT(process.folder.filesThatBegin("agent.log"), ElementsAre("agent.log"));
    EXPECT_THAT(fs::file_size(process.file()), Le(1000U));
    EXPECT_EQ(textsOf(linesOfFile(process.file())).back(), "writer 0 record 99");
}

TEST(FileTest, SizeZeroNeverRotates) {
    const LogProcess process;
    process.configureFile("rotate-size = 0\n");
    process.run([] { writeRecords(0, 100); });
    EXPECT_EQ(textsOf(linesOfFile(process.file())), expectedTexts(1, 100));
}

TEST(FileTest, ARecordLargerThanAFileMayBeIsWritten) {
    const LogProcess process;
    process.configureFile("rotate-size = 10\nrotate-count = 2\n");
    process.run([] { writeRecords(0, 2); });
    EXPECT_THAT(textsOf(linesOfFile(process.file())), ElementsAre("writer 0 record 1"));
    EXPECT_THAT(textsOf(linesOfFile(process.folder / "agent.log.1")), ElementsAre("writer 0 record 0"));
}

TEST(FileTest, ARotationThatFailsIsReportedOnceAndTheFileGrows) {
    const LogProcess process;
    process.configureFile("rotate-size = 300\nrotate-count = 1\n");
    // A file cannot take the place of a folder.
    fs::create_directory(process.folder / "agent.log.1");
    process.run([] { writeRecords(0, 10); });

    auto texts = textsOf(linesOfFile(process.file()));
    EXPECT_EQ(std::erase(texts, process.file().string() + ": cannot be rotated, and grows: Is a directory"), 1U);
    EXPECT_EQ(texts, expectedTexts(1, 10));
}

TEST(FileTest, ARotatedFileIsNotOverwrittenWhereTheNextOneCannotMove) {
    const LogProcess process;
    process.configureFile("rotate-size = 300\nrotate-count = 2\n");
    fs::create_directory(process.folder / "agent.log.2");
    AgentTest::writeFile(process.folder / "agent.log.1", "old\n");
    process.run([] { writeRecords(0, 10); });

    EXPECT_THAT(linesOfFile(process.folder / "agent.log.1"), ElementsAre("old"));
}

TEST(FileTest, AFileThatOthersRemoveOrRenameIsMadeAgain) {
    const LogProcess process;
    process.configureFile();
    process.run([&process] {
        writeLog(6000, "first");
        fs::rename(process.file(), process.folder / "moved");
        writeLog(6000, "second");
        fs::remove(process.file());
        writeLog(6000, "third");
    });
    EXPECT_THAT(textsOf(linesOfFile(process.folder / "moved")), ElementsAre("first"));
    EXPECT_THAT(textsOf(linesOfFile(process.file())), ElementsAre("third"));
}

TEST(FileTest, LostRecordsAreCountedAndReportedWhenTheFileCanBeWrittenAgain) {
    const LogProcess process;
    const fs::path file = process.folder / "later/agent.log";
    process.configure("[log]\ndestination = \"file\"\nfile = \"" + file.string() + "\"\n");
    process.run([&file] {
        writeLog(6000, "first");
        writeLog(6000, "second");
        writeLog(3000, "filtered out");
        fs::create_directory(file.parent_path());
        writeLog(6000, "third");
        writeLog(6000, "fourth");
    });
    EXPECT_THAT(textsOf(linesOfFile(file)),
                ElementsAre("2 records lost: " + file.string() + ": No such file or directory", "third", "fourth"));
}

TEST(FileTest, AFullDeviceLosesRecords) {
    if (!fs::exists("/dev/full")) {
        GTEST_SKIP() << "no device that is always full";
    }
    const LogProcess process;
    process.configureFile();
    fs::create_symlink("/dev/full", process.file());
    process.run([&process] {
        writeLog(6000, "first");
        fs::remove(process.file());
        writeLog(6000, "second");
    });
    EXPECT_THAT(textsOf(linesOfFile(process.file())),
                ElementsAre("1 record lost: " + process.file().string() + ": No space left on device", "second"));
}

TEST(FileTest, APipeWithoutReaderLosesRecordsAtOnce) {
    const LogProcess process;
    process.configureFile();
    ASSERT_EQ(mkfifo(process.file().c_str(), 0600), 0);
    process.run([&process] {
        writeLog(6000, "first");
        fs::remove(process.file());
        writeLog(6000, "second");
    });
    EXPECT_THAT(textsOf(linesOfFile(process.file())),
                ElementsAre("1 record lost: " + process.file().string() + ": No such device or address", "second"));
}

TEST(FileTest, APipeThatNobodyEmptiesLosesRecordsAtOnce) {
    const LogProcess process;
    process.configureFile();
    ASSERT_EQ(mkfifo(process.file().c_str(), 0600), 0);
    const int reader = open(process.file().c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    ASSERT_GE(reader, 0);
    process.run([&process] {
        constexpr int moreThanItTakes = 2000;
        writeRecords(0, moreThanItTakes);
        fs::remove(process.file());
        writeLog(6000, "next");
    });
    const auto texts = textsOf(linesOfFile(process.file()));
    ASSERT_EQ(texts.size(), 2U);
    EXPECT_THAT(texts[0], testing::MatchesRegex("[0-9]+ records lost: " + process.file().string() +
                                                ": Resource temporarily unavailable"));
    EXPECT_EQ(texts[1], "next");
    close(reader);
}

TEST(FileTest, AFileThatMayNotBeWrittenLosesRecords) {
    const LogProcess process;
    process.configureFile();
    AgentTest::writeFile(process.file(), "");
    fs::permissions(process.file(), fs::perms::owner_read);
    fs::permissions(process.folder / "", fs::perms::others_exec, fs::perm_options::add);
    process.run([&process] {
        writeLog(1, "reads the configuration");
        constexpr uid_t nobody = 65534;
        if (geteuid() == 0) {
            ASSERT_EQ(seteuid(nobody), 0);
        }
        writeLog(6000, "first");
        if (getuid() == 0) {
            ASSERT_EQ(seteuid(0), 0);
        }
        fs::permissions(process.file(), fs::perms::owner_write, fs::perm_options::add);
        writeLog(6000, "second");
    });
    EXPECT_THAT(textsOf(linesOfFile(process.file())),
                ElementsAre("1 record lost: " + process.file().string() + ": Permission denied", "second"));
}

TEST(FileTest, OthersMayRenameTheFileWhileManyWrite) {
    constexpr int processCount = 3;
    constexpr int threadCount = 2;
    constexpr int records = 400;
    const LogProcess process;
    process.configureFile();
    std::vector<pid_t> children;
    for (int child = 0; child < processCount; ++child) {
        children.push_back(process.start([child] {
            std::thread second([child] { writeRecords(threadCount * child + 1, records); });
            writeRecords(threadCount * child, records);
            second.join();
        }));
    }
    // This is what logrotate(8) does.
    std::atomic<bool> over = false;
    std::thread rotator([&] {
        for (int number = 0; !over; ++number) {
            std::error_code notThereYet;
            fs::rename(process.file(), process.file().string() + ".moved" + std::to_string(number), notThereYet);
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
        }
    });
    for (const pid_t child : children) {
        LogProcess::wait(child);
    }
    over = true;
    rotator.join();
    EXPECT_THAT(allTexts(process), UnorderedElementsAreArray(expectedTexts(processCount * threadCount, records)));
}

TEST(FileTest, AFileSystemThatHangsHoldsOneThreadAndNotTheOthers) {
    const LogProcess process;
    process.configureFile();
    process.run([&process] {
        LogTest::hangFiles(true);
        std::thread held([] { writeLog(6000, "held"); });
        LogTest::waitUntil([] { return LogTest::hangingWrites() == 1; });
        // Longer than other threads wait for one that is writing.
        AgentTest::passTime(std::chrono::seconds(2));

        // The child process has none of the threads that hang.
        process.run([] {
            LogTest::hangFiles(false);
            writeLog(6000, "child");
        });
        // If this call wrote, it would never return.
        writeLog(6000, "first");
        writeLog(6000, "second");

        LogTest::hangFiles(false);
        held.join();
        writeLog(6000, "third");
    });
    EXPECT_THAT(textsOf(linesOfFile(process.file())),
                ElementsAre("child", "held", "2 records lost: " + process.file().string() + ": Device or resource busy",
                            "third"));
}

TEST(FileTest, ALimitOfTheHostEndsALineButNotTheHost) {
    const LogProcess process;
    process.configureFile();
    process.run([] {
        rlimit limit{};
        getrlimit(RLIMIT_FSIZE, &limit);
        limit.rlim_cur = 100;
        setrlimit(RLIMIT_FSIZE, &limit);
        writeLog(6000, "first");
        writeLog(6000, "second");
        writeLog(6000, "third");
        limit.rlim_cur = limit.rlim_max;
        setrlimit(RLIMIT_FSIZE, &limit);
        writeLog(6000, "fourth");
    });
    const auto lines = linesOfFile(process.file());
    ASSERT_EQ(lines.size(), 4U) << "the first line, a part of the second, the report and the fourth";
    EXPECT_EQ(textsOf({lines[0]})[0], "first");
    EXPECT_EQ(textsOf({lines[2]})[0], "2 records lost: " + process.file().string() + ": File too large");
    EXPECT_EQ(textsOf({lines[3]})[0], "fourth");
}

TEST(FileTest, AChildOfTheHostGoesOnWriting) {
    const LogProcess process;
    process.configureFile();
    process.run([&process] {
        writeLog(6000, "parent");
        process.run([] { writeLog(6000, "child"); });
        writeLog(6000, "parent again");
    });
    EXPECT_THAT(textsOf(linesOfFile(process.file())), ElementsAre("parent", "child", "parent again"));
}

} // namespace

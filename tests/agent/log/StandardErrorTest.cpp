#include "LogProcess.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <sstream>
#include <string>

namespace {

using LogTest::LogProcess;
using LogTest::textsOf;
using LogTest::writeLog;
using testing::ElementsAre;

/** A pipe that is the process's standard error. */
class ErrorPipe {
public:
    ErrorPipe() {
        std::array<int, 2> ends{};
        if (pipe(ends.data()) == 0) {
            _reader = ends[0];
            dup2(ends[1], STDERR_FILENO);
            close(ends[1]);
        }
    }

    /** Writes until the pipe takes no more. */
    static void fill() {
        fcntl(STDERR_FILENO, F_SETFL, O_NONBLOCK);
        const std::string block(4096, '.');
        while (write(STDERR_FILENO, block.data(), block.size()) > 0) {
        }
        fcntl(STDERR_FILENO, F_SETFL, 0);
    }

    /** Takes everything out of the pipe. */
    std::vector<std::string> read() const {
        fcntl(_reader, F_SETFL, O_NONBLOCK);
        std::stringstream content;
        std::array<char, 4096> block{};
        for (ssize_t size = 0; (size = ::read(_reader, block.data(), block.size())) > 0;) {
            content.write(block.data(), size);
        }
        std::vector<std::string> lines;
        for (std::string line; std::getline(content, line);) {
            lines.push_back(line);
        }
        return lines;
    }

    void closeReader() const { close(_reader); }

private:
    int _reader = -1;
};

TEST(StandardErrorTest, AFullPipeDoesNotBlockAndLosesRecordsUntilItHasRoom) {
    const LogProcess process;
    process.run([] {
        const ErrorPipe pipe;
        ErrorPipe::fill();
        writeLog(6000, "first");
        writeLog(6000, "second");
        pipe.read();
        writeLog(6000, "third");
        EXPECT_THAT(textsOf(pipe.read()),
                    ElementsAre("2 records lost: standard error: Resource temporarily unavailable", "third"));
    });
}

TEST(StandardErrorTest, APipeWithoutReaderDoesNotEndTheHost) {
    const LogProcess process;
    process.run([] {
        const ErrorPipe pipe;
        pipe.closeReader();
        writeLog(6000, "text");

        sigset_t pending;
        sigpending(&pending);
        EXPECT_EQ(sigismember(&pending, SIGPIPE), 0) << "the signal must not wait for the host either";
    });
}

TEST(StandardErrorTest, ASignalThatTheHostWaitsForIsLeftToIt) {
    const LogProcess process;
    process.run([] {
        sigset_t signals;
        sigemptyset(&signals);
        sigaddset(&signals, SIGPIPE);
        pthread_sigmask(SIG_BLOCK, &signals, nullptr);
        pthread_kill(pthread_self(), SIGPIPE);

        const ErrorPipe pipe;
        pipe.closeReader();
        writeLog(6000, "text");

        sigset_t pending;
        sigpending(&pending);
        EXPECT_EQ(sigismember(&pending, SIGPIPE), 1);
    });
}

TEST(StandardErrorTest, RecordsAreLostWhereItIsClosed) {
    const LogProcess process;
    process.run([] {
        const int saved = dup(STDERR_FILENO);
        close(STDERR_FILENO);
        writeLog(6000, "first");
        dup2(saved, STDERR_FILENO);
        writeLog(6000, "second");
    });
    EXPECT_THAT(textsOf(process.standardError()),
                ElementsAre("1 record lost: standard error: Bad file descriptor", "second"));
}

} // namespace

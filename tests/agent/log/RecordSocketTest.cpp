#include "LogProcess.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <string>
#include <vector>

namespace {

using LogTest::LogProcess;
using LogTest::textsOf;
using LogTest::writeLog;
using LogTest::writeTrace;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr const char* variable = "ORV_AGENT_LOG_SOCKET";

/** The host's end and the log's end of a connection, the latter announced to the log. */
class HostSocket {
public:
    explicit HostSocket(int type) {
        std::array<int, 2> ends{};
        if (socketpair(AF_UNIX, type | SOCK_CLOEXEC, 0, ends.data()) == 0) {
            _host = ends[0];
            _log = ends[1];
        }
        setenv(variable, std::to_string(_log).c_str(), 1);
    }
    ~HostSocket() {
        unsetenv(variable);
        close(_host);
        close(_log);
    }
    HostSocket(const HostSocket&) = delete;
    HostSocket& operator=(const HostSocket&) = delete;

    /** The messages that have come so far. */
    std::vector<std::string> messages() const {
        std::vector<std::string> all;
        std::string message(100'000, '\0');
        for (ssize_t size = 0; (size = recv(_host, message.data(), message.size(), MSG_DONTWAIT)) > 0;) {
            all.push_back(message.substr(0, static_cast<std::size_t>(size)));
        }
        return all;
    }

    void closeHost() const { close(_host); }

private:
    int _host = -1;
    int _log = -1;
};

class RecordSocketTest : public testing::TestWithParam<int> {};

INSTANTIATE_TEST_SUITE_P(RecordSocket, RecordSocketTest, testing::Values(SOCK_SEQPACKET, SOCK_DGRAM));

TEST_P(RecordSocketTest, TellsTheHostOfInformationAndFailuresWhateverTheThresholds) {
    const LogProcess process;
    process.run([] {
        const HostSocket socket(GetParam());
        writeLog(4999, "operation");
        writeLog(5000, "information", "Corvane.A");
        writeLog(6000, "failure\nof two lines", "Corvane.B");
        writeTrace(6000, "trace");
        const std::string thread = std::to_string(gettid());
        EXPECT_THAT(socket.messages(), ElementsAre(thread + "\n5000\nCorvane.A\ninformation",
                                                   thread + "\n6000\nCorvane.B\nfailure\nof two lines"));
    });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre("failure\\nof two lines"));
}

TEST_P(RecordSocketTest, AHostThatDoesNotListenCostsMessagesAndNothingElse) {
    const LogProcess process;
    process.run([] {
        const HostSocket socket(GetParam());
        for (int record = 0; record < 10'000; ++record) {
            writeLog(5000, "text");
        }
        EXPECT_FALSE(socket.messages().empty());
        EXPECT_LT(socket.messages().size(), 10'000U);
        writeLog(5000, "there again");
        EXPECT_THAT(socket.messages(), ElementsAre(testing::EndsWith("there again")));
    });
}

TEST_P(RecordSocketTest, AHostThatIsGoneCostsNothing) {
    const LogProcess process;
    process.run([] {
        const HostSocket socket(GetParam());
        socket.closeHost();
        writeLog(6000, "text");
    });
    EXPECT_THAT(textsOf(process.standardError()), ElementsAre("text"));
}

TEST(RecordSocketTest, ASocketThatMixesMessagesIsNotUsed) {
    const LogProcess process;
    process.run([] {
        const HostSocket socket(SOCK_STREAM);
        writeLog(6000, "text");
        EXPECT_THAT(socket.messages(), IsEmpty());
    });
}

TEST(RecordSocketTest, AFileIsNotWrittenTo) {
    const LogProcess process;
    const auto file = process.folder / "file";
    process.run([&file] {
        setenv(variable, std::to_string(open(file.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600)).c_str(), 1);
        writeLog(6000, "text");
    });
    EXPECT_EQ(AgentTest::contentOf(file), "");
}

TEST(RecordSocketTest, WhatIsNoNumberIsNoSocket) {
    for (const char* value : {"", "-1", "3x", "99999999999999", "999"}) {
        const LogProcess process;
        process.run([value] {
            setenv(variable, value, 1);
            writeLog(6000, "text");
        });
        EXPECT_THAT(textsOf(process.standardError()), ElementsAre("text")) << value;
    }
}

} // namespace

#include "LogProcess.h"

#include "OrvLog/OrvLogger.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <thread>

namespace LogTest {

using OrvLog::OrvLogger;

void writeLog(int level, const std::string& text, const std::string& category) {
    OrvLogger::logLevelMessage("function", "file.cpp", 7, category, level, nullptr, 0, 0, text);
}

void writeTrace(int level, const std::string& text, const std::string& category) {
    OrvLogger::traceLevelMessage("function", "file.cpp", 7, category, level, nullptr, 0, 0, text);
}

void LogProcess::configure(const std::string& text) const {
    // Replaces the file at once, since children may be watching it.
    const auto replacement = folder / "agent.toml.new";
    AgentTest::writeFile(replacement, text);
    std::filesystem::rename(replacement, configurationFile());
}

void LogProcess::configureFile(const std::string& more) const {
    configure("[log]\ndestination = \"file\"\nfile = \"" + file().string() + "\"\n" + more);
}

pid_t LogProcess::start(const std::function<void()>& body) const {
    if (!exists(configurationFile())) {
        configure("");
    }
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        setenv("ORV_AGENT_CONFIG", configurationFile().c_str(), 1);
        const int output = open(standardErrorFile().c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
        dup2(output, STDERR_FILENO);
        body();
        std::fflush(stdout);
        _exit(testing::Test::HasFailure() ? EXIT_FAILURE : EXIT_SUCCESS);
    }
    return child;
}

void LogProcess::wait(pid_t child) {
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_TRUE(WIFEXITED(status)) << "ended by signal " << WTERMSIG(status);
    EXPECT_EQ(WEXITSTATUS(status), EXIT_SUCCESS) << "see the failures above";
}

std::vector<std::string> LogProcess::standardError() const {
    return linesOfFile(standardErrorFile());
}

void waitUntil(const std::function<bool()>& isSo) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
    while (!isSo()) {
        ASSERT_LT(std::chrono::steady_clock::now(), end);
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
}

std::vector<std::string> linesOfFile(const std::filesystem::path& file) {
    std::istringstream stream(AgentTest::contentOf(file));
    std::vector<std::string> lines;
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::vector<std::string> textsOf(const std::vector<std::string>& lines) {
    std::vector<std::string> texts;
    for (const std::string& line : lines) {
        std::size_t begin = 0;
        for (int blank = 0; blank < 6; ++blank) {
            begin = line.find(' ', begin) + 1;
        }
        texts.push_back(line.substr(begin));
    }
    return texts;
}

} // namespace LogTest

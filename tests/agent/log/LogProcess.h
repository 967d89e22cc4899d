/**
 * The log reads its configuration once in a process, so each test that writes records does so in a process of its own.
 */
#ifndef LOG_LOGPROCESS_H
#define LOG_LOGPROCESS_H

#include "TestSupport.h"

#include <functional>
#include <string>
#include <vector>

namespace LogTest {

/** A record with everything but its level and text set. */
void writeLog(int level, const std::string& text, const std::string& category = "Corvane.Test");
void writeTrace(int level, const std::string& text, const std::string& category = "Corvane.Test");

/** Child processes of the test, with a folder and a configuration file of their own. */
class LogProcess {
public:
    /** Writes the children's configuration file, which is empty unless this is called. */
    void configure(const std::string& text) const;

    /** A configuration that logs to `file()` with the given lines in table [log]. */
    void configureFile(const std::string& more = "") const;

    /** The path of the children's log file. */
    std::filesystem::path file() const { return folder / "agent.log"; }

    /**
     * Starts a child process. A failed expectation in `body` fails the test that waits for the child. @return the
     * child's process id.
     */
    pid_t start(const std::function<void()>& body) const;

    /** Waits for the end of a child, and expects that no signal ended it. */
    static void wait(pid_t child);

    void run(const std::function<void()>& body) const { wait(start(body)); }

    /** What the children have written to standard error. */
    std::vector<std::string> standardError() const;

    const AgentTest::TemporaryFolder folder;

private:
    std::filesystem::path configurationFile() const { return folder / "agent.toml"; }
    std::filesystem::path standardErrorFile() const { return folder / "stderr"; }
};

/** Waits until a condition holds; fails the test if that takes longer than a minute. */
void waitUntil(const std::function<bool()>& isSo);

std::vector<std::string> linesOfFile(const std::filesystem::path& file);

/** The texts of log lines, which begin behind the sixth blank. */
std::vector<std::string> textsOf(const std::vector<std::string>& lines);

} // namespace LogTest

#endif

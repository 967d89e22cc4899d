/**
 * Runs programs, and keeps their output and exit status.
 */
#ifndef TESTS_ORVCIM_PROCESS_H
#define TESTS_ORVCIM_PROCESS_H

#include <sys/types.h>

#include <cstddef>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace OrvcimTest {

struct Outcome {
    /** The exit status; -1 if a signal ended the program. */
    int status = -1;
    std::string out;
    std::string err;
};

/** A running program. It is killed when the object is destroyed. */
class RunningProcess {
public:
    /**
     * @param arguments the program's file, followed by its arguments.
     * @param environment variables that are set for the program, in addition to those of this process.
     * @param typed the text that a person types on the program's terminal; without a value, standard input is empty and
     * not a terminal.
     * @throws std::system_error if the program cannot be started.
     */
    RunningProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed = std::nullopt);
    RunningProcess(const RunningProcess&) = delete;
    RunningProcess& operator=(const RunningProcess&) = delete;
    ~RunningProcess();

    /**
     * Waits up to a minute until the program has written a text to its standard output. @return its output so far;
     * empty if it ended before.
     * @throws std::runtime_error after that minute.
     */
    std::string outputWith(const std::string& text) const;
    /** Waits in the same way for the first line, and returns it without its line end. */
    std::string firstLine() const;
    /** Waits in the same way for a text on standard error. */
    std::string errWith(const std::string& text) const;
    /** The text that the program has written to its standard error so far. */
    std::string err() const;
    void send(int signal) const;
    /** The most memory that was resident at a time so far, in bytes. */
    std::size_t peakMemory() const;
    /** Waits for the program's end. */
    Outcome wait();

private:
    class Files;
    enum class Stream { out, err };
    std::string contentOf(Stream stream) const;
    std::string waitFor(const std::string& text, Stream stream) const;

    std::unique_ptr<Files> _files;
    pid_t _process = -1;
};

/** Runs a program to its end; the parameters are those of `RunningProcess`. */
Outcome runProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed = std::nullopt);

} // namespace OrvcimTest

#endif

/**
 * Runs a program and keeps what it did.
 */
#ifndef TESTS_ORVCIM_PROCESS_H
#define TESTS_ORVCIM_PROCESS_H

#include <sys/types.h>

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace OrvcimTest {

struct Outcome {
    /** The exit status; -1 where a signal ended the program. */
    int status = -1;
    std::string out;
    std::string err;
};

/** A program that runs until it ends, by itself or because it is told to. Killed with the object. */
class RunningProcess {
public:
    /**
     * @param arguments the program's file first.
     * @param environment variables that are set for it, beside those of this process.
     * @param typed what a person types at its terminal; where it is not given, standard input is no terminal and empty.
     * @throws std::system_error where it cannot be started.
     */
    RunningProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed = std::nullopt);
    RunningProcess(const RunningProcess&) = delete;
    RunningProcess& operator=(const RunningProcess&) = delete;
    ~RunningProcess();

    /**
     * Waits until it has written a text to its standard output, for a minute at most. @return what it has written so
     * far; empty where it ended before.
     * @throws std::runtime_error after that minute.
     */
    std::string outputWith(const std::string& text) const;
    /** As `outputWith`, for the first line, without its end. */
    std::string firstLine() const;
    /** As `outputWith`, of standard error. */
    std::string errWith(const std::string& text) const;
    /** What it has written to its standard error so far. */
    std::string err() const;
    void send(int signal) const;
    /** Waits for its end. */
    Outcome wait();

private:
    class Files;
    enum class Stream { out, err };
    std::string contentOf(Stream stream) const;
    std::string waitFor(const std::string& text, Stream stream) const;

    std::unique_ptr<Files> _files;
    pid_t _process = -1;
};

/** Runs a program to its end, as `RunningProcess` starts it. */
Outcome runProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed = std::nullopt);

} // namespace OrvcimTest

#endif

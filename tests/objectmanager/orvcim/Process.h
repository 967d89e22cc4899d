/**
 * Runs a program and keeps what it did.
 */
#ifndef TESTS_ORVCIM_PROCESS_H
#define TESTS_ORVCIM_PROCESS_H

#include <map>
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

/**
 * Runs a program to its end.
 *
 * @param arguments the program's file first.
 * @param environment variables that are set for it, beside those of this process.
 * @param typed what a person types at its terminal; where it is not given, standard input is no terminal and empty.
 * @throws std::system_error where it cannot be started.
 */
Outcome runProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed = std::nullopt);

} // namespace OrvcimTest

#endif

/**
 * Runs orvcim on the test's own classes and provider. With ORVCIM_TEST_MACHINE=silent in the environment, the agent is
 * one that cannot be observed.
 */
#ifndef TESTS_ORVCIM_ORVCIM_H
#define TESTS_ORVCIM_ORVCIM_H

#include "Process.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace OrvcimTest {

inline Outcome orvcim(std::vector<std::string> arguments, const std::map<std::string, std::string>& environment = {},
                      const std::optional<std::string>& typed = std::nullopt) {
    const auto machine = environment.find("ORVCIM_TEST_MACHINE");
    const bool silent = machine != environment.end() && machine->second == "silent";
    const std::vector<std::string> program = {ORVCIM_PROGRAM, "--schema",
                                              ORVCIM_TEST_SCHEMA + std::string(silent ? "-silent" : ""),
                                              "--provider-path", ORVCIM_TEST_LIBRARIES};
    arguments.insert(arguments.begin(), program.begin(), program.end());
    return runProcess(arguments, environment, typed);
}

} // namespace OrvcimTest

#endif

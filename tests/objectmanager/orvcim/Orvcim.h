/**
 * Runs orvcim on the test's own classes and provider.
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
    const std::vector<std::string> program = {ORVCIM_PROGRAM, "--schema", ORVCIM_TEST_SCHEMA, "--provider-path",
                                              ORVCIM_TEST_LIBRARIES};
    arguments.insert(arguments.begin(), program.begin(), program.end());
    return runProcess(arguments, environment, typed);
}

} // namespace OrvcimTest

#endif

/**
 * Runs orvcim with the shipped schema, provider libraries and agent, which it finds beside the program, and with a
 * simulated machine.
 */
#ifndef TESTS_ORVCIM_PROVIDED_H
#define TESTS_ORVCIM_PROVIDED_H

#include "Process.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <string>
#include <system_error>
#include <vector>

namespace OrvcimTest {

class ProvidedTest : public testing::Test {
protected:
    ProvidedTest() {
        std::string name = (std::filesystem::temp_directory_path() / "orvcim-test-XXXXXX").string();
        if (mkdtemp(name.data()) == nullptr) {
            throw std::system_error(errno, std::generic_category(), name);
        }
        _folder = name;
        configure("[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
    }

    ~ProvidedTest() override {
        std::error_code ignored;
        std::filesystem::remove_all(_folder, ignored);
    }

    /** Gives the machine these nodes. */
    void configure(const std::string& nodes) const {
        std::ofstream(_folder / "agent.toml")
            << "[system]\nname = \"machine.example\"\n"
            << "[log]\ndestination = \"file\"\nfile = \"" << _folder.string() << "/log\"\n"
            << "[instrumentation.simulated]\nstate-file = \"" << _folder.string() << "/state.json\"\n"
            << nodes;
    }

    /** The variables with which a program finds the machine. */
    std::map<std::string, std::string> environment() const {
        return {{"ORV_AGENT_CONFIG", (_folder / "agent.toml").string()}, {"LC_ALL", "C"}};
    }

    Outcome orvcim(std::vector<std::string> arguments, std::map<std::string, std::string> variables = {}) const {
        arguments.insert(arguments.begin(), ORVCIM_PROGRAM);
        variables.merge(environment());
        return runProcess(arguments, variables);
    }

    std::string answerOf(const std::vector<std::string>& arguments) const {
        const Outcome outcome = orvcim(arguments);
        EXPECT_EQ(outcome.status, 0);
        EXPECT_EQ(outcome.err, "");
        return outcome.out;
    }

    const std::string _service =
        "root/cimv2:TALVO_PowerManagementService.CreationClassName=\"TALVO_PowerManagementService\","
        "Name=\"PowerStateManagement_chassis/blade1\",SystemCreationClassName=\"TALVO_ComputerSystem\","
        "SystemName=\"machine.example\"";
    const std::string _system =
        "root/cimv2:TALVO_ComputerSystem.CreationClassName=\"TALVO_ComputerSystem\",Name=\"machine.example\"";
    const std::string _capabilities = "root/cimv2:TALVO_PowerManagementCapabilities.InstanceID=\"chassis/blade1\"";
    std::filesystem::path _folder;
};

} // namespace OrvcimTest

#endif

#include "orvcim/AgentExamination.h"

#include "Backend.h"
#include "OrvLog/OrvLogger.h"
#include "config/Configuration.h"

#include <fmt/format.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include <unistd.h>

namespace ObjectManager::Orvcim {

namespace {

using Norv::Agent::Configuration;
using Norv::Agent::LogSettings;

/** Why the log file cannot be written; empty if it can, or if the log does not go to a file. */
std::string problemOf(const LogSettings& log) {
    if (log.destination != LogSettings::Destination::file) {
        return "";
    }
    const bool exists = access(log.file.c_str(), F_OK) == 0;
    const std::filesystem::path written = exists ? log.file : log.file.parent_path();
    if (std::error_code error; !exists && !std::filesystem::exists(written, error) && !error) {
        return fmt::format("the log {} cannot be written: there is no folder {}: make it, or name another log.file",
                           log.file.string(), written.string());
    }
    if (access(written.c_str(), W_OK) == 0) {
        return "";
    }
    return fmt::format("the log {} cannot be written: {}: {}: let uid {} write there, or name another log.file",
                       log.file.string(), written.string(), std::generic_category().message(errno), geteuid());
}

std::string describe(const LogSettings& log) {
    switch (log.destination) {
    case LogSettings::Destination::file:
        return fmt::format("{}, level {}", log.file.string(), log.logLevel);
    case LogSettings::Destination::syslog:
        return fmt::format("syslog, level {}", log.logLevel);
    case LogSettings::Destination::standardError:
        break;
    }
    return fmt::format("standard error, level {}", log.logLevel);
}

} // namespace

std::string problemOfConfiguration() {
    try {
        Norv::Agent::loadConfiguration();
    } catch (const Norv::Agent::ConfigurationError& error) {
        return error.what();
    }
    return "";
}

AgentExamination examineAgent() {
    AgentExamination found;
    found.facts.emplace_back("user", fmt::format("uid {}", geteuid()));
    try {
        const Configuration configuration = Norv::Agent::loadConfiguration();
        const auto backend = Norv::Agent::makeBackend(configuration);
        found.facts.emplace_back("configuration", configuration.source.empty() ? "no file: built-in defaults"
                                                                               : configuration.source.string());
        found.facts.emplace_back("log", describe(configuration.log));
        found.facts.emplace_back("machine", backend->machine());
        if (const std::string problem = problemOf(configuration.log); !problem.empty()) {
            found.problems.push_back(problem);
        }
        const Norv::Agent::MachineReport report = backend->examine();
        for (const auto& [name, value] : report.facts) {
            found.facts.emplace_back(name, value);
        }
        found.problems.insert(found.problems.end(), report.problems.begin(), report.problems.end());
    } catch (const Norv::Agent::ConfigurationError& error) {
        found.problems.push_back(
            fmt::format("{}: until this is corrected, the agent offers no power-management node", error.what()));
    }
    return found;
}

} // namespace ObjectManager::Orvcim

namespace OrvLog {

// Replaces the log library for the agent's code that is linked into orvcim, which runs while the agent is examined.
// Providers in this process log through the agent's own library.
void OrvLogger::logLevelMessage(const char*, const char*, int, const std::string&, int, char*, int, int,
                                const std::string& message) {
    fmt::print(stderr, "orvcim: {}\n", message);
}

} // namespace OrvLog

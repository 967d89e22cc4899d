/**
 * Examines the embedded agent as a provider that this user runs finds it.
 */
#ifndef ORVCIM_AGENTEXAMINATION_H
#define ORVCIM_AGENTEXAMINATION_H

#include <string>
#include <utility>
#include <vector>

namespace ObjectManager::Orvcim {

struct AgentExamination {
    /** Facts as name and value: the configuration file, the log, the machine and what it can do. */
    std::vector<std::pair<std::string, std::string>> facts;
    /** What is wrong or missing, and what to do about each. */
    std::vector<std::string> problems;
};

/** What is wrong with the agent's configuration, in one line; empty if it can be used. */
std::string problemOfConfiguration();

/** Reads the agent's configuration and examines its machine, without any change to the machine. */
AgentExamination examineAgent();

} // namespace ObjectManager::Orvcim

#endif

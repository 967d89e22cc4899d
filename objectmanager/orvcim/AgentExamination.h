/**
 * The embedded agent as it would be in a process of this user, now.
 */
#ifndef ORVCIM_AGENTEXAMINATION_H
#define ORVCIM_AGENTEXAMINATION_H

#include <string>
#include <utility>
#include <vector>

namespace ObjectManager::Orvcim {

struct AgentExamination {
    /** What was found, by name: the configuration file, the machine, what it can do. */
    std::vector<std::pair<std::string, std::string>> facts;
    /** What is wrong or missing, each with what to do about it. */
    std::vector<std::string> problems;
};

/** What is wrong with the agent's configuration, in one line; empty where nothing is. */
std::string problemOfConfiguration();

/** Reads the agent's configuration and looks at its machine, of which it asks nothing. */
AgentExamination examineAgent();

} // namespace ObjectManager::Orvcim

#endif

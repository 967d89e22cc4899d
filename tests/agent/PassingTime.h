#ifndef AGENTTEST_PASSINGTIME_H
#define AGENTTEST_PASSINGTIME_H

#include <chrono>

namespace AgentTest {

/** Advances the coarse clock for all code in this process. */
void passTime(std::chrono::seconds time);

} // namespace AgentTest

#endif

#ifndef AGENTTEST_PASSINGTIME_H
#define AGENTTEST_PASSINGTIME_H

#include <chrono>

namespace AgentTest {

/** Lets time pass for everything in this process that goes by the coarse clock, at once. */
void passTime(std::chrono::seconds time);

} // namespace AgentTest

#endif

/**
 * Replaces the agent's log library in the programs that link it: keeps the records instead of writing them.
 */
#ifndef TESTS_INSTRUMENTATION_RECORDEDLOG_H
#define TESTS_INSTRUMENTATION_RECORDEDLOG_H

#include <string>
#include <vector>

namespace AgentTest {

/** The records since the last call, each as "<kind> <level> <category> <text>". */
std::vector<std::string> takeLog();

/** The kinds of the records of kind "log" since the last call, as OrvLog/Observer.h numbers them. */
std::vector<int> takeRecordKinds();

/** Replaces the numbers in the requester of power requests: "[asked by PROGRAM, process N, uid N]". */
void maskRequester(std::vector<std::string>& lines);

} // namespace AgentTest

#endif

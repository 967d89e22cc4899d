/**
 * Replaces the system calls that store a state file, so that tests can make them fail.
 */
#ifndef TESTS_INSTRUMENTATION_FAILINGCALLS_H
#define TESTS_INSTRUMENTATION_FAILINGCALLS_H

namespace AgentTest {

/**
 * Makes this thread's next call of write, fsync, futimens or rename fail.
 *
 * @param call the function's name, a literal.
 * @param error the error number; 0 makes write(2) succeed without writing anything.
 */
void failNext(const char* call, int error);

/** Whether the call has failed since `failNext`. */
bool hasFailed();

} // namespace AgentTest

#endif

/**
 * Stands in front of the system calls by which a state file is stored, so that they can fail.
 */
#ifndef TESTS_INSTRUMENTATION_FAILINGCALLS_H
#define TESTS_INSTRUMENTATION_FAILINGCALLS_H

namespace AgentTest {

/**
 * Has this thread's next call of write, fsync, futimens or rename fail.
 *
 * @param call its name, a literal.
 * @param error the error number; 0 is a write(2) that writes nothing.
 */
void failNext(const char* call, int error);

/** Whether it has failed since. */
bool hasFailed();

} // namespace AgentTest

#endif

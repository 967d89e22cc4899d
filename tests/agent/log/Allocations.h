#ifndef LOG_ALLOCATIONS_H
#define LOG_ALLOCATIONS_H

namespace LogTest {

/** How often operator new was called so far, by the test and by the library. */
int allocations();

} // namespace LogTest

#endif

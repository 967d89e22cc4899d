#ifndef LOG_ALLOCATIONS_H
#define LOG_ALLOCATIONS_H

namespace LogTest {

/** The number of calls of operator new so far, by the test and by the library. */
int allocations();

} // namespace LogTest

#endif

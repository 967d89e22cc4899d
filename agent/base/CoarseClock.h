#ifndef BASE_COARSECLOCK_H
#define BASE_COARSECLOCK_H

#include <cstdint>
#include <ctime>

namespace Norv::Agent {

/** Milliseconds of a clock that nobody sets; exact to a few of them, and a fraction of the price of others. */
inline std::int64_t coarseMilliseconds() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
    return std::int64_t{now.tv_sec} * 1000 + now.tv_nsec / 1'000'000;
}

} // namespace Norv::Agent

#endif

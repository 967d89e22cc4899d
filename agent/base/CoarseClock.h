#ifndef BASE_COARSECLOCK_H
#define BASE_COARSECLOCK_H

#include <cstdint>
#include <ctime>

namespace Norv::Agent {

/** Milliseconds of a monotonic clock. It is exact to a few milliseconds, and much cheaper to read than others. */
inline std::int64_t coarseMilliseconds() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
    return std::int64_t{now.tv_sec} * 1000 + now.tv_nsec / 1'000'000;
}

} // namespace Norv::Agent

#endif

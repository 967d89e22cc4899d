/** Calls of the operating system that have to succeed. */
#ifndef BENCH_SYSTEM_H
#define BENCH_SYSTEM_H

#include <cerrno>
#include <system_error>

namespace Bench {

/** @throws std::system_error with errno if a call failed. */
inline void require(bool done, const char* what) {
    if (!done) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

} // namespace Bench

#endif

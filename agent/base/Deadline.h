#ifndef BASE_DEADLINE_H
#define BASE_DEADLINE_H

#include <algorithm>
#include <chrono>

namespace Norv::Agent {

/** A limit for the total time that an operation may wait. */
class Deadline {
public:
    explicit Deadline(std::chrono::milliseconds whole) : Deadline(whole, whole) {}
    /** @param left what remains of the whole time now. */
    Deadline(std::chrono::milliseconds whole, std::chrono::milliseconds left)
        : _whole(whole), _end(std::chrono::steady_clock::now() + left) {}

    std::chrono::milliseconds whole() const { return _whole; }

    /** The time that remains; never negative. */
    std::chrono::microseconds remaining() const {
        const auto left = std::chrono::floor<std::chrono::microseconds>(_end - std::chrono::steady_clock::now());
        return std::max(left, std::chrono::microseconds{0});
    }

private:
    std::chrono::milliseconds _whole;
    std::chrono::steady_clock::time_point _end;
};

} // namespace Norv::Agent

#endif

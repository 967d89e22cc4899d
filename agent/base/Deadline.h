#ifndef BASE_DEADLINE_H
#define BASE_DEADLINE_H

#include <algorithm>
#include <chrono>

namespace Norv::Agent {

/** The time that everything an operation waits for may take together. */
class Deadline {
public:
    explicit Deadline(std::chrono::milliseconds whole) : Deadline(whole, whole) {}
    /** @param left what is left of it now. */
    Deadline(std::chrono::milliseconds whole, std::chrono::milliseconds left)
        : _whole(whole), _end(std::chrono::steady_clock::now() + left) {}

    std::chrono::milliseconds whole() const { return _whole; }

    /** Not negative. */
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

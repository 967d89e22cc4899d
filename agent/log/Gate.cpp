#include "Gate.h"

#include <ctime>

#include <unistd.h>

namespace OrvLog {

namespace {

constexpr std::int64_t patience = 1000;

std::int64_t milliseconds() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
    return std::int64_t{now.tv_sec} * 1000 + now.tv_nsec / 1'000'000;
}

} // namespace

std::optional<Gate::Pass> Gate::enter() {
    if (const pid_t process = getpid(); _process != process) {
        _inside = 0;
        _process = process;
    }
    const std::int64_t now = milliseconds();
    if (_inside == 0) {
        _moved = now;
    } else if (now - _moved > patience) {
        return std::nullopt;
    }
    ++_inside;
    return Pass(*this);
}

void Gate::leave() {
    _moved = milliseconds();
    --_inside;
}

} // namespace OrvLog

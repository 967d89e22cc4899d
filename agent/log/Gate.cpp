#include "Gate.h"

#include "base/CoarseClock.h"

#include <unistd.h>

namespace OrvLog {

using Norv::Agent::coarseMilliseconds;

namespace {

constexpr std::int64_t patience = 1000;
constexpr unsigned int countBits = 32;

} // namespace

std::optional<Gate::Pass> Gate::enter() {
    const std::uint64_t process = static_cast<std::uint64_t>(getpid()) << countBits;
    const std::int64_t now = coarseMilliseconds();
    std::uint64_t inside = _inside;
    std::uint64_t withThis = 0;
    do {
        const bool areOurs = inside >> countBits == process >> countBits;
        const auto count = areOurs ? static_cast<std::uint32_t>(inside) : 0;
        if (count == 0) {
            _moved = now;
        } else if (now - _moved > patience) {
            return std::nullopt;
        }
        withThis = process | (count + 1);
    } while (!_inside.compare_exchange_weak(inside, withThis));
    return Pass(*this);
}

void Gate::leave() {
    _moved = coarseMilliseconds();
    --_inside;
}

} // namespace OrvLog

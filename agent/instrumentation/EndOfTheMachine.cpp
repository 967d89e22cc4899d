#include "EndOfTheMachine.h"

#include <utility>

namespace Norv::Agent {

namespace {

/** A machine that still runs this long after it began to go down has failed to do so. */
constexpr std::chrono::minutes longestEnd{2};

} // namespace

void EndOfTheMachine::note(Time when, bool begun, Node node) {
    const std::lock_guard guard(_mutex);
    // The end keeps the time at which it was first seen.
    if (!(begun && _note && _note->begun)) {
        _note = {when, begun, std::move(node)};
    }
}

void EndOfTheMachine::forget() {
    const std::lock_guard guard(_mutex);
    _note.reset();
}

std::optional<EndOfTheMachine::Node> EndOfTheMachine::begun() const {
    return nodeSince(true);
}

std::optional<EndOfTheMachine::Node> EndOfTheMachine::due() const {
    return nodeSince(false);
}

std::optional<EndOfTheMachine::Node> EndOfTheMachine::nodeSince(bool begun) const {
    const std::lock_guard guard(_mutex);
    if (!_note || (begun && !_note->begun)) {
        return std::nullopt;
    }
    const Time::duration since = std::chrono::floor<Time::duration>(std::chrono::system_clock::now()) - _note->when;
    const bool isNow = since >= Time::duration::zero() && since < longestEnd;
    return isNow ? std::optional(_note->node) : std::nullopt;
}

} // namespace Norv::Agent

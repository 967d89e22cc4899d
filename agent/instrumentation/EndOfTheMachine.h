/**
 * What is known of the machine's end, for when nobody can be asked any more: systemd-logind is stopped beside whoever
 * asks.
 */
#ifndef INSTRUMENTATION_ENDOFTHEMACHINE_H
#define INSTRUMENTATION_ENDOFTHEMACHINE_H

#include <chrono>
#include <mutex>
#include <optional>
#include <vector>

namespace Norv::Agent {

/** Used by several threads at once. */
class EndOfTheMachine {
public:
    /** In microseconds, as systemd-logind tells it: far more years than in nanoseconds. */
    using Time = std::chrono::sys_time<std::chrono::microseconds>;

    /** What is read of the machine's node from then on. */
    struct Node {
        unsigned int state;
        std::vector<unsigned int> powerStates;
    };

    /** Notes that the machine goes down, and when. @param begun whether it already does. */
    void note(Time when, bool begun, Node node);

    /** Notes that nothing is under way. */
    void forget();

    /** Set where the machine was seen going down: it does not come back from that. */
    std::optional<Node> begun() const;

    /** Set also where the time has come at which it was to go down, unless it was told otherwise since. */
    std::optional<Node> due() const;

private:
    struct Note {
        Time when;
        bool begun;
        Node node;
    };

    std::optional<Node> nodeSince(bool begun) const;

    mutable std::mutex _mutex;
    std::optional<Note> _note;
};

} // namespace Norv::Agent

#endif

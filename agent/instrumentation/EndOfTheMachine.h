/**
 * Remembers that the machine goes down. While it does, systemd-logind is stopped together with the processes that ask
 * for the state, so they must know it themselves.
 */
#ifndef INSTRUMENTATION_ENDOFTHEMACHINE_H
#define INSTRUMENTATION_ENDOFTHEMACHINE_H

#include <chrono>
#include <mutex>
#include <optional>
#include <vector>

namespace Norv::Agent {

/** What is known about the machine's end. Used by several threads at once. */
class EndOfTheMachine {
public:
    /** In microseconds, as in systemd-logind's answers: nanoseconds would overflow at times that it can give. */
    using Time = std::chrono::sys_time<std::chrono::microseconds>;

    /** The state of the machine's node from then on. */
    struct Node {
        unsigned int state;
        std::vector<unsigned int> powerStates;
    };

    /** Notes that the machine goes down, and when. @param begun whether it is already going down. */
    void note(Time when, bool begun, Node node);

    /** Notes that no shutdown is under way. */
    void forget();

    /** The node, if the machine was seen going down: that cannot be stopped any more. Else no value. */
    std::optional<Node> begun() const;

    /**
     * The node, also if only the noted time for the shutdown has come and nothing newer was noted since. Else no value.
     */
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

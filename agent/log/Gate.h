#ifndef LOG_GATE_H
#define LOG_GATE_H

#include <atomic>
#include <cstdint>
#include <optional>

namespace OrvLog {

/**
 * Keeps threads away from a destination that hangs, such as a file on a network that is down: once a thread has been in
 * for a second and nobody has got out since, nobody else is let in until it is. The thread that writes to such a file
 * cannot give up, but no other thread has to wait with it.
 */
class Gate {
public:
    /** A thread's stay. */
    class Pass {
    public:
        explicit Pass(Gate& gate) : _gate(&gate) {}
        ~Pass() {
            if (_gate != nullptr) {
                _gate->leave();
            }
        }
        Pass(Pass&& other) noexcept : _gate(other._gate) { other._gate = nullptr; }
        Pass(const Pass&) = delete;
        Pass& operator=(const Pass&) = delete;
        Pass& operator=(Pass&&) = delete;

    private:
        Gate* _gate;
    };

    /** Nothing where the destination hangs. */
    std::optional<Pass> enter();

private:
    void leave();

    /**
     * How many threads are in, and in the upper half whose: those that were in do not come along into a child process.
     */
    std::atomic<std::uint64_t> _inside = 0;
    /** When a thread came in where nobody was, or got out; in milliseconds of a clock of its own. */
    std::atomic<std::int64_t> _moved = 0;
};

} // namespace OrvLog

#endif

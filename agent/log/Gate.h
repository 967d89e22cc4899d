#ifndef LOG_GATE_H
#define LOG_GATE_H

#include <atomic>
#include <cstdint>
#include <optional>

namespace OrvLog {

/**
 * Keeps threads away from a destination that hangs, such as a file on a network that is down. When a thread has been
 * writing for a second and no thread has finished since, no other thread is let in until one finishes. The thread that
 * writes to such a file cannot give up, but no other thread has to wait with it.
 */
class Gate {
public:
    /** Lets a thread write while it exists. */
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

    /** Lets the calling thread in. @return no value if the destination hangs. */
    std::optional<Pass> enter();

private:
    void leave();

    /**
     * The number of threads inside, with the process id in the upper half: threads that are inside during a fork do not
     * exist in the child process.
     */
    std::atomic<std::uint64_t> _inside = 0;
    /** When a thread last entered an empty gate, or left it; in milliseconds of coarseMilliseconds(). */
    std::atomic<std::int64_t> _moved = 0;
};

} // namespace OrvLog

#endif

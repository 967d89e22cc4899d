/** Writes the server's log in a thread of its own. */
#ifndef ORVCIM_SERVELOG_H
#define ORVCIM_SERVELOG_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

namespace ObjectManager::Orvcim {

/**
 * Writes lines to standard error or to the system's log, in a thread of its own, so that callers do not wait for a slow
 * reader or a full disk. Lines that the full queue has no room for are dropped and counted; the count is logged later.
 * Lines about the power switch are never dropped: their callers wait if there are too many of them. Used by several
 * threads at once.
 */
class ServeLog {
public:
    /** How many lines the queue holds, those about the power switch apart. */
    static constexpr std::size_t room = 4000;
    /** How many lines about the power switch it holds. */
    static constexpr std::size_t roomForSwitch = 20'000;

    /** @param syslog whether lines go to the system's log, syslog(3), and not to standard error. */
    explicit ServeLog(bool syslog);
    ServeLog(const ServeLog&) = delete;
    ServeLog& operator=(const ServeLog&) = delete;
    /** Waits at most a second for the lines in the queue to be written. */
    ~ServeLog();

    void write(const std::string& line);
    /**
     * Writes a line about the power switch. If there is no room for it, since nobody has read the log for long, the
     * caller waits until there is: better than a switch without a record, or a server without memory.
     */
    void keep(const std::string& line);
    /** Waits until all lines are written. @return false if the time was over before. */
    bool flush(std::chrono::milliseconds time);

private:
    /** What the thread uses. The thread shares its ownership, since it may outlive the ServeLog while a write hangs. */
    struct Queue {
        explicit Queue(bool toSyslog) : syslog(toSyslog) {}

        struct Line {
            std::string text;
            bool isAboutSwitch;
        };

        void run();
        void put(const std::string& line);
        bool isEnding();

        const bool syslog;
        std::mutex mutex;
        std::condition_variable changed;
        std::deque<Line> lines;
        /** How many of the lines are about the power switch. */
        std::size_t aboutSwitch = 0;
        std::size_t leftOut = 0;
        bool writing = false;
        bool ending = false;
        bool ended = false;
    };

    std::shared_ptr<Queue> _queue;
    std::thread _thread;
};

} // namespace ObjectManager::Orvcim

#endif

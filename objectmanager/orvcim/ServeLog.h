/** Where the server's log lines go, without anybody waiting for that. */
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
 * Writes lines to standard error or to the system's log, in a thread of its own: whoever logs never waits for a reader
 * who does not read. Lines that there is no room for are counted, and the count is logged when there is. Used by
 * several threads at once.
 */
class ServeLog {
public:
    /** Lines that may wait. */
    static constexpr std::size_t room = 4000;

    /** @param syslog to the system's log, see syslog(3). */
    explicit ServeLog(bool syslog);
    ServeLog(const ServeLog&) = delete;
    ServeLog& operator=(const ServeLog&) = delete;
    /** Gives the lines that wait a second. */
    ~ServeLog();

    void write(const std::string& line);
    /** Waits until everything is written. @return false where the time was over before. */
    bool flush(std::chrono::milliseconds time);

private:
    /** What the thread uses, which cannot be ended while it waits for somebody. */
    struct Queue {
        explicit Queue(bool toSyslog) : syslog(toSyslog) {}

        void run();
        void put(const std::string& line);
        bool isEnding();

        const bool syslog;
        std::mutex mutex;
        std::condition_variable changed;
        std::deque<std::string> lines;
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

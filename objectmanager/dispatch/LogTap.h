/** What providers write to the agent's log while they serve a request. */
#ifndef DISPATCH_LOGTAP_H
#define DISPATCH_LOGTAP_H

#include <cstdint>
#include <deque>
#include <map>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

struct LogRecord {
    std::string category;
    int level = 0;
    std::string text;
    /** Grows from record to record. */
    std::uint64_t sequence = 0;
};

/** The message in a record's text, without the frame "MESSAGE [File: ..., Line: N]: " around it. */
std::string_view messageOf(std::string_view text);

/**
 * Receives the records of the agent's log library in this process, of level 5000 and above, whatever its thresholds.
 *
 * The library learns from the environment variable ORV_AGENT_LOG_SOCKET where to send them, and looks only once: a tap
 * is made before any provider library is loaded, and there is one at most in a process. Records are told apart by the
 * thread that wrote them. Used by several threads at once.
 */
class LogTap {
public:
    /** How many records are kept for a thread that does not take them, and for how many such threads. */
    static constexpr std::size_t recordsPerThread = 1000;
    static constexpr std::size_t threads = 100;

    /** @throws std::system_error where there is no socket to be had. */
    LogTap();
    LogTap(const LogTap&) = delete;
    LogTap& operator=(const LogTap&) = delete;
    ~LogTap();

    /** The sequence number of the newest record that has arrived. */
    std::uint64_t newest();
    /** The calling thread's records after the one numbered `sequence`, which stay here. */
    std::vector<LogRecord> since(std::uint64_t sequence);
    /** The messages in those of them that tell a failure. */
    std::vector<std::string> failuresSince(std::uint64_t sequence);
    /** The calling thread's records, which are gone from here. */
    std::vector<LogRecord> take();
    /** Drops the calling thread's records, but for those that nobody has looked for yet. */
    void forget();

private:
    void drain();
    void keep(std::string_view datagram);

    int _receiver = -1;
    int _sender = -1;
    std::mutex _mutex;
    std::uint64_t _newest = 0;
    std::map<std::int64_t, std::deque<LogRecord>> _records;
};

} // namespace ObjectManager

#endif

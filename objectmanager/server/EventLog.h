/** The server's log of its clients. */
#ifndef SERVER_EVENTLOG_H
#define SERVER_EVENTLOG_H

#include <chrono>
#include <functional>
#include <map>
#include <mutex>
#include <string>

namespace ObjectManager::Server {

/**
 * Writes one line for the person who runs the server. Called by several threads at once; must neither throw nor wait.
 */
using Log = std::function<void(const std::string& line)>;

/**
 * Logs lines about clients, so that no client can fill the log: long lines are cut off, and the lines a minute are
 * limited for each network and for all networks together. Lines that are left out are counted, and the count is logged.
 * Used by several threads at once.
 */
class EventLog {
public:
    using Clock = std::chrono::steady_clock;
    static constexpr std::size_t longestLine = 1000;
    static constexpr unsigned int linesOfNetwork = 100;
    static constexpr unsigned int linesOfAll = 1000;
    static constexpr std::chrono::minutes period{1};

    explicit EventLog(Log log) : _log(std::move(log)) {}

    void report(const std::string& network, const std::string& line, Clock::time_point now = Clock::now());

    /** Logs a line that is not about a client; it is never left out. */
    void report(const std::string& line);

    /** Logs how many lines were left out in periods that are over. */
    void settle(Clock::time_point now = Clock::now());

private:
    struct Count {
        Clock::time_point begin;
        unsigned int lines = 0;
        unsigned int leftOut = 0;
    };

    void logLeftOut(const std::string& network, const Count& count) const;

    const Log _log;
    std::mutex _mutex;
    std::map<std::string, Count> _networks;
    Count _all{};
};

} // namespace ObjectManager::Server

#endif

/** What the server logs of its clients. */
#ifndef SERVER_EVENTLOG_H
#define SERVER_EVENTLOG_H

#include <chrono>
#include <functional>
#include <map>
#include <mutex>
#include <string>

namespace ObjectManager::Server {

/** Takes one line for the person who runs the server. Called by several threads at once; must not throw or wait. */
using Log = std::function<void(const std::string& line)>;

/**
 * Lines about clients, so that no client can fill the log: each line is cut, and each network, as well as all of them
 * together, has so many lines a minute. What is left out is counted, and the count is logged. Used by several threads
 * at once.
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

    /** Of no client; never left out. */
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

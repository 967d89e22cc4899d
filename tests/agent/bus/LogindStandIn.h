/**
 * A systemd-logind in this process that answers at once and counts, where python-dbusmock is too slow or too eager.
 */
#ifndef TESTS_AGENT_LOGINDSTANDIN_H
#define TESTS_AGENT_LOGINDSTANDIN_H

#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

struct sd_bus;
struct sd_bus_message;

namespace AgentTest {

/**
 * A machine that runs and can be asked to do everything. It takes the name of systemd-logind on the bus that
 * DBUS_SYSTEM_BUS_ADDRESS names, which has to be a test's own, and serves it with a thread. A shutdown that is
 * scheduled is remembered until it is cancelled, and never happens.
 */
class LogindStandIn {
public:
    /** @throws std::system_error if the name cannot be taken. */
    LogindStandIn();
    ~LogindStandIn();
    LogindStandIn(const LogindStandIn&) = delete;
    LogindStandIn& operator=(const LogindStandIn&) = delete;

    /** What was asked since `expect` was called. */
    struct Asked {
        std::size_t calls;
        std::size_t connections;
    };

    /**
     * Begins to count anew, without a scheduled shutdown, and says how many calls a client has to make before it gets
     * an answer to the first of them: so many in its first round trip to the bus, so many in the next. No call of a
     * round trip is answered before all of them have come, and none after the last: whoever needs more round trips
     * waits in vain.
     *
     * @param roundTrips empty: every call is answered at once.
     */
    void expect(std::vector<std::size_t> roundTrips = {});

    Asked asked() const;

private:
    struct Unreferencer {
        void operator()(sd_bus* bus) const;
        void operator()(sd_bus_message* message) const;
    };
    using Message = std::unique_ptr<sd_bus_message, Unreferencer>;

    void take(sd_bus_message* call);
    void answer(sd_bus_message* call);
    void serve();

    mutable std::mutex _mutex;
    /** How many calls are missing in each round trip that has not been answered yet. */
    std::deque<std::size_t> _roundTrips;
    bool _atOnce = true;
    std::vector<Message> _unanswered;
    std::size_t _calls = 0;
    std::set<std::string> _connections;
    std::pair<std::string, std::uint64_t> _scheduled;
    std::unique_ptr<sd_bus, Unreferencer> _bus;
    /** Readable as soon as the thread is to end. */
    int _end;
    std::thread _thread;
};

} // namespace AgentTest

#endif

/** The clients' connections: how many there may be, and which of them makes room for another. */
#ifndef SERVER_CONNECTIONS_H
#define SERVER_CONNECTIONS_H

#include "server/EventLog.h"
#include "server/Settings.h"

#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <list>
#include <map>
#include <mutex>
#include <string>

namespace ObjectManager::Server {

/**
 * All open connections. Where there are too many, the oldest that waits for its client is shut down for a new one: of
 * the new one's network where that has too many, otherwise of the network that has most. Those of clients that were
 * never served go first. Where all wait for the server, the new one is told so by whoever serves it. Used by several
 * threads at once.
 */
class Connections {
public:
    using Clock = std::chrono::steady_clock;

    enum class State {
        /** No request has begun. */
        idle,
        /** A request has begun and is not yet here. */
        receiving,
        /** The client waits because of its log-in: for its turn, or because it failed. */
        loggingIn,
        /** The client takes its answer. */
        sending,
        /** The server has the request, and makes the answer. */
        answering,
        /** Shut down by the server, and about to be closed. */
        leaving,
    };
    static constexpr std::size_t states = 6;

    struct Connection {
        int socket;
        /** The client's, for people. */
        std::string address;
        std::string network;
        /** There was no room for it. */
        bool surplus = false;
        /** The client has got what it asked for once. */
        std::atomic<bool> served = false;
        State state = State::idle;
        /** Where it is in the list of its state. */
        std::list<Connection>::iterator self{};
    };

    /** How many are in each state, and how many were refused since the start. */
    struct Counts {
        std::array<std::size_t, states> of{};
        std::size_t refused = 0;
    };

    Connections(const Limits& limits, EventLog& events) : _limits(limits), _events(events) {}

    /**
     * @param socket stays open until `closed`.
     * @return null where there is not even room for telling the client so.
     */
    Connection* opened(int socket, const std::string& address, const std::string& network);
    void closed(Connection& connection);

    /** @return false where it was shut down, which cannot be undone. */
    bool enter(Connection& connection, State state);

    /** Shuts down those that are in none of the states in which the client will get an answer. */
    void endIdle();
    void endAll();
    /** Waits until no client waits for an answer. @return false where the time was over before. */
    bool waitForAnswers(std::chrono::milliseconds time);

    Counts counts();

private:
    using List = std::list<Connection>;

    List& listOf(State state) { return _lists[static_cast<std::size_t>(state)]; }
    void move(Connection& connection, State state);
    void end(Connection& connection);
    void endList(State state);
    /** Shuts one down that waits for its client. @param network whose; anybody's where it is empty. */
    bool makeRoom(const std::string& network);
    const std::string& largestNetwork() const;
    /** Says it at most once a minute, since it is said of clients who may be many. */
    void reportCrowd(const std::string& line);

    const Limits _limits;
    EventLog& _events;
    std::mutex _mutex;
    std::condition_variable _changed;
    /** One for each state, in the order in which the connections entered it. */
    std::array<List, states> _lists;
    /* Without those that leave. */
    unsigned int _count = 0;
    std::map<std::string, unsigned int> _countOfNetwork;
    std::map<std::string, unsigned int> _leavingOfNetwork;
    std::size_t _refused = 0;
    Clock::time_point _lastCrowdReport{};
};

} // namespace ObjectManager::Server

#endif

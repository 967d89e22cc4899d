/** The clients' connections: their limits, and which of them is closed to accept another one. */
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
 * All open connections. If there are too many, one that waits for its client is shut down for a new connection: one of
 * the new connection's network if that has too many, otherwise one of the network that has most. Connections that never
 * had a request answered go first, then the oldest. If all connections wait for the server, the new one is marked as
 * `surplus`, and its thread answers that the server is busy. Used by several threads at once.
 */
class Connections {
public:
    using Clock = std::chrono::steady_clock;

    enum class State {
        /** No request has begun. */
        idle,
        /** A request has begun, but has not arrived as a whole. */
        receiving,
        /** The client waits because of its log-in: for its turn, or for the answer to a failed one. */
        loggingIn,
        /** The client is reading the answer. */
        sending,
        /** The server has the request and is making the answer. */
        answering,
        /** The server has shut the connection down; it is about to be closed. */
        leaving,
    };
    static constexpr std::size_t states = 6;

    struct Connection {
        int socket;
        /** The client's address, for people. */
        std::string address;
        std::string network;
        /** Whether there was no room for the connection, so that it only gets an answer that says so. */
        bool surplus = false;
        /** Whether a request on this connection was answered. */
        std::atomic<bool> served = false;
        State state = State::idle;
        /** The connection's place in the list of its state. */
        std::list<Connection>::iterator self{};
    };

    /** How many connections are in each state, and how many were refused since the start. */
    struct Counts {
        std::array<std::size_t, states> of{};
        std::size_t refused = 0;
    };

    Connections(const Limits& limits, EventLog& events) : _limits(limits), _events(events) {}

    /**
     * Adds a connection. @param socket must stay open until `closed`.
     * @return null if there is not even room to answer the client that the server is busy.
     */
    Connection* opened(int socket, const std::string& address, const std::string& network);
    void closed(Connection& connection);

    /** Changes the connection's state. @return false if the connection was shut down, which is final. */
    bool enter(Connection& connection, State state);

    /** Shuts down the connections whose clients do not wait for an answer. */
    void endIdle();
    void endAll();
    /** Waits until no client waits for an answer. @return false if the time was over before. */
    bool waitForAnswers(std::chrono::milliseconds time);

    Counts counts();

private:
    using List = std::list<Connection>;

    List& listOf(State state) { return _lists[static_cast<std::size_t>(state)]; }
    void move(Connection& connection, State state);
    void end(Connection& connection);
    void endList(State state);
    /**
     * Shuts down a connection that waits for its client. @param network the connection's network; empty for any
     * network.
     */
    bool makeRoom(const std::string& network);
    const std::string& largestNetwork() const;
    /** Logs the line at most once a minute, since very many clients may cause it. */
    void reportCrowd(const std::string& line);

    const Limits _limits;
    EventLog& _events;
    std::mutex _mutex;
    std::condition_variable _changed;
    /** One list for each state, in the order in which the connections entered the state. */
    std::array<List, states> _lists;
    /* The numbers of connections without those that are leaving. */
    unsigned int _count = 0;
    std::map<std::string, unsigned int> _countOfNetwork;
    std::map<std::string, unsigned int> _leavingOfNetwork;
    std::size_t _refused = 0;
    Clock::time_point _lastCrowdReport{};
};

} // namespace ObjectManager::Server

#endif

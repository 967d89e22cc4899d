/** The clients' connections: how many there may be, and how long each may keep the server waiting. */
#ifndef SERVER_CONNECTIONS_H
#define SERVER_CONNECTIONS_H

#include "server/Settings.h"

#include <array>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <list>
#include <map>
#include <mutex>
#include <string>

namespace ObjectManager::Server {

/** Takes one line for the person who runs the server. Called by several threads at once; must not throw. */
using Log = std::function<void(const std::string& line)>;

/**
 * All open connections. Where there are too many, the one that has been idle for longest is closed for a new one; where
 * none is idle, the new one is told so by whoever serves it. Used by several threads at once.
 */
class Connections {
public:
    using Clock = std::chrono::steady_clock;

    enum class State {
        /** No request has begun. */
        idle,
        /** A request has begun and is not yet here. */
        receiving,
        /** The server has the request, and the answer is not sent. */
        answering,
        /** Shut down by the server, and about to be closed. */
        leaving,
    };

    struct Connection {
        int socket;
        /** The client's, for people. */
        std::string address;
        /** There was no room for it. */
        bool surplus = false;
        /** The first line of a request has come. */
        bool asked = false;
        State state = State::idle;
        Clock::time_point since;
        /** Where it is in the list of its state. */
        std::list<Connection>::iterator self;
    };

    /** @param encrypted whether nothing but TLS can be written to the connections. */
    Connections(const Limits& limits, bool encrypted, Log log);

    /** @param socket stays open until `closed`. */
    Connection& opened(int socket, const std::string& address);
    void closed(Connection& connection);

    /** Unless it was shut down, which cannot be undone. @return the state before. */
    State enter(Connection& connection, State state);
    /** @return false where it already was. */
    bool shutDown(Connection& connection);

    /**
     * Shuts down the connections whose time is over: those that were idle for too long, and those whose request should
     * be here by now.
     */
    void endOverdue();

    /** Waits until no connection is being answered. @return false where the time was over before. */
    bool waitForAnswers(std::chrono::milliseconds time);

private:
    using List = std::list<Connection>;

    List& listOf(State state) { return _lists[static_cast<std::size_t>(state)]; }
    void move(Connection& connection, State state);
    void end(Connection& connection);
    /** Of an address; of any where it is empty. @return false where none is. */
    bool endOldestIdle(const std::string& address);
    /** Says it at most once a minute, since it is said of clients who may be many. */
    void reportCrowd(const std::string& line);

    const Limits _limits;
    const bool _encrypted;
    const Log _log;
    std::mutex _mutex;
    std::condition_variable _changed;
    /** One for each state, in the order in which the connections entered it. */
    std::array<List, 4> _lists;
    /* Without those that leave. */
    unsigned int _count = 0;
    std::map<std::string, unsigned int> _countOfAddress;
    Clock::time_point _lastCrowdReport;
};

} // namespace ObjectManager::Server

#endif

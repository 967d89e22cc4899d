/** Shares a scarce resource fairly between networks. */
#ifndef SERVER_TURNS_H
#define SERVER_TURNS_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <list>
#include <map>
#include <mutex>
#include <string>

namespace ObjectManager::Server {

/**
 * A number of places, for which the clients' networks take turns. However many connections one network has, another
 * network that wants a place waits for the end of one turn at most, and no network holds all places. Known clients come
 * before strangers, who never get the last place if there are several.
 *
 * Used by several threads at once.
 */
class Turns {
public:
    using Clock = std::chrono::steady_clock;

    /** Holds a place until it is destroyed. It converts to false if it holds none. */
    class Turn {
    public:
        Turn() = default;
        Turn(Turn&& other) noexcept : _turns(other._turns), _network(std::move(other._network)), _known(other._known) {
            other._turns = nullptr;
        }
        Turn& operator=(Turn&&) = delete;
        ~Turn() {
            if (_turns != nullptr) {
                _turns->end(*this);
            }
        }

        explicit operator bool() const { return _turns != nullptr; }

    private:
        friend class Turns;
        Turn(Turns& turns, std::string network, bool known)
            : _turns(&turns), _network(std::move(network)), _known(known) {}

        Turns* _turns = nullptr;
        std::string _network;
        bool _known = false;
    };

    /**
     * @param placesOfNetwork how many places one network may hold.
     * @param waiting how many turns one network may wait for.
     */
    Turns(unsigned int places, unsigned int placesOfNetwork, unsigned int waiting);

    /**
     * Waits for a turn.
     * @param until when waiting ends without a turn.
     * @param isGone is called now and then; returns true if the client has closed the connection, so that it needs no
     * turn.
     * @return no turn if none came in time, if the network waits for too many turns already, or after `close`.
     */
    Turn take(const std::string& network, bool known, Clock::time_point until, const std::function<bool()>& isGone);

    /** The number of clients that wait for a turn. */
    std::size_t waiting();

    /** Ends all waiting: from now on, nobody gets a turn. */
    void close();

private:
    struct Network {
        unsigned int running = 0;
        unsigned int waiting = 0;
        std::uint64_t lastTurn = 0;
    };

    struct Waiter {
        const std::string& network;
        bool known;
        bool hasTurn = false;
        std::condition_variable changed;
    };

    bool mayRun(const Waiter& waiter) const;
    void start(Waiter& waiter);
    /** Gives free places to waiting clients. */
    void grant();
    void end(const Turn& turn);
    void forget(const std::string& network);

    const unsigned int _places;
    const unsigned int _placesOfStrangers;
    const unsigned int _placesOfNetwork;
    const unsigned int _mostWaiting;
    std::mutex _mutex;
    std::map<std::string, Network> _networks;
    std::list<Waiter*> _waiters;
    unsigned int _running = 0;
    unsigned int _strangers = 0;
    std::uint64_t _turns = 0;
    bool _closed = false;
};

} // namespace ObjectManager::Server

#endif

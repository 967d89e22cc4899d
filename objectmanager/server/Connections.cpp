#include "server/Connections.h"

#include <fmt/format.h>

#include <sys/socket.h>

#include <algorithm>

namespace ObjectManager::Server {

namespace {

/** How many connections beyond the limit are accepted, to answer that the server is busy. */
constexpr std::size_t surplusConnections = 64;
/** How many connections may be shut down and not yet closed: of all networks, and of one network. */
constexpr std::size_t leavingConnections = 500;
constexpr std::size_t leavingConnectionsOfNetwork = 100;

} // namespace

Connections::Connection* Connections::opened(int socket, const std::string& address, const std::string& network) {
    const std::lock_guard lock(_mutex);
    const auto known = _countOfNetwork.find(network);
    bool room = true;
    if (known != _countOfNetwork.end() && known->second >= _limits.connectionsPerAddress) {
        reportCrowd(fmt::format("{}: more than {} connections: idle ones are closed, others are refused", network,
                                _limits.connectionsPerAddress));
        room = makeRoom(network);
    } else if (_count >= _limits.connections) {
        reportCrowd(
            fmt::format("more than {} connections: idle ones are closed, others are refused", _limits.connections));
        room = makeRoom(largestNetwork()) || makeRoom("");
    }
    _refused += room ? 0 : 1;
    const auto leaving = _leavingOfNetwork.find(network);
    if (_count >= _limits.connections + surplusConnections || listOf(State::leaving).size() >= leavingConnections ||
        (leaving != _leavingOfNetwork.end() && leaving->second >= leavingConnectionsOfNetwork)) {
        return nullptr;
    }
    List& idle = listOf(State::idle);
    Connection& connection = idle.emplace_back();
    connection.self = std::prev(idle.end());
    connection.socket = socket;
    connection.address = address;
    connection.network = network;
    connection.surplus = !room;
    ++_count;
    ++_countOfNetwork[network];
    return &connection;
}

void Connections::closed(Connection& connection) {
    const std::lock_guard lock(_mutex);
    move(connection, State::leaving);
    if (const auto leaving = _leavingOfNetwork.find(connection.network); --leaving->second == 0) {
        _leavingOfNetwork.erase(leaving);
    }
    listOf(State::leaving).erase(connection.self);
}

bool Connections::enter(Connection& connection, State state) {
    const std::lock_guard lock(_mutex);
    move(connection, state);
    return connection.state == state;
}

void Connections::endIdle() {
    const std::lock_guard lock(_mutex);
    endList(State::idle);
}

void Connections::endAll() {
    const std::lock_guard lock(_mutex);
    for (const State state : {State::idle, State::receiving, State::loggingIn, State::sending, State::answering}) {
        endList(state);
    }
}

bool Connections::waitForAnswers(std::chrono::milliseconds time) {
    std::unique_lock lock(_mutex);
    return _changed.wait_for(lock, time, [this] {
        return listOf(State::loggingIn).empty() && listOf(State::sending).empty() && listOf(State::answering).empty();
    });
}

Connections::Counts Connections::counts() {
    const std::lock_guard lock(_mutex);
    Counts counts;
    std::transform(_lists.begin(), _lists.end(), counts.of.begin(), [](const List& list) { return list.size(); });
    counts.refused = _refused;
    return counts;
}

void Connections::move(Connection& connection, State state) {
    // A connection that enters its own state again keeps its place: of two new connections, the one accepted first is
    // the older one, whichever thread runs first.
    if (connection.state == State::leaving || connection.state == state) {
        return;
    }
    List& target = listOf(state);
    target.splice(target.end(), listOf(connection.state), connection.self);
    connection.state = state;
    if (state == State::leaving) {
        --_count;
        ++_leavingOfNetwork[connection.network];
        const auto ofNetwork = _countOfNetwork.find(connection.network);
        if (--ofNetwork->second == 0) {
            _countOfNetwork.erase(ofNetwork);
        }
    }
    _changed.notify_all();
}

void Connections::end(Connection& connection) {
    // The connection's thread finds the end of the stream, and closes the connection.
    shutdown(connection.socket, SHUT_RDWR);
    move(connection, State::leaving);
}

void Connections::endList(State state) {
    List& list = listOf(state);
    while (!list.empty()) {
        end(list.front());
    }
}

bool Connections::makeRoom(const std::string& network) {
    for (const bool served : {false, true}) {
        for (const State state : {State::idle, State::receiving, State::loggingIn, State::sending}) {
            List& list = listOf(state);
            const auto oldest = std::find_if(list.begin(), list.end(), [&](const Connection& connection) {
                return connection.served == served && (network.empty() || connection.network == network);
            });
            if (oldest != list.end()) {
                end(*oldest);
                return true;
            }
        }
    }
    return false;
}

const std::string& Connections::largestNetwork() const {
    return std::max_element(_countOfNetwork.begin(), _countOfNetwork.end(),
                            [](const auto& left, const auto& right) { return left.second < right.second; })
        ->first;
}

void Connections::reportCrowd(const std::string& line) {
    if (const auto now = Clock::now();
        _lastCrowdReport == Clock::time_point{} || now - _lastCrowdReport >= std::chrono::minutes{1}) {
        _lastCrowdReport = now;
        _events.report(line);
    }
}

} // namespace ObjectManager::Server

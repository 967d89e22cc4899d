#include "server/Connections.h"

#include <fmt/format.h>

#include <sys/socket.h>

#include <algorithm>
#include <string_view>

namespace ObjectManager::Server {

namespace {

constexpr std::string_view requestTimeout =
    "HTTP/1.1 408 Request Timeout\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";

double seconds(std::chrono::milliseconds time) {
    return std::chrono::duration<double>(time).count();
}

} // namespace

Connections::Connections(const Limits& limits, bool encrypted, Log log)
    : _limits(limits), _encrypted(encrypted), _log(std::move(log)),
      _lastCrowdReport(Clock::now() - std::chrono::hours{1}) {}

Connections::Connection& Connections::opened(int socket, const std::string& address) {
    const std::lock_guard lock(_mutex);
    bool room = true;
    if (_countOfAddress[address] >= _limits.connectionsPerAddress) {
        reportCrowd(fmt::format("{}: more than {} connections: idle ones are closed, others are refused", address,
                                _limits.connectionsPerAddress));
        room = endOldestIdle(address);
    } else if (_count >= _limits.connections) {
        reportCrowd(
            fmt::format("more than {} connections: idle ones are closed, others are refused", _limits.connections));
        room = endOldestIdle("");
    }
    List& idle = listOf(State::idle);
    Connection& connection = idle.emplace_back();
    connection.self = std::prev(idle.end());
    connection.socket = socket;
    connection.address = address;
    connection.surplus = !room;
    connection.since = Clock::now();
    ++_count;
    ++_countOfAddress[address];
    return connection;
}

void Connections::closed(Connection& connection) {
    const std::lock_guard lock(_mutex);
    move(connection, State::leaving);
    listOf(State::leaving).erase(connection.self);
}

Connections::State Connections::enter(Connection& connection, State state) {
    const std::lock_guard lock(_mutex);
    const State before = connection.state;
    move(connection, state);
    return before;
}

bool Connections::shutDown(Connection& connection) {
    const std::lock_guard lock(_mutex);
    const bool open = connection.state != State::leaving;
    end(connection);
    return open;
}

void Connections::endOverdue() {
    const std::lock_guard lock(_mutex);
    const auto now = Clock::now();
    List& idle = listOf(State::idle);
    while (!idle.empty() && idle.front().since + _limits.idleTime <= now) {
        end(idle.front());
    }
    List& receiving = listOf(State::receiving);
    while (!receiving.empty() && receiving.front().since + _limits.requestTime <= now) {
        Connection& connection = receiving.front();
        _log(fmt::format("{}: {}: the request did not arrive within {} s", connection.address,
                         _encrypted ? "closed" : "answered 408", seconds(_limits.requestTime)));
        // Nothing of an answer has been written, and the library would close the connection without any.
        if (!_encrypted) {
            send(connection.socket, requestTimeout.data(), requestTimeout.size(), MSG_DONTWAIT | MSG_NOSIGNAL);
        }
        end(connection);
    }
}

bool Connections::waitForAnswers(std::chrono::milliseconds time) {
    std::unique_lock lock(_mutex);
    return _changed.wait_for(lock, time, [this] { return listOf(State::answering).empty(); });
}

void Connections::move(Connection& connection, State state) {
    if (connection.state == State::leaving) {
        return;
    }
    List& target = listOf(state);
    target.splice(target.end(), listOf(connection.state), connection.self);
    connection.state = state;
    connection.since = Clock::now();
    if (state == State::leaving) {
        --_count;
        const auto ofAddress = _countOfAddress.find(connection.address);
        if (--ofAddress->second == 0) {
            _countOfAddress.erase(ofAddress);
        }
    }
    if (listOf(State::answering).empty()) {
        _changed.notify_all();
    }
}

void Connections::end(Connection& connection) {
    // Whoever reads it finds its end, and closes it.
    shutdown(connection.socket, SHUT_RDWR);
    move(connection, State::leaving);
}

bool Connections::endOldestIdle(const std::string& address) {
    List& idle = listOf(State::idle);
    const auto oldest = std::find_if(idle.begin(), idle.end(), [&](const Connection& connection) {
        return address.empty() || connection.address == address;
    });
    if (oldest == idle.end()) {
        return false;
    }
    end(*oldest);
    return true;
}

void Connections::reportCrowd(const std::string& line) {
    if (const auto now = Clock::now(); now - _lastCrowdReport >= std::chrono::minutes{1}) {
        _lastCrowdReport = now;
        _log(line);
    }
}

} // namespace ObjectManager::Server

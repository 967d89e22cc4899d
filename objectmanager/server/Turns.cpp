#include "server/Turns.h"

#include <algorithm>
#include <tuple>
#include <utility>

namespace ObjectManager::Server {

namespace {

/** How often a waiting request checks whether its client has gone. */
constexpr std::chrono::milliseconds lookInterval{250};

} // namespace

Turns::Turns(unsigned int places, unsigned int placesOfNetwork, unsigned int waiting)
    : _places(places), _placesOfStrangers(std::max(1U, places - 1)), _placesOfNetwork(placesOfNetwork),
      _mostWaiting(waiting) {}

Turns::Turn Turns::take(const std::string& network, bool known, Clock::time_point until,
                        const std::function<bool()>& isGone) {
    std::unique_lock lock(_mutex);
    Waiter waiter{network, known, false, {}};
    Network& own = _networks[network];
    if (_closed || own.waiting >= _mostWaiting) {
        forget(network);
        return {};
    }
    const auto place = _waiters.insert(_waiters.end(), &waiter);
    ++own.waiting;
    grant();
    bool wanted = true;
    while (!waiter.hasTurn && !_closed && wanted) {
        const auto now = Clock::now();
        waiter.changed.wait_until(lock, std::min(until, now + lookInterval));
        wanted = waiter.hasTurn || (Clock::now() < until && !isGone());
    }
    if (waiter.hasTurn) {
        return {*this, network, known};
    }
    _waiters.erase(place);
    --own.waiting;
    forget(network);
    return {};
}

std::size_t Turns::waiting() {
    const std::lock_guard lock(_mutex);
    return _waiters.size();
}

void Turns::close() {
    const std::lock_guard lock(_mutex);
    _closed = true;
    for (Waiter* const waiter : _waiters) {
        waiter->changed.notify_one();
    }
}

bool Turns::mayRun(const Waiter& waiter) const {
    return _running < _places && _networks.at(waiter.network).running < _placesOfNetwork &&
           (waiter.known || _strangers < _placesOfStrangers);
}

void Turns::start(Waiter& waiter) {
    Network& network = _networks.at(waiter.network);
    --network.waiting;
    ++network.running;
    network.lastTurn = ++_turns;
    ++_running;
    _strangers += waiter.known ? 0 : 1;
    waiter.hasTurn = true;
    waiter.changed.notify_one();
}

void Turns::grant() {
    const auto rank = [this](const Waiter& waiter) {
        const Network& network = _networks.at(waiter.network);
        return std::tuple(!waiter.known, network.running, network.lastTurn);
    };
    while (!_closed && _running < _places) {
        auto next = _waiters.end();
        for (auto each = _waiters.begin(); each != _waiters.end(); ++each) {
            if (mayRun(**each) && (next == _waiters.end() || rank(**each) < rank(**next))) {
                next = each;
            }
        }
        if (next == _waiters.end()) {
            return;
        }
        Waiter& waiter = **next;
        _waiters.erase(next);
        start(waiter);
    }
}

void Turns::end(const Turn& turn) {
    const std::lock_guard lock(_mutex);
    --_networks.at(turn._network).running;
    --_running;
    _strangers -= turn._known ? 0 : 1;
    grant();
    forget(turn._network);
}

void Turns::forget(const std::string& network) {
    const auto found = _networks.find(network);
    if (found != _networks.end() && found->second.running == 0 && found->second.waiting == 0) {
        _networks.erase(found);
    }
}

} // namespace ObjectManager::Server

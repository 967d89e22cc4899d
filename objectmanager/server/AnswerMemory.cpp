#include "server/AnswerMemory.h"

namespace ObjectManager::Server {

void AnswerMemory::Share::grow(std::size_t size) {
    std::unique_lock lock(_memory._mutex);
    if (size <= _size) {
        return;
    }
    if (_network == nullptr) {
        _network = &_memory._networks[_name];
        ++_network->shares;
    }
    _memory._waiting.push_back(this);
    _wanted = size;
    _memory.grant();
    _granted.wait(lock, [this] { return _size == _wanted; });
}

bool AnswerMemory::isAwaited() {
    const std::lock_guard lock(_mutex);
    return !_waiting.empty();
}

void AnswerMemory::close() {
    const std::lock_guard lock(_mutex);
    _closed = true;
    grant();
}

bool AnswerMemory::fits(const Share& share) const {
    const std::size_t more = share._wanted - share._size;
    return _taken + more <= _bytes && share._network->bytes + more <= _bytes / 2;
}

void AnswerMemory::grant() {
    for (auto each = _waiting.begin(); each != _waiting.end();) {
        Share& share = **each;
        const bool isFree = _closed || _beyond == &share || fits(share);
        if (!isFree && (_beyond != nullptr || each != _waiting.begin())) {
            ++each;
            continue;
        }
        if (!isFree) {
            _beyond = &share;
        }
        _taken += share._wanted - share._size;
        share._network->bytes += share._wanted - share._size;
        share._size = share._wanted;
        share._granted.notify_one();
        each = _waiting.erase(each);
    }
}

void AnswerMemory::giveBack(const Share& share) noexcept {
    const std::lock_guard lock(_mutex);
    if (share._network == nullptr) {
        return;
    }
    _taken -= share._size;
    share._network->bytes -= share._size;
    if (--share._network->shares == 0) {
        _networks.erase(share._name);
    }
    _beyond = _beyond == &share ? nullptr : _beyond;
    grant();
}

} // namespace ObjectManager::Server

#include "server/Workers.h"

#include <utility>

namespace ObjectManager::Server {

Workers::Workers(std::size_t waiting) : _waiting(waiting) {}

Workers::Workers(unsigned int threads, std::size_t waiting) : Workers(waiting) {
    _threads.reserve(threads);
    for (unsigned int i = 0; i < threads; ++i) {
        _threads.emplace_back([this] { work(); });
    }
}

void Workers::finish() {
    {
        const std::lock_guard lock(_mutex);
        _ending = true;
    }
    _changed.notify_all();
    for (std::thread& thread : _threads) {
        thread.join();
    }
    _threads.clear();
}

bool Workers::add(Task task) {
    {
        const std::lock_guard lock(_mutex);
        if (_ending || _tasks.size() >= _waiting) {
            return false;
        }
        _tasks.push_back(std::move(task));
    }
    _changed.notify_one();
    return true;
}

void Workers::work() {
    std::unique_lock lock(_mutex);
    while (true) {
        _changed.wait(lock, [this] { return _ending || !_tasks.empty(); });
        if (_tasks.empty()) {
            return;
        }
        const Task task = std::move(_tasks.front());
        _tasks.pop_front();
        lock.unlock();
        task();
        lock.lock();
    }
}

} // namespace ObjectManager::Server

/** Threads that do what others cannot wait for. */
#ifndef SERVER_WORKERS_H
#define SERVER_WORKERS_H

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

namespace ObjectManager::Server {

/** A fixed number of threads that run tasks, begun in the order in which they came. Used by several threads at once. */
class Workers {
public:
    /** Must not throw. */
    using Task = std::function<void()>;

    /**
     * @param waiting how many tasks may wait for a thread.
     * @throws std::system_error where the system gives no more threads; those that it gave have ended then.
     */
    Workers(unsigned int threads, std::size_t waiting);
    Workers(const Workers&) = delete;
    Workers& operator=(const Workers&) = delete;
    ~Workers() { finish(); }

    /** @return false where too many tasks wait or the threads have ended: this one will not be run. */
    [[nodiscard]] bool add(Task task);

    /** Takes no more tasks, and returns when those that it took are done. */
    void finish();

private:
    explicit Workers(std::size_t waiting);
    void work();

    const std::size_t _waiting;
    std::mutex _mutex;
    std::condition_variable _changed;
    std::deque<Task> _tasks;
    bool _ending = false;
    std::vector<std::thread> _threads;
};

} // namespace ObjectManager::Server

#endif

/** The limit for the memory of large answers. */
#ifndef SERVER_ANSWERMEMORY_H
#define SERVER_ANSWERMEMORY_H

#include <condition_variable>
#include <cstddef>
#include <list>
#include <map>
#include <mutex>
#include <string>
#include <utility>

namespace ObjectManager::Server {

/**
 * A limit in bytes for the memory of all answers together; the answers of one network may have half of it. Nobody knows
 * beforehand how much memory an answer needs, so an answer asks for more while it grows. If too little is left, it
 * waits in a queue. Answers that already have memory could all wait for each other; therefore the answer that has
 * waited longest gets what it wants even beyond the limit. It is the only one to do so until it gives its memory back.
 *
 * Used by several threads at once.
 */
class AnswerMemory {
    struct Network {
        std::size_t bytes = 0;
        /** How many answers of the network have memory, or want some. */
        unsigned int shares = 0;
    };

public:
    explicit AnswerMemory(std::size_t bytes) : _bytes(bytes) {}

    /** The memory of one answer. It is given back when the object is destroyed. */
    class Share {
    public:
        Share(AnswerMemory& memory, std::string network) : _memory(memory), _name(std::move(network)) {}
        Share(const Share&) = delete;
        Share& operator=(const Share&) = delete;
        ~Share() { _memory.giveBack(*this); }

        /** Waits until the answer has `size` bytes; returns at once if it already has them. @throws std::bad_alloc
         */
        void grow(std::size_t size);

    private:
        friend class AnswerMemory;

        AnswerMemory& _memory;
        const std::string _name;
        /** Null until the answer asks for memory. */
        Network* _network = nullptr;
        std::size_t _size = 0;
        std::size_t _wanted = 0;
        std::condition_variable _granted;
    };

    /** Whether an answer waits for others to give memory back. */
    bool isAwaited();

    /** Ends all waiting: from here on, every answer gets what it asks for. */
    void close();

private:
    bool fits(const Share& share) const;
    /** Gives memory to the answers that wait, in their order. */
    void grant();
    void giveBack(const Share& share) noexcept;

    const std::size_t _bytes;
    std::mutex _mutex;
    std::size_t _taken = 0;
    std::map<std::string, Network> _networks;
    std::list<Share*> _waiting;
    /** The answer that may go beyond the limit; null if none does. */
    const Share* _beyond = nullptr;
    bool _closed = false;
};

} // namespace ObjectManager::Server

#endif

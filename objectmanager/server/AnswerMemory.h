/** Memory of what large answers are made of. */
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
 * A number of bytes, of which one network may have half. Nobody knows beforehand how much an answer needs, so whoever
 * makes one asks for more as it grows, and waits, in order, where there is no more. So that those who have some and
 * want more do not all wait for each other, the one that has waited longest gets whatever it wants, beyond the number
 * if need be; it is the only one until it has given everything back.
 *
 * Used by several threads at once.
 */
class AnswerMemory {
    struct Network {
        std::size_t bytes = 0;
        /** How many have some of it, or want some. */
        unsigned int shares = 0;
    };

public:
    explicit AnswerMemory(std::size_t bytes) : _bytes(bytes) {}

    /** What one answer has of it, given back with its end. */
    class Share {
    public:
        Share(AnswerMemory& memory, std::string network) : _memory(memory), _name(std::move(network)) {}
        Share(const Share&) = delete;
        Share& operator=(const Share&) = delete;
        ~Share() { _memory.giveBack(*this); }

        /** Waits until it has so many bytes. Has them at once where it had as many before. @throws std::bad_alloc */
        void grow(std::size_t size);

    private:
        friend class AnswerMemory;

        AnswerMemory& _memory;
        const std::string _name;
        /** Null as long as it has nothing and wants nothing. */
        Network* _network = nullptr;
        std::size_t _size = 0;
        std::size_t _wanted = 0;
        std::condition_variable _granted;
    };

    /** Whether anybody waits for others to give back what they have. */
    bool isAwaited();

    /** Nobody waits any more: everybody gets what he wants. */
    void close();

private:
    bool fits(const Share& share) const;
    /** Gives what there is to those who wait. */
    void grant();
    void giveBack(const Share& share) noexcept;

    const std::size_t _bytes;
    std::mutex _mutex;
    std::size_t _taken = 0;
    std::map<std::string, Network> _networks;
    std::list<Share*> _waiting;
    /** Who may go beyond the number; null where nobody needs to. */
    const Share* _beyond = nullptr;
    bool _closed = false;
};

} // namespace ObjectManager::Server

#endif

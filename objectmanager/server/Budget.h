/** A limit for memory that all requests share. */
#ifndef SERVER_BUDGET_H
#define SERVER_BUDGET_H

#include <cstddef>
#include <map>
#include <mutex>
#include <string>
#include <utility>

namespace ObjectManager::Server {

/**
 * A limit in bytes for all requests together; the requests of one network may have half of it. Used by several threads
 * at once.
 */
class Budget {
public:
    explicit Budget(std::size_t bytes) : _bytes(bytes) {}

    std::size_t bytes() const { return _bytes; }

    /** The bytes that one request has taken. They are given back when the object is destroyed. */
    class Share {
    public:
        Share(Budget& budget, std::string network) : _budget(budget), _network(std::move(network)) {}
        Share(const Share&) = delete;
        Share& operator=(const Share&) = delete;
        ~Share() { _budget.giveBack(_network, _size); }

        /**
         * Takes bytes until the request has `size`. @return false if the budget has too few bytes left: then nothing
         * changes.
         */
        bool grow(std::size_t size) {
            if (size > _size && !_budget.take(_network, size - _size)) {
                return false;
            }
            _size = std::max(_size, size);
            return true;
        }

    private:
        Budget& _budget;
        const std::string _network;
        std::size_t _size = 0;
    };

private:
    bool take(const std::string& network, std::size_t size) {
        const std::lock_guard lock(_mutex);
        const auto found = _networks.find(network);
        const std::size_t ofNetwork = found == _networks.end() ? 0 : found->second;
        if (size > _bytes - _taken || ofNetwork + size > _bytes / 2) {
            return false;
        }
        _taken += size;
        _networks[network] += size;
        return true;
    }

    void giveBack(const std::string& network, std::size_t size) {
        if (size == 0) {
            return;
        }
        const std::lock_guard lock(_mutex);
        _taken -= size;
        if (const auto found = _networks.find(network); (found->second -= size) == 0) {
            _networks.erase(found);
        }
    }

    const std::size_t _bytes;
    std::mutex _mutex;
    std::size_t _taken = 0;
    std::map<std::string, std::size_t> _networks;
};

} // namespace ObjectManager::Server

#endif

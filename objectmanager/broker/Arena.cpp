#include "broker/Arena.h"

#include <sanitizer/asan_interface.h>

#include <atomic>
#include <cstdint>
#include <mutex>
#include <new>

/*
 * If AddressSanitizer is on, every byte that belongs to no allocated block is poisoned. AddressSanitizer then finds
 * uses of deallocated memory, although the arena still has this memory. Without AddressSanitizer, its macros do
 * nothing.
 */

namespace ObjectManager {

struct Arena::Chunk {
    Chunk* next;
};

struct Arena::FreeBlock {
    FreeBlock* next;
};

/** The head of a large block. The allocated memory lies behind it. */
struct Arena::LargeBlock {
    LargeBlock* next;
    LargeBlock* previous;
};

namespace {

/** The size, rounded up to whole granules; at least one granule. */
constexpr std::size_t roundUp(std::size_t bytes, std::size_t granule) {
    return bytes == 0 ? granule : (bytes + granule - 1) / granule * granule;
}

std::atomic<std::size_t> largeBlocks{0};

} // namespace

/** The chunks that no arena uses. */
class Arena::Pool {
public:
    static Pool& instance() {
        static Pool pool;
        return pool;
    }

    Pool() = default;
    Pool(const Pool&) = delete;
    Pool& operator=(const Pool&) = delete;
    ~Pool() {
        while (_chunks != nullptr) {
            Chunk* chunk = _chunks;
            _chunks = chunk->next;
            ::operator delete(chunk);
        }
    }

    Chunk* acquire() {
        {
            const std::lock_guard lock(_mutex);
            ++_inUse;
            if (_chunks != nullptr) {
                Chunk* chunk = _chunks;
                _chunks = chunk->next;
                --_retained;
                return chunk;
            }
        }
        return new (::operator new(chunkBytes)) Chunk{};
    }

    void release(Chunk* chunks) {
        const std::lock_guard lock(_mutex);
        while (chunks != nullptr) {
            Chunk* chunk = chunks;
            chunks = chunk->next;
            --_inUse;
            if (_retained < retainedBytes / chunkBytes) {
                chunk->next = _chunks;
                _chunks = chunk;
                ++_retained;
                ASAN_POISON_MEMORY_REGION(chunk + 1, chunkBytes - sizeof(Chunk));
            } else {
                ::operator delete(chunk);
            }
        }
    }

    Usage usage() {
        const std::lock_guard lock(_mutex);
        return {_inUse, _retained, largeBlocks.load(std::memory_order_relaxed)};
    }

private:
    std::mutex _mutex;
    Chunk* _chunks = nullptr;
    std::size_t _inUse = 0;
    std::size_t _retained = 0;
};

Arena::~Arena() {
    give(_held);
    if (_chunks != nullptr) {
        Pool::instance().release(_chunks);
    }
    while (_large != nullptr) {
        LargeBlock* block = _large;
        _large = block->next;
        ::operator delete(block);
        largeBlocks.fetch_sub(1, std::memory_order_relaxed);
    }
}

Arena::Usage Arena::usage() {
    return Pool::instance().usage();
}

void* Arena::do_allocate(std::size_t bytes, std::size_t alignment) {
    if (alignment > granule) {
        throw std::bad_alloc();
    }
    if (bytes > smallBytes) {
        return allocateLarge(bytes);
    }
    const std::size_t size = roundUp(bytes, granule);
    if (FreeBlock*& first = _free[size / granule]; first != nullptr) {
        FreeBlock* block = first;
        ASAN_UNPOISON_MEMORY_REGION(block, size);
        first = block->next;
        return block;
    }
    if (static_cast<std::size_t>(_end - _next) < size) {
        take(chunkBytes);
        Chunk* chunk = Pool::instance().acquire();
        chunk->next = _chunks;
        _chunks = chunk;
        auto* begin = reinterpret_cast<std::byte*>(chunk);
        ASAN_POISON_MEMORY_REGION(chunk + 1, chunkBytes - sizeof(Chunk));
        _next = begin + roundUp(sizeof(Chunk), granule);
        _end = begin + chunkBytes;
    }
    void* block = _next;
    _next += size;
    ASAN_UNPOISON_MEMORY_REGION(block, size);
    return block;
}

void Arena::do_deallocate(void* block, std::size_t bytes, std::size_t /*alignment*/) {
    if (bytes > smallBytes) {
        auto* large =
            reinterpret_cast<LargeBlock*>(static_cast<std::byte*>(block) - roundUp(sizeof(LargeBlock), granule));
        (large->previous != nullptr ? large->previous->next : _large) = large->next;
        if (large->next != nullptr) {
            large->next->previous = large->previous;
        }
        ::operator delete(large);
        give(roundUp(sizeof(LargeBlock), granule) + bytes);
        largeBlocks.fetch_sub(1, std::memory_order_relaxed);
        return;
    }
    const std::size_t size = roundUp(bytes, granule);
    FreeBlock*& first = _free[size / granule];
    first = new (block) FreeBlock{first};
    ASAN_POISON_MEMORY_REGION(block, size);
}

void Arena::take(std::size_t bytes) {
    if (bytes > _limit - _held) {
        _exhausted = true;
        throw std::bad_alloc();
    }
    if (_meter != nullptr) {
        _meter->take(bytes);
    }
    _held += bytes;
}

void Arena::give(std::size_t bytes) {
    _held -= bytes;
    if (_meter != nullptr) {
        _meter->give(bytes);
    }
}

void* Arena::allocateLarge(std::size_t bytes) {
    constexpr std::size_t head = roundUp(sizeof(LargeBlock), granule);
    // No object can be larger than PTRDIFF_MAX, and the sums of sizes below do not overflow.
    if (bytes > PTRDIFF_MAX - head) {
        throw std::bad_alloc();
    }
    take(head + bytes);
    auto* block = new (::operator new(head + bytes)) LargeBlock{_large, nullptr};
    if (_large != nullptr) {
        _large->previous = block;
    }
    _large = block;
    largeBlocks.fetch_add(1, std::memory_order_relaxed);
    return reinterpret_cast<std::byte*>(block) + head;
}

} // namespace ObjectManager

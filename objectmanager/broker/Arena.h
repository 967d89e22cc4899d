/** The memory of a request. */
#ifndef BROKER_ARENA_H
#define BROKER_ARENA_H

#include "model/Operations.h"

#include <array>
#include <cstddef>
#include <limits>
#include <memory_resource>

namespace ObjectManager {

/**
 * Memory that is given back as a whole, and cheaply, when the arena ends. What is deallocated before is used again by
 * the same arena. Destructors of what lies in an arena need not run.
 *
 * Small blocks are cut from chunks, which ended arenas leave to later ones (up to `retainedBytes`); large ones come
 * from the heap. An arena is used by one thread at a time.
 */
class Arena final : public std::pmr::memory_resource {
public:
    static constexpr std::size_t chunkBytes = std::size_t{64} * 1024;
    static constexpr std::size_t retainedBytes = std::size_t{128} * 1024 * 1024;

    /**
     * @param limit how many bytes the arena holds at most; an allocation that needs more fails with std::bad_alloc.
     * @param meter is told what the arena holds; may be null, outlives the arena.
     */
    explicit Arena(std::size_t limit = std::numeric_limits<std::size_t>::max(), MemoryMeter* meter = nullptr)
        : _limit(limit), _meter(meter) {}
    Arena(const Arena&) = delete;
    Arena& operator=(const Arena&) = delete;
    ~Arena() override;

    /** Whether an allocation has failed because of the limit. */
    bool isExhausted() const { return _exhausted; }

    /** What all arenas of the process hold now. */
    struct Usage {
        std::size_t chunksInUse = 0;
        std::size_t chunksRetained = 0;
        std::size_t largeBlocks = 0;
    };
    static Usage usage();

private:
    struct Chunk;
    struct FreeBlock;
    struct LargeBlock;
    class Pool;

    static constexpr std::size_t granule = alignof(std::max_align_t);
    static constexpr std::size_t smallBytes = 512;

    void* do_allocate(std::size_t bytes, std::size_t alignment) override;
    void do_deallocate(void* block, std::size_t bytes, std::size_t alignment) override;
    bool do_is_equal(const std::pmr::memory_resource& other) const noexcept override { return this == &other; }

    void* allocateLarge(std::size_t bytes);
    /**
     * Counts what the arena is about to take.
     *
     * @throws std::bad_alloc if it would hold more than the limit; what the meter throws. Nothing is counted then.
     */
    void take(std::size_t bytes);
    /** Counts what the arena has given back. */
    void give(std::size_t bytes);

    Chunk* _chunks = nullptr;
    std::byte* _next = nullptr;
    std::byte* _end = nullptr;
    /** Blocks to use again, by size in granules. */
    std::array<FreeBlock*, smallBytes / granule + 1> _free{};
    LargeBlock* _large = nullptr;
    const std::size_t _limit;
    MemoryMeter* const _meter;
    /** In bytes, of chunks and large blocks. */
    std::size_t _held = 0;
    bool _exhausted = false;
};

} // namespace ObjectManager

#endif

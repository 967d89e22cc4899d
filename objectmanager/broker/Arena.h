/** The memory in which the CMPI objects of a request lie. */
#ifndef BROKER_ARENA_H
#define BROKER_ARENA_H

#include "model/Operations.h"

#include <array>
#include <cstddef>
#include <limits>
#include <memory_resource>

namespace ObjectManager {

/**
 * A memory resource that gives all its memory back, and does so cheaply, when it is destroyed. The destructors of
 * objects that lie in an arena need not run.
 *
 * Small blocks are cut from chunks. A small block that is deallocated is used again by the same arena, and a destroyed
 * arena leaves its chunks to later arenas. Large blocks come from the heap, and go back to it when they are
 * deallocated. A block with a stricter alignment than std::max_align_t cannot be allocated.
 *
 * One thread at a time may use an arena.
 */
class Arena final : public std::pmr::memory_resource {
public:
    static constexpr std::size_t chunkBytes = std::size_t{64} * 1024;
    /** The size of all chunks that the process keeps, at most, while no arena uses them. */
    static constexpr std::size_t retainedBytes = std::size_t{128} * 1024 * 1024;

    /**
     * @param limit how many bytes of chunks and large blocks the arena may hold; an allocation that would exceed the
     *        limit throws std::bad_alloc.
     * @param meter counts the bytes that the arena holds. An allocation throws what the meter throws. May be null; must
     *        outlive the arena.
     */
    explicit Arena(std::size_t limit = std::numeric_limits<std::size_t>::max(), MemoryMeter* meter = nullptr)
        : _limit(limit), _meter(meter) {}
    Arena(const Arena&) = delete;
    Arena& operator=(const Arena&) = delete;
    ~Arena() override;

    /** Whether an allocation has failed because of the limit. */
    bool isExhausted() const { return _exhausted; }

    /** The numbers of chunks and blocks that the arenas of the process hold now. */
    struct Usage {
        std::size_t chunksInUse = 0;
        /** The chunks that no arena uses. */
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
     * Counts bytes that the arena is about to get.
     *
     * @throws std::bad_alloc if the arena would hold more than the limit; what the meter throws. The bytes are not
     * counted then.
     */
    void take(std::size_t bytes);
    /** Counts bytes that the arena has given back. */
    void give(std::size_t bytes);

    Chunk* _chunks = nullptr;
    /** The unused part of the newest chunk is from `_next` to `_end`. */
    std::byte* _next = nullptr;
    std::byte* _end = nullptr;
    /** The deallocated small blocks, which are to be used again, by their size in granules. */
    std::array<FreeBlock*, smallBytes / granule + 1> _free{};
    LargeBlock* _large = nullptr;
    const std::size_t _limit;
    MemoryMeter* const _meter;
    /** The size of the arena's chunks and large blocks, in bytes. */
    std::size_t _held = 0;
    bool _exhausted = false;
};

} // namespace ObjectManager

#endif

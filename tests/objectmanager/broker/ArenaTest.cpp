#include "broker/Arena.h"

#include <gmock/gmock.h>

#include <cstring>
#include <new>
#include <set>
#include <vector>

namespace ObjectManager {
namespace {

TEST(ArenaTest, BlocksOfEverySizeDoNotOverlapAndAreAligned) {
    Arena arena;
    std::vector<std::pair<unsigned char*, std::size_t>> blocks;
    for (std::size_t size = 1; size < 3000; size += 7) {
        auto* block = static_cast<unsigned char*>(arena.allocate(size));
        EXPECT_EQ(0U, reinterpret_cast<std::uintptr_t>(block) % alignof(std::max_align_t));
        std::memset(block, static_cast<int>(size % 251), size);
        blocks.emplace_back(block, size);
    }
    for (const auto& [block, size] : blocks) {
        EXPECT_EQ(std::vector<unsigned char>(size, static_cast<unsigned char>(size % 251)),
                  std::vector<unsigned char>(block, block + size));
    }
}

TEST(ArenaTest, ReleasedBlocksAreUsedAgain) {
    Arena arena;
    const Arena::Usage before = Arena::usage();
    for (int i = 0; i < 100'000; ++i) {
        arena.deallocate(arena.allocate(200), 200);
        arena.deallocate(arena.allocate(5000), 5000);
    }
    EXPECT_EQ(before.chunksInUse + 1, Arena::usage().chunksInUse);
    EXPECT_EQ(before.largeBlocks, Arena::usage().largeBlocks);
}

TEST(ArenaTest, HoldsNoMoreThanItsLimit) {
    Arena arena(2 * Arena::chunkBytes);
    constexpr std::size_t large = Arena::chunkBytes / 2;
    for (int count = 0; count < 100; ++count) {
        arena.deallocate(arena.allocate(large), large);
    }
    EXPECT_FALSE(arena.isExhausted());
    EXPECT_THROW(static_cast<void>(arena.allocate(2 * Arena::chunkBytes)), std::bad_alloc);
    EXPECT_TRUE(arena.isExhausted());
    const auto fill = [&arena] {
        for (std::size_t size = 0; size <= 2 * Arena::chunkBytes; size += 100) {
            static_cast<void>(arena.allocate(100));
        }
    };
    EXPECT_THROW(fill(), std::bad_alloc);
}

TEST(ArenaTest, LargeBlocksAreReleasedInAnyOrderAndWithTheArena) {
    const std::size_t before = Arena::usage().largeBlocks;
    {
        Arena arena;
        std::vector<void*> blocks(4);
        for (void*& block : blocks) {
            block = arena.allocate(10'000);
        }
        for (const std::size_t index : {1U, 3U, 0U}) {
            arena.deallocate(blocks[index], 10'000);
        }
        EXPECT_EQ(before + 1, Arena::usage().largeBlocks);
    }
    EXPECT_EQ(before, Arena::usage().largeBlocks);
}

TEST(ArenaTest, AnEndedArenaLeavesItsChunksToTheNextOne) {
    const auto fill = [] {
        Arena arena;
        for (int i = 0; i < 10'000; ++i) {
            static_cast<void>(arena.allocate(100));
        }
        return Arena::usage().chunksInUse;
    };
    const std::size_t used = fill();
    const std::size_t retained = Arena::usage().chunksRetained;
    EXPECT_GE(retained, used);
    EXPECT_EQ(used, fill());
    EXPECT_EQ(retained, Arena::usage().chunksRetained);
}

TEST(ArenaTest, RetainsNoMoreThanItsLimit) {
    {
        Arena arena;
        for (std::size_t filled = 0; filled < Arena::retainedBytes + 16 * Arena::chunkBytes; filled += 512) {
            static_cast<void>(arena.allocate(512));
        }
    }
    EXPECT_EQ(Arena::retainedBytes / Arena::chunkBytes, Arena::usage().chunksRetained);
}

} // namespace
} // namespace ObjectManager

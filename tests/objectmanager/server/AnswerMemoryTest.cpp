#include "Served.h"

#include "server/AnswerMemory.h"

#include <atomic>
#include <thread>

namespace ServerTest {
namespace {

using Server::AnswerMemory;

/** Somebody who wants a share of the memory to grow, in a thread of his own. */
class Waiter {
public:
    Waiter(AnswerMemory::Share& share, std::size_t size)
        : _thread([&share, size, this] {
              share.grow(size);
              _hasIt = true;
          }) {}
    Waiter(const Waiter&) = delete;
    Waiter& operator=(const Waiter&) = delete;
    ~Waiter() { _thread.join(); }

    bool hasIt() const { return _hasIt; }

private:
    std::atomic<bool> _hasIt = false;
    std::thread _thread;
};

TEST(AnswerMemoryTest, GivesOneNetworkHalfAndTheRestToOthers) {
    AnswerMemory memory(1000);
    AnswerMemory::Share first(memory, "a");
    AnswerMemory::Share other(memory, "b");
    first.grow(500);
    other.grow(500);
    EXPECT_FALSE(memory.isAwaited());
}

TEST(AnswerMemoryTest, LetsOneGoBeyondTheLimitSoThatSomebodyIsDone) {
    AnswerMemory memory(1000);
    AnswerMemory::Share share(memory, "a");
    share.grow(400);
    share.grow(100);
    share.grow(100'000);
    EXPECT_FALSE(memory.isAwaited());
}

TEST(AnswerMemoryTest, LetsAllOthersWaitMeanwhile) {
    AnswerMemory memory(1000);
    std::optional<AnswerMemory::Share> beyond;
    beyond.emplace(memory, "a");
    beyond->grow(5000);
    AnswerMemory::Share waiting(memory, "b");
    const Waiter waiter(waiting, 1);
    waitUntil([&] { return memory.isAwaited(); });
    EXPECT_FALSE(waiter.hasIt());
    beyond.reset();
    waitUntil([&] { return waiter.hasIt(); });
    EXPECT_FALSE(memory.isAwaited());
}

/** Each has some and wants more than is left: the first gets it, then, when it is done, the next. */
TEST(AnswerMemoryTest, ServesInOrderThoseWhoWaitForEachOther) {
    AnswerMemory memory(1000);
    std::optional<AnswerMemory::Share> first;
    first.emplace(memory, "a");
    std::optional<AnswerMemory::Share> second;
    second.emplace(memory, "a");
    AnswerMemory::Share third(memory, "a");
    first->grow(200);
    second->grow(200);
    third.grow(100);
    first->grow(600);
    std::optional<Waiter> secondWaiter;
    secondWaiter.emplace(*second, 800);
    waitUntil([&] { return memory.isAwaited(); });
    const Waiter thirdWaiter(third, 900);
    EXPECT_FALSE(secondWaiter->hasIt());
    first.reset();
    waitUntil([&] { return secondWaiter->hasIt() || thirdWaiter.hasIt(); });
    EXPECT_TRUE(secondWaiter->hasIt());
    secondWaiter.reset();
    second.reset();
    waitUntil([&] { return thirdWaiter.hasIt(); });
}

TEST(AnswerMemoryTest, LetsNobodyWaitWhenItIsClosed) {
    AnswerMemory memory(1000);
    AnswerMemory::Share beyond(memory, "a");
    beyond.grow(5000);
    AnswerMemory::Share waiting(memory, "a");
    const Waiter waiter(waiting, 5000);
    waitUntil([&] { return memory.isAwaited(); });
    memory.close();
    waitUntil([&] { return waiter.hasIt(); });
}

} // namespace
} // namespace ServerTest

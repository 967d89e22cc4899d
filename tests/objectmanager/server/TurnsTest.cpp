#include "Served.h"

#include "server/Turns.h"

namespace ServerTest {
namespace {

using Server::Turns;

/** A client that waits for a turn in a thread of its own, and notes that it got one. */
class Waiting {
public:
    Waiting(Turns& turns, std::string network, bool known, std::vector<std::string>& order, std::mutex& mutex)
        : _thread([&turns, &order, &mutex, known, network = std::move(network)] {
              const Turns::Turn turn = turns.take(network, known, Turns::Clock::now() + 1h, [] { return false; });
              const std::lock_guard lock(mutex);
              order.push_back(turn ? network : network + " without");
          }) {}
    Waiting(Waiting&&) = default;
    ~Waiting() {
        if (_thread.joinable()) {
            _thread.join();
        }
    }

private:
    std::thread _thread;
};

class TurnsTest : public testing::Test {
protected:
    static Turns::Turn takeAtOnce(Turns& turns, const std::string& network, bool known = true) {
        return turns.take(network, known, Turns::Clock::now(), [] { return false; });
    }

    /** Starts one, and returns when it waits: then there is no room for another of its network. */
    void wait(Turns& turns, const std::string& network, bool known = true) {
        const std::size_t before = turns.waiting();
        _waiting.emplace_back(turns, network, known, _order, _mutex);
        waitUntil([&] { return turns.waiting() == before + 1; });
    }

    std::mutex _mutex;
    std::vector<std::string> _order;
    std::vector<Waiting> _waiting;
};

TEST_F(TurnsTest, AreTakenByNetworksInTurns) {
    Turns turns(1, 1, 10);
    {
        const Turns::Turn first = takeAtOnce(turns, "crowd");
        ASSERT_TRUE(first);
        for (int i = 0; i < 3; ++i) {
            wait(turns, "crowd");
        }
        wait(turns, "late");
    }
    _waiting.clear();
    ASSERT_EQ(_order.size(), 4U);
    EXPECT_EQ(_order.front(), "late");
}

TEST_F(TurnsTest, AreForKnownClientsFirst) {
    Turns turns(1, 1, 10);
    {
        const Turns::Turn first = takeAtOnce(turns, "a");
        wait(turns, "b", false);
        wait(turns, "c", true);
    }
    _waiting.clear();
    EXPECT_THAT(_order, testing::ElementsAre("c", "b"));
}

TEST_F(TurnsTest, LeaveAPlaceToOthersThanOneNetworkAndStrangers) {
    Turns turns(4, 2, 10);
    const Turns::Turn one = takeAtOnce(turns, "crowd", false);
    const Turns::Turn two = takeAtOnce(turns, "crowd", false);
    EXPECT_TRUE(one && two);
    EXPECT_FALSE(takeAtOnce(turns, "crowd", true));
    const Turns::Turn three = takeAtOnce(turns, "other", false);
    EXPECT_TRUE(three);
    EXPECT_FALSE(takeAtOnce(turns, "third", false));
    EXPECT_TRUE(takeAtOnce(turns, "third", true));
}

TEST_F(TurnsTest, AreNotWaitedForByMoreThanMayWait) {
    Turns turns(1, 1, 1);
    {
        const Turns::Turn first = takeAtOnce(turns, "a");
        wait(turns, "a");
        EXPECT_FALSE(turns.take("a", true, Turns::Clock::now() + 1h, [] { return false; }));
    }
    _waiting.clear();
    EXPECT_THAT(_order, testing::ElementsAre("a"));
}

TEST_F(TurnsTest, AreNotWaitedForByWhoHasGone) {
    Turns turns(1, 1, 1);
    const Turns::Turn first = takeAtOnce(turns, "a");
    EXPECT_FALSE(turns.take("b", true, Turns::Clock::now() + 1h, [] { return true; }));
    EXPECT_EQ(turns.waiting(), 0U);
}

TEST_F(TurnsTest, EndForThoseWhoWaitWhenTheyAreClosed) {
    Turns turns(1, 1, 1);
    const Turns::Turn first = takeAtOnce(turns, "a");
    wait(turns, "b");
    turns.close();
    _waiting.clear();
    EXPECT_THAT(_order, testing::ElementsAre("b without"));
    EXPECT_FALSE(takeAtOnce(turns, "c"));
}

} // namespace
} // namespace ServerTest

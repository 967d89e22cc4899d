#include "Served.h"

#include "server/Workers.h"

#include <atomic>

namespace ServerTest {
namespace {

TEST(WorkersTest, doEveryTaskThatTheyTakeBeforeTheyEnd) {
    std::atomic<int> done = 0;
    Server::Workers workers(3, 100);
    for (int i = 0; i < 100; ++i) {
        ASSERT_TRUE(workers.add([&] { ++done; }));
    }
    workers.finish();
    EXPECT_EQ(done, 100);
}

TEST(WorkersTest, takeNoMoreTasksThanMayWait) {
    Gate entered;
    Gate gate;
    Server::Workers workers(1, 2);
    ASSERT_TRUE(workers.add([&] {
        entered.open();
        gate.wait();
    }));
    entered.wait();
    EXPECT_TRUE(workers.add([] {}));
    EXPECT_TRUE(workers.add([] {}));
    EXPECT_FALSE(workers.add([] { ADD_FAILURE() << "was refused"; }));
    gate.open();
}

TEST(WorkersTest, takeNoTaskAfterTheyEnded) {
    Server::Workers workers(1, 2);
    workers.finish();
    EXPECT_FALSE(workers.add([] { ADD_FAILURE() << "was refused"; }));
}

} // namespace
} // namespace ServerTest

#include "server/Budget.h"

#include <gtest/gtest.h>

namespace ServerTest {
namespace {

using ObjectManager::Server::Budget;

TEST(Budget, GivesOneNetworkHalfOfItAtMost) {
    Budget budget(1000);
    Budget::Share first(budget, "a");
    Budget::Share second(budget, "a");
    EXPECT_TRUE(first.grow(300));
    EXPECT_TRUE(second.grow(200));
    EXPECT_FALSE(second.grow(201));
    EXPECT_FALSE(first.grow(301));
    Budget::Share other(budget, "b");
    EXPECT_TRUE(other.grow(500));
}

TEST(Budget, IsTheSameForAllNetworksTogether) {
    Budget budget(1000);
    Budget::Share first(budget, "a");
    Budget::Share second(budget, "b");
    Budget::Share third(budget, "c");
    EXPECT_TRUE(first.grow(400));
    EXPECT_TRUE(second.grow(400));
    EXPECT_FALSE(third.grow(201));
    EXPECT_TRUE(third.grow(200));
}

TEST(Budget, GetsBackWhatARequestHadWithItsEnd) {
    Budget budget(1000);
    {
        Budget::Share share(budget, "a");
        EXPECT_TRUE(share.grow(500));
    }
    Budget::Share again(budget, "a");
    EXPECT_TRUE(again.grow(500));
}

TEST(Budget, LeavesAShareAsItIsThatCannotGrow) {
    Budget budget(1000);
    Budget::Share share(budget, "a");
    EXPECT_TRUE(share.grow(100));
    EXPECT_FALSE(share.grow(1'000'000'000));
    EXPECT_TRUE(share.grow(50)) << "it has as much already";
    EXPECT_TRUE(share.grow(500));
}

} // namespace
} // namespace ServerTest

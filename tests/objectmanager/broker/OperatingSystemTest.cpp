#include "RequestTest.h"

#include <atomic>
#include <cerrno>
#include <chrono>
#include <ctime>
#include <unistd.h>

namespace ObjectManager {
namespace {

class OperatingSystemTest : public RequestTest {
protected:
    const CMPIBrokerExtFT* os = mb->xft;
};

TEST_F(OperatingSystemTest, LibrariesHaveFileNames) {
    EXPECT_STREQ("libdisk.so", os->resolveFileName("disk"));
}

TEST_F(OperatingSystemTest, ThreadsRunAndGiveAResult) {
    int argument = 5;
    void* thread = os->newThread([](void* given) { return given; }, &argument, 0);
    void* result = nullptr;
    EXPECT_EQ(0, os->joinThread(thread, &result));
    EXPECT_EQ(&argument, result);
}

TEST_F(OperatingSystemTest, AThreadEndsItself) {
    static const CMPIBrokerExtFT* table;
    table = os;
    int argument = 5;
    void* thread = os->newThread(
        [](void* given) -> void* {
            table->exitThread(given);
            return nullptr;
        },
        &argument, 0);
    void* result = nullptr;
    EXPECT_EQ(0, os->joinThread(thread, &result));
    EXPECT_EQ(&argument, result);
}

TEST_F(OperatingSystemTest, AThreadIsCancelled) {
    void* thread = os->newThread(
        [](void*) -> void* {
            pause();
            return nullptr;
        },
        nullptr, 0);
    EXPECT_EQ(0, os->cancelThread(thread));
    EXPECT_EQ(0, os->joinThread(thread, nullptr));
}

TEST_F(OperatingSystemTest, SleepsAtLeastAsLongAsTold) {
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(0, os->threadSleep(20));
    EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(20));
}

TEST_F(OperatingSystemTest, AFunctionRunsOnlyOnce) {
    static int calls = 0;
    int once = 0;
    EXPECT_EQ(0, os->threadOnce(&once, [] { ++calls; }));
    EXPECT_EQ(0, os->threadOnce(&once, [] { ++calls; }));
    EXPECT_EQ(1, calls);
}

TEST_F(OperatingSystemTest, EachThreadHasItsOwnValueOfAKey) {
    static const CMPIBrokerExtFT* table;
    static unsigned int key;
    static std::atomic<int> cleanups;
    table = os;
    ASSERT_EQ(0, os->createThreadKey(&key, [](void*) { ++cleanups; }));
    int value = 5;
    EXPECT_EQ(0, os->setThreadSpecific(key, &value));
    void* thread = os->newThread(
        [](void* given) -> void* {
            void* before = table->getThreadSpecific(key);
            table->setThreadSpecific(key, given);
            return before;
        },
        &value, 0);
    void* seen = &value;
    EXPECT_EQ(0, os->joinThread(thread, &seen));
    EXPECT_EQ(nullptr, seen);
    EXPECT_EQ(1, cleanups);
    EXPECT_EQ(&value, os->getThreadSpecific(key));
    EXPECT_EQ(0, os->setThreadSpecific(key, nullptr));
    EXPECT_EQ(0, os->destroyThreadKey(key));
}

TEST_F(OperatingSystemTest, AConditionWakesAThreadThatHoldsTheMutex) {
    struct Shared {
        const CMPIBrokerExtFT* os;
        void* mutex;
        void* condition;
        bool ready;
    } shared{os, os->newMutex(0), os->newCondition(0), false};
    os->lockMutex(shared.mutex);
    void* thread = os->newThread(
        [](void* given) -> void* {
            auto& state = *static_cast<Shared*>(given);
            state.os->lockMutex(state.mutex);
            state.ready = true;
            state.os->signalCondition(state.condition);
            state.os->unlockMutex(state.mutex);
            return nullptr;
        },
        &shared, 0);
    while (!shared.ready) {
        EXPECT_EQ(0, os->condWait(shared.condition, shared.mutex));
    }
    os->unlockMutex(shared.mutex);
    EXPECT_EQ(0, os->joinThread(thread, nullptr));
    os->destroyCondition(shared.condition);
    os->destroyMutex(shared.mutex);
}

TEST_F(OperatingSystemTest, WaitingForAConditionEndsAtItsTime) {
    void* mutex = os->newMutex(0);
    void* condition = os->newCondition(0);
    os->lockMutex(mutex);
    timespec past{1, 0};
    EXPECT_EQ(ETIMEDOUT, os->timedCondWait(condition, mutex, &past));
    os->unlockMutex(mutex);
    os->destroyCondition(condition);
    os->destroyMutex(mutex);
}

TEST_F(OperatingSystemTest, NullHandlesAreRefused) {
    EXPECT_EQ(nullptr, os->newThread(nullptr, nullptr, 0));
    EXPECT_EQ(EINVAL, os->joinThread(nullptr, nullptr));
    EXPECT_EQ(EINVAL, os->cancelThread(nullptr));
    EXPECT_EQ(EINVAL, os->threadOnce(nullptr, [] {}));
    EXPECT_EQ(EINVAL, os->createThreadKey(nullptr, nullptr));
    EXPECT_EQ(EINVAL, os->condWait(nullptr, nullptr));
    EXPECT_EQ(EINVAL, os->timedCondWait(nullptr, nullptr, nullptr));
    EXPECT_EQ(EINVAL, os->signalCondition(nullptr));
    os->destroyMutex(nullptr);
    os->lockMutex(nullptr);
    os->unlockMutex(nullptr);
    os->destroyCondition(nullptr);
}

} // namespace
} // namespace ObjectManager

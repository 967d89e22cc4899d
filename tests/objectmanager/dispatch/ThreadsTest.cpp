/* Tests that many threads can use one dispatcher at once. */
#include "TestProviders.h"

#include <thread>

namespace ObjectManager {
namespace {

TEST(ThreadsTest, EachThreadIsServedAsIfItWereAlone) {
    constexpr int threads = 8;
    constexpr int rounds = 200;
    LogTap log;
    const Registry registry({testRegistration("Test_Disk"), testRegistration("Test_AsksForDisks"),
                             testRegistration("Test_Throws"), testRegistration("Test_ReleasesTwice"),
                             testRegistration("Test_LeavesOpenAfterFailureLog")});
    Dispatcher dispatcher(registry, {{testProviders}, nullptr, &log});
    dispatcher.broker().setMessageSink([](const BrokerMessage&) {});
    const auto serve = [&] {
        const Invocation invocation;
        const auto failure = [&](const char* className) {
            return errorOf([&] {
                dispatcher.enumerateInstances(invocation, {"", "root/cimv2", className, {}}, std::nullopt);
            });
        };
        for (int round = 0; round < rounds; ++round) {
            const ObjectPath disks{"", "root/cimv2", "Test_AsksForDisks", {}};
            EXPECT_EQ(2U, dispatcher.enumerateInstances(invocation, disks, std::nullopt).size());
            EXPECT_STREQ("TestProvider threw an exception: out of disks", failure("Test_Throws").what());
            EXPECT_STREQ("TestProvider released a CMPIInstance twice", failure("Test_ReleasesTwice").what());
            EXPECT_THAT(failure("Test_LeavesOpenAfterFailureLog").reasons,
                        testing::ElementsAre("no disk in the bay", "drive bay is open"));
            EXPECT_THAT(log.take(), testing::SizeIs(3));
        }
    };
    std::vector<std::thread> running;
    running.reserve(threads);
    for (int i = 0; i < threads; ++i) {
        running.emplace_back(serve);
    }
    for (std::thread& thread : running) {
        thread.join();
    }
}

} // namespace
} // namespace ObjectManager

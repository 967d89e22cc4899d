#include "RequestTest.h"
#include "broker/Result.h"

#include <array>
#include <malloc.h>

namespace ObjectManager {
namespace {

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int requests = 50'000;
#else
constexpr int requests = 1'000'000;
#endif

/** Serves a small request, in which every kind of allocation occurs. */
void serveOne(const Broker& broker) {
    const CMPIBroker* mb = broker.handle();
    Request request(broker);
    Result result(request);
    CMPIObjectPath* path = CMNewObjectPath(mb, "root/cimv2", "Test_Disk", nullptr);
    CMPIInstance* instance = CMNewInstance(mb, path, nullptr);
    CMSetProperty(instance, "Name", "a name that does not fit into a small string", CMPI_chars);
    CMPIObjectPath* cloned = CMClone(path, nullptr);
    CMRelease(cloned);
    CMReturnInstance(result.handle(), instance);
    CMReturnDone(result.handle());
}

TEST(SoakTest, AMillionRequestsLeaveMemoryAsItWas) {
    const Broker broker;
    serveOne(broker);
    const std::size_t heap = mallinfo2().uordblks;
    const Arena::Usage arenas = Arena::usage();
    for (int i = 0; i < requests; ++i) {
        serveOne(broker);
    }
    EXPECT_EQ(heap, mallinfo2().uordblks);
    EXPECT_EQ(0U, Arena::usage().chunksInUse);
    EXPECT_EQ(arenas.chunksRetained, Arena::usage().chunksRetained);
    EXPECT_EQ(0U, Arena::usage().largeBlocks);
}

} // namespace
} // namespace ObjectManager

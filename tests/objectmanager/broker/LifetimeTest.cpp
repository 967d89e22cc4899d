/* Tests when objects end, and what happens to providers that use them afterwards. */
#include "RequestTest.h"
#include "broker/Objects.h"
#include "broker/Result.h"

#include <functional>
#include <thread>

namespace ObjectManager {
namespace {

class LifetimeTest : public RequestTest {};

TEST_F(LifetimeTest, ReleasingEndsAnObject) {
    CMPIString* string = CMNewString(mb, "text", nullptr);
    EXPECT_EQ(CMPI_RC_OK, CMRelease(string).rc);
    EXPECT_TRUE(CMIsNullObject(string));
    EXPECT_EQ("", request.misuse());
}

TEST_F(LifetimeTest, ReleasingTwiceIsAMisuse) {
    CMPIObjectPath* path = newPath();
    CMRelease(path);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMRelease(path).rc);
    EXPECT_EQ("released a CMPIObjectPath twice", request.misuse());
}

TEST_F(LifetimeTest, UsingAReleasedObjectIsAMisuse) {
    CMPIInstance* instance = newInstance();
    CMRelease(instance);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMSetProperty(instance, "Name", "a", CMPI_chars).rc);
    EXPECT_EQ(nullptr, CMGetObjectPath(instance, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
    EXPECT_EQ("used a CMPIInstance after it was released", request.misuse());
}

TEST_F(LifetimeTest, TheFirstMisuseIsReported) {
    CMPIString* string = CMNewString(mb, "text", nullptr);
    CMRelease(string);
    CMRelease(string);
    CMGetCharPtr(string);
    EXPECT_EQ("released a CMPIString twice", request.misuse());
}

TEST_F(LifetimeTest, EveryKindCanBeReleasedAndCloned) {
    auto* enumeration = newObjectOf<CMPIEnumeration>(request, {});
    const auto check = [&](auto* object) {
        auto* cloned = CMClone(object, &status);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        EXPECT_EQ(CMPI_RC_OK, CMRelease(object).rc);
        EXPECT_EQ(nullptr, CMClone(object, &status));
        EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
        EXPECT_EQ(CMPI_RC_OK, CMRelease(cloned).rc);
        EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMRelease(cloned).rc);
    };
    check(newPath());
    check(newInstance());
    check(CMNewArgs(mb, nullptr));
    check(request.context({{CMPIPrincipal, stringValue("root")}}));
    check(CMNewString(mb, "text", nullptr));
    check(CMNewArray(mb, 3, CMPI_uint16, nullptr));
    check(enumeration);
    check(CMNewDateTime(mb, nullptr));
    check(CMNewCMPIError(mb, "a", "b", "c", ErrorSevLow, ErrorProbCauseUnknown, CMPI_RC_ERR_FAILED, nullptr));
}

TEST_F(LifetimeTest, MemoryOfReleasedObjectsIsUsedAgain) {
    const auto makeAndRelease = [&] {
        CMPIInstance* instance = newInstance();
        const std::string longText(1000, 'x');
        for (const char* name : {"A", "B", "C", "D", "E", "F"}) {
            CMSetProperty(instance, name, longText.c_str(), CMPI_chars);
            CMSetProperty(instance, name, "replaced", CMPI_chars);
        }
        CMPIObjectPath* path = CMGetObjectPath(instance, nullptr);
        CMRelease(path);
        CMRelease(instance);
    };
    makeAndRelease();
    const Arena::Usage before = Arena::usage();
    for (int i = 0; i < 1000; ++i) {
        makeAndRelease();
    }
    // The shell of a released object stays until the request ends. Each turn leaves three shells.
    EXPECT_LE(Arena::usage().chunksInUse,
              before.chunksInUse + 1 + std::size_t{1000} * 3 * sizeof(ObjectHeader) / Arena::chunkBytes);
    EXPECT_EQ(before.largeBlocks, Arena::usage().largeBlocks);
}

TEST_F(LifetimeTest, AMarkReleasesTheObjectsMadeSinceThen) {
    const CMPIString* before = CMNewString(mb, "before", nullptr);
    const CMPIGcStat* mark = CMMark(mb, &status);
    ASSERT_EQ(CMPI_RC_OK, status.rc);
    CMPIString* after = CMNewString(mb, "after", nullptr);
    CMPIInstance* instance = newInstance();
    CMRelease(instance);
    EXPECT_EQ(CMPI_RC_OK, CMFree(mb, mark).rc);
    EXPECT_EQ("before", text(before));
    EXPECT_TRUE(CMIsNullObject(after));
    EXPECT_EQ("", request.misuse());
}

TEST_F(LifetimeTest, AMarkMayStandAtTheBeginning) {
    const Request inner(broker);
    const CMPIGcStat* mark = CMMark(mb, nullptr);
    const CMPIString* string = CMNewString(mb, "after", nullptr);
    EXPECT_EQ(CMPI_RC_OK, CMFree(mb, mark).rc);
    EXPECT_TRUE(CMIsNullObject(string));
}

TEST_F(LifetimeTest, AMarkOfAnotherRequestReleasesNothing) {
    newPath();
    const CMPIGcStat* mark = CMMark(mb, nullptr);
    const Request inner(broker);
    const CMPIString* string = CMNewString(mb, "kept", nullptr);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMFree(mb, mark).rc);
    EXPECT_EQ("kept", text(string));
}

TEST_F(LifetimeTest, ObjectsBelongToTheInnermostRequest) {
    const CMPIString* outer = CMNewString(mb, "outer", nullptr);
    {
        Request nested(broker);
        EXPECT_EQ(&nested, Request::current());
        EXPECT_EQ(2U, nested.depth());
        EXPECT_EQ("outer", text(outer));
        CMPIString* inner = CMNewString(mb, "inner", nullptr);
        CMRelease(inner);
        CMRelease(inner);
        EXPECT_EQ("released a CMPIString twice", nested.misuse());
    }
    EXPECT_EQ(&request, Request::current());
    EXPECT_EQ("", request.misuse());
    EXPECT_EQ("outer", text(outer));
}

TEST_F(LifetimeTest, AThreadHasItsOwnCurrentRequest) {
    std::thread([this] {
        EXPECT_EQ(nullptr, Request::current());
        EXPECT_EQ(nullptr, CMNewString(mb, "text", &status));
        EXPECT_EQ(CMPI_RC_ERR_FAILED, status.rc);
        const Request own(broker);
        EXPECT_NE(nullptr, CMNewString(mb, "text", nullptr));
    }).join();
    EXPECT_EQ(&request, Request::current());
}

class CloneTest : public testing::Test {
protected:
    Broker broker;
    const CMPIBroker* mb = broker.handle();

    CMPIInstance* cloneFromARequest() {
        const Request request(broker);
        CMPIInstance* instance = CMNewInstance(mb, CMNewObjectPath(mb, "root", "C", nullptr), nullptr);
        CMSetProperty(instance, "Name", "a", CMPI_chars);
        return CMClone(instance, nullptr);
    }
};

TEST_F(CloneTest, OutlivesTheRequest) {
    CMPIInstance* cloned = cloneFromARequest();
    {
        const Request later(broker);
        EXPECT_EQ("a", textOf(CMGetProperty(cloned, "Name", nullptr).value.string));
        EXPECT_EQ(CMPI_RC_OK, CMSetProperty(cloned, "Name", "b", CMPI_chars).rc);
        EXPECT_EQ("b", textOf(CMGetProperty(cloned, "Name", nullptr).value.string));
    }
    EXPECT_EQ(CMPI_RC_OK, CMRelease(cloned).rc);
}

TEST_F(CloneTest, ReadWithoutARequestGivesNothing) {
    CMPIInstance* cloned = cloneFromARequest();
    CMPIStatus status{CMPI_RC_OK, nullptr};
    EXPECT_TRUE(CMIsNullValue(CMGetProperty(cloned, "Name", &status)));
    EXPECT_EQ(CMPI_RC_ERR_FAILED, status.rc);
    EXPECT_EQ(nullptr, CMGetObjectPath(cloned, &status));
    EXPECT_EQ(CMPI_RC_ERR_FAILED, status.rc);
    CMRelease(cloned);
}

TEST_F(CloneTest, ReleasedTwiceInARequestIsAMisuse) {
    CMPIInstance* cloned = cloneFromARequest();
    Request request(broker);
    EXPECT_EQ(CMPI_RC_OK, CMRelease(cloned).rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMRelease(cloned).rc);
    EXPECT_EQ("released a CMPIInstance twice", request.misuse());
}

} // namespace
} // namespace ObjectManager

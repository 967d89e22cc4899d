#include "broker/Result.h"

#include "RequestTest.h"
#include <array>

namespace ObjectManager {
namespace {

class ResultTest : public RequestTest {
protected:
    Result result{request};
    const CMPIResult* handle = result.handle();
};

TEST_F(ResultTest, CollectsPathsAsTheyAreWhenTheyAreReturned) {
    CMPIObjectPath* path = newPath();
    CMAddKey(path, "Name", "a", CMPI_chars);
    EXPECT_EQ(CMPI_RC_OK, CMReturnObjectPath(handle, path).rc);
    CMAddKey(path, "Name", "b", CMPI_chars);
    EXPECT_EQ(CMPI_RC_OK, CMReturnObjectPath(handle, path).rc);
    CMRelease(path);
    ASSERT_EQ(2U, result.pathCount());
    EXPECT_EQ(stringValue("a"), result.path(0).keys.at(0).value);
    EXPECT_EQ(stringValue("b"), result.path(1).keys.at(0).value);
    EXPECT_FALSE(result.closed());
    EXPECT_FALSE(result.empty());
}

TEST_F(ResultTest, CollectsInstancesWithWholePaths) {
    CMPIInstance* instance = newInstance();
    const CMPIUint16 size = 5;
    CMSetProperty(instance, "Size", &size, CMPI_uint16);
    CMSetProperty(instance, "Name", "a", CMPI_chars);
    CMSetProperty(instance, "System", "s", CMPI_chars);
    EXPECT_EQ(CMPI_RC_OK, CMReturnInstance(handle, instance).rc);
    ASSERT_EQ(1U, result.instanceCount());
    const Instance returned = result.instance(0);
    const ObjectPath path{"", "root/cimv2", "Test_Disk", {{"System", stringValue("s")}, {"Name", stringValue("a")}}};
    EXPECT_EQ(path, returned.path);
    ASSERT_EQ(3U, returned.properties.size());
    EXPECT_EQ("Size", returned.properties[0].name);
    EXPECT_EQ(unsignedValue(CMPI_uint16, 5), returned.properties[0].value);
}

TEST_F(ResultTest, DoesNotChangeWithAReturnedInstance) {
    std::array<const char*, 2> properties = {"Size", nullptr};
    CMPIInstance* instance = newInstance();
    CMSetProperty(instance, "Size", "small", CMPI_chars);
    CMReturnInstance(handle, instance);
    CMSetProperty(instance, "Size", "large", CMPI_chars);
    CMReturnInstance(handle, instance);
    CMSetPropertyFilter(instance, properties.data(), nullptr);
    CMReturnInstance(handle, instance);
    CMPIObjectPath* path = newPath();
    CMSetClassName(path, "Test_Tape");
    CMSetObjectPath(instance, path);
    CMReturnInstance(handle, instance);
    CMRelease(instance);
    std::vector<std::pair<std::string, Value>> found;
    for (std::size_t i = 0; i < result.instanceCount(); ++i) {
        const Instance returned = result.instance(i);
        found.emplace_back(returned.path.className, returned.properties.at(0).value);
    }
    EXPECT_THAT(found, testing::ElementsAre(testing::Pair("Test_Disk", stringValue("small")),
                                            testing::Pair("Test_Disk", stringValue("large")),
                                            testing::Pair("Test_Disk", stringValue("large")),
                                            testing::Pair("Test_Tape", stringValue("large"))));
}

TEST_F(ResultTest, ClonesAreCopied) {
    CMPIInstance* original = newInstance();
    CMSetProperty(original, "Size", "large", CMPI_chars);
    CMPIInstance* cloned = CMClone(original, nullptr);
    CMReturnInstance(handle, cloned);
    CMRelease(cloned);
    EXPECT_EQ(stringValue("large"), result.instance(0).properties.at(0).value);
}

TEST_F(ResultTest, AMarkReleasesNothingThatWasReturned) {
    const CMPIGcStat* mark = CMMark(mb, nullptr);
    CMReturnObjectPath(handle, newPath());
    CMFree(mb, mark);
    EXPECT_EQ("Test_Disk", result.path(0).className);
}

TEST_F(ResultTest, CollectsValuesAndErrors) {
    const CMPIUint32 code = 7;
    EXPECT_EQ(CMPI_RC_OK, CMReturnData(handle, &code, CMPI_uint32).rc);
    EXPECT_EQ(unsignedValue(CMPI_uint32, 7), result.data().at(0));
    EXPECT_EQ(CMPI_RC_OK, CMReturnError(handle, CMNewCMPIError(mb, "", "", "no", ErrorSevLow, ErrorProbCauseUnknown,
                                                               CMPI_RC_ERR_ACCESS_DENIED, nullptr))
                              .rc);
    EXPECT_EQ(CMPI_RC_ERR_ACCESS_DENIED, result.errors().at(0).code);
    EXPECT_STREQ("no", result.errors().at(0).what());
}

TEST_F(ResultTest, RefusesEverythingOnceItIsClosed) {
    EXPECT_EQ(CMPI_RC_OK, CMReturnDone(handle).rc);
    EXPECT_TRUE(result.closed());
    EXPECT_EQ(CMPI_RC_ERR_FAILED, CMReturnObjectPath(handle, newPath()).rc);
    EXPECT_EQ(CMPI_RC_ERR_FAILED, CMReturnInstance(handle, newInstance()).rc);
    EXPECT_EQ(CMPI_RC_ERR_FAILED, CMReturnData(handle, "text", CMPI_chars).rc);
    EXPECT_EQ(CMPI_RC_ERR_FAILED, CMReturnDone(handle).rc);
    EXPECT_TRUE(result.empty());
    EXPECT_EQ("returned an object path after it had closed its result", request.misuse());
}

TEST_F(ResultTest, RefusesNullObjects) {
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMReturnInstance(handle, nullptr).rc);
    EXPECT_EQ("returned a null CMPIInstance", request.misuse());
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMReturnObjectPath(handle, nullptr).rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMReturnError(handle, nullptr).rc);
    EXPECT_TRUE(result.empty());
}

TEST_F(ResultTest, RefusesValuesThatCannotBeRead) {
    CMPIValue value{};
    EXPECT_EQ(CMPI_RC_ERR_INVALID_DATA_TYPE, CMReturnData(handle, &value, CMPI_ptr).rc);
    EXPECT_EQ("returned a value that cannot be read", request.misuse());
}

TEST_F(ResultTest, RefusesReleasedObjects) {
    CMPIInstance* instance = newInstance();
    CMRelease(instance);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMReturnInstance(handle, instance).rc);
    EXPECT_EQ("used a CMPIInstance after it was released", request.misuse());
}

TEST_F(ResultTest, KeepsAnObjectThatTheProviderReleases) {
    CMReturnObjectPath(handle, newPath());
    EXPECT_EQ(CMPI_RC_OK, CMRelease(const_cast<CMPIResult*>(handle)).rc);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMReturnDone(handle).rc);
    EXPECT_EQ(1U, result.pathCount());
    EXPECT_EQ("used a CMPIResult after it was released", request.misuse());
}

} // namespace
} // namespace ObjectManager

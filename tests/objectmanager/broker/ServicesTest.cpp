/* Tests messages, the types and texts of objects, and memory for providers. */
#include "RequestTest.h"
#include "broker/Objects.h"
#include "broker/Result.h"

#include <cstring>

namespace ObjectManager {
namespace {

class MessagesTest : public RequestTest {
protected:
    MessagesTest() {
        broker.setMessageSink([this](const BrokerMessage& message) { messages.push_back(message); });
    }

    std::vector<BrokerMessage> messages;
};

TEST_F(MessagesTest, LogAndTraceGoToTheSink) {
    EXPECT_EQ(CMPI_RC_OK, CMLogMessage(mb, CMPI_SEV_WARNING, "id", "as characters", nullptr).rc);
    EXPECT_EQ(CMPI_RC_OK,
              CMTraceMessage(mb, CMPI_LEV_VERBOSE, "component", nullptr, CMNewString(mb, "as a string", nullptr)).rc);
    ASSERT_EQ(2U, messages.size());
    EXPECT_EQ(BrokerMessage::Kind::log, messages[0].kind);
    EXPECT_EQ(CMPI_SEV_WARNING, messages[0].level);
    EXPECT_EQ("id", messages[0].source);
    EXPECT_EQ("as characters", messages[0].text);
    EXPECT_EQ(BrokerMessage::Kind::trace, messages[1].kind);
    EXPECT_EQ("component", messages[1].source);
    EXPECT_EQ("as a string", messages[1].text);
}

TEST_F(MessagesTest, GoToStandardErrorWithoutASink) {
    const Broker plain;
    testing::internal::CaptureStderr();
    CMLogMessage(plain.handle(), CMPI_SEV_ERROR, "id", "text", nullptr);
    EXPECT_EQ("id: text\n", testing::internal::GetCapturedStderr());
}

TEST_F(MessagesTest, MessagesOfFilesAreTheirDefaultTexts) {
    EXPECT_EQ("default", text(mb->eft->getMessage(mb, "id", "default", &status, 0)));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
    EXPECT_EQ("default", text(mb->eft->getMessage2(mb, "id", nullptr, "default", &status, 1, CMPI_chars, "unused")));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

class KindsTest : public RequestTest {
protected:
    Result result{request};
};

TEST_F(KindsTest, EveryObjectKnowsItsTypeAndHasAText) {
    const CMPIArgs* args = request.arguments({{"A", unsignedValue(CMPI_uint16, 5)}, {"B", booleanValue(true)}});
    const CMPIContext* context = request.context({{"A", nullValue(CMPI_string)}});
    const CMPIInstance* instance =
        request.instance({{"", "root", "C", {}},
                          {{"A", arrayValue(CMPI_string, {stringValue("x"), stringValue("y")})},
                           {"B", referenceValue({"", "root", "D", {}})},
                           {"C", realValue(CMPI_real64, 0.5)}}});
    const auto* dateTime = CMNewDateTimeFromChars(mb, "20260228235959.123456+000", nullptr);
    const auto* error =
        CMNewCMPIError(mb, "a", "b", "message", ErrorSevLow, ErrorProbCauseUnknown, CMPI_RC_ERR_FAILED, nullptr);
    const auto* enumeration = newObjectOf<CMPIEnumeration>(request, {{CMPI_uint16, 0, nullptr}, 0});
    struct Case {
        const void* object;
        const char* type;
        const char* text;
    };
    for (const Case& expected :
         {Case{CMNewString(mb, "text", nullptr), "CMPIString", "text"},
          Case{newPath(), "CMPIObjectPath", "root/cimv2:Test_Disk"},
          Case{instance, "CMPIInstance",
               "instance of C {\n    A = {\"x\", \"y\"};\n    B = \"root:D\";\n    C = 0.5;\n};\n"},
          Case{args, "CMPIArgs", "A=5, B=TRUE"}, Case{context, "CMPIContext", "A=NULL"},
          Case{CMNewArray(mb, 2, CMPI_uint16, nullptr), "CMPIArray", "{NULL, NULL}"},
          Case{enumeration, "CMPIEnumeration", "{}"}, Case{dateTime, "CMPIDateTime", "20260228235959.123456+000"},
          Case{error, "CMPIError", "message"}, Case{result.handle(), "CMPIResult", "open"}}) {
        EXPECT_EQ(expected.type, text(CDGetType(mb, expected.object, nullptr)));
        EXPECT_TRUE(CDIsOfType(mb, expected.object, expected.type, &status));
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        EXPECT_FALSE(CDIsOfType(mb, expected.object, "CMPIBroker", nullptr));
        EXPECT_EQ(expected.text, text(CDToString(mb, expected.object, &status))) << expected.type;
        EXPECT_EQ(CMPI_RC_OK, status.rc);
    }
}

TEST_F(KindsTest, AReleasedObjectHasNoText) {
    CMPIString* string = CMNewString(mb, "text", nullptr);
    CMRelease(string);
    EXPECT_EQ(nullptr, CDToString(mb, string, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, status.rc);
}

class MemoryTest : public RequestTest {};

TEST_F(MemoryTest, BlocksKeepTheirBytes) {
    const CMPIBrokerMemFT* memory = mb->mft;
    char* text = memory->cmpiStrDup(mb, "text");
    EXPECT_STREQ("text", text);
    text = static_cast<char*>(memory->cmpiRealloc(mb, text, 10'000));
    EXPECT_STREQ("text", text);
    text = static_cast<char*>(memory->cmpiRealloc(mb, text, 3));
    EXPECT_EQ(0, std::memcmp("tex", text, 3));
    memory->cmpiFree(mb, text);
    auto* zeroes = static_cast<const char*>(memory->cmpiCalloc(mb, 10, 10));
    EXPECT_EQ(std::string(100, '\0'), std::string(zeroes, 100));
    EXPECT_NE(nullptr, memory->cmpiMalloc(mb, 0));
    EXPECT_EQ(nullptr, memory->cmpiCalloc(mb, SIZE_MAX, 2));
    EXPECT_EQ(nullptr, memory->cmpiMalloc(mb, SIZE_MAX));
}

TEST_F(MemoryTest, SizesBeyondAGigabyteGiveNoBlock) {
    const CMPIBrokerMemFT* memory = mb->mft;
    void* const kept = memory->cmpiMalloc(mb, 1);
    for (std::size_t less = 0; less < 200; ++less) {
        EXPECT_EQ(nullptr, memory->cmpiMalloc(mb, SIZE_MAX - less)) << less;
        EXPECT_EQ(nullptr, memory->cmpiCalloc(mb, 1, SIZE_MAX - less)) << less;
        EXPECT_EQ(nullptr, memory->cmpiRealloc(mb, kept, SIZE_MAX - less)) << less;
        EXPECT_EQ(nullptr, memory->cmpiMalloc(mb, static_cast<std::size_t>(PTRDIFF_MAX) - less)) << less;
    }
    constexpr std::size_t largest = std::size_t{1} << 30U;
    EXPECT_EQ(nullptr, memory->cmpiMalloc(mb, largest + 1));
    EXPECT_NE(nullptr, memory->cmpiRealloc(mb, kept, 2));
}

TEST_F(MemoryTest, FreeingAnObjectReleasesIt) {
    const auto check = [&](auto* free, auto* object) {
        free(mb, object);
        EXPECT_TRUE(CMIsNullObject(object));
        free(mb, nullptr);
    };
    check(mb->mft->freeInstance, newInstance());
    check(mb->mft->freeObjectPath, newPath());
    check(mb->mft->freeArgs, CMNewArgs(mb, nullptr));
    check(mb->mft->freeString, CMNewString(mb, "text", nullptr));
    check(mb->mft->freeArray, CMNewArray(mb, 1, CMPI_uint16, nullptr));
    check(mb->mft->freeDateTime, CMNewDateTime(mb, nullptr));
    mb->mft->freeSelectExp(mb, nullptr);
    EXPECT_EQ("", request.misuse());
}

} // namespace
} // namespace ObjectManager

/* Tests that values of every type are the same after they were stored in CMPI objects. */
#include "RequestTest.h"

#include <functional>

namespace ObjectManager {
namespace {

ObjectPath somePath() {
    return {"host", "root/cimv2", "Test_Disk", {{"Name", stringValue("a")}}};
}

Value instanceValue() {
    return {CMPI_instance, std::make_shared<const Instance>(Instance{somePath(), {{"Size", stringValue("5")}}})};
}

class ValuesTest : public RequestTest, public testing::WithParamInterface<Value> {
protected:
    CMPIArgs* args = CMNewArgs(mb, nullptr);

    /** The argument that getArg returns, after it was added to other arguments with the same type. */
    Value passedOn(const CMPIArgs* from) {
        const CMPIData data = CMGetArg(from, "Value", &status);
        EXPECT_EQ(CMPI_RC_OK, status.rc);
        const CMPIValue* value = CMIsNullValue(data) ? nullptr : &data.value;
        EXPECT_EQ(CMPI_RC_OK, CMAddArg(args, "Value", value, data.type).rc);
        return argumentsOf(args).at(0).value;
    }
};

TEST_P(ValuesTest, PassUnchangedThroughObjects) {
    EXPECT_EQ(GetParam(), passedOn(request.arguments({{"Value", GetParam()}})));
}

TEST_P(ValuesTest, PassUnchangedAsElementsOfArrays) {
    const Value array = arrayValue(GetParam().type, {GetParam(), nullValue(GetParam().type)});
    if ((GetParam().type & CMPI_ARRAY) == 0) {
        EXPECT_EQ(array, passedOn(request.arguments({{"Value", array}})));
    }
}

TEST_P(ValuesTest, AreTheSameInAClone) {
    CMPIArgs* original = request.arguments({{"Value", GetParam()}});
    CMPIArgs* cloned = CMClone(original, nullptr);
    EXPECT_EQ(CMPI_RC_OK, CMRelease(original).rc);
    EXPECT_EQ(GetParam(), passedOn(cloned));
    EXPECT_EQ(CMPI_RC_OK, CMRelease(cloned).rc);
}

INSTANTIATE_TEST_SUITE_P(
    , ValuesTest,
    testing::Values(booleanValue(true), booleanValue(false), Value{CMPI_char16, u'\u20ac'},
                    unsignedValue(CMPI_uint8, 0xff), unsignedValue(CMPI_uint16, 0xffff),
                    unsignedValue(CMPI_uint32, 0xffffffff), unsignedValue(CMPI_uint64, UINT64_MAX),
                    signedValue(CMPI_sint8, -128), signedValue(CMPI_sint16, -32768),
                    signedValue(CMPI_sint32, INT32_MIN), signedValue(CMPI_sint64, INT64_MIN),
                    realValue(CMPI_real32, 0.5), realValue(CMPI_real64, 1e300), stringValue(""),
                    stringValue(std::string(2000, 'x')), dateTimeValue("20260228235959.123456+000"),
                    referenceValue(somePath()), instanceValue(), nullValue(CMPI_uint16), nullValue(CMPI_string),
                    nullValue(CMPI_uint16A), arrayValue(CMPI_uint16, {}),
                    arrayValue(CMPI_uint16, {unsignedValue(CMPI_uint16, 3), unsignedValue(CMPI_uint16, 4)}),
                    arrayValue(CMPI_string, {stringValue("a"), stringValue("b")})));

class GivenValuesTest : public RequestTest {
protected:
    CMPIObjectPath* path = newPath();
};

TEST_F(GivenValuesTest, CharsAreTheTextItselfAndReadBackAsString) {
    std::string given = "changed afterwards";
    CMAddKey(path, "Name", given.c_str(), CMPI_chars);
    given.assign(given.size(), '-');
    const CMPIData key = CMGetKey(path, "Name", &status);
    EXPECT_EQ(CMPI_string, key.type);
    EXPECT_EQ("changed afterwards", text(key));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(GivenValuesTest, NoMoreBytesAreReadThanTheTypeHas) {
    const auto number = std::make_unique<CMPIUint16>(CMPIUint16{7}); // a sanitizer would report a read beyond its end
    CMAddKey(path, "Number", number.get(), CMPI_uint16);
    const auto truth = std::make_unique<CMPIBoolean>(CMPIBoolean{1});
    CMAddKey(path, "Truth", truth.get(), CMPI_boolean);
    EXPECT_EQ(7, CMGetKey(path, "Number", nullptr).value.uint16);
    EXPECT_EQ(1, CMGetKey(path, "Truth", nullptr).value.boolean);
}

TEST_F(GivenValuesTest, AMissingValueIsANullValueOfItsType) {
    CMAddKey(path, "Name", nullptr, CMPI_chars);
    CMAddKey(path, "Number", nullptr, CMPI_uint16);
    CMPIValue noString{};
    CMAddKey(path, "Text", &noString, CMPI_string);
    CMAddKey(path, "Array", &noString, CMPI_uint16A);
    CMAddKey(path, "Reference", &noString, CMPI_ref);
    for (const auto& [name, type] : std::vector<std::pair<const char*, CMPIType>>{{"Name", CMPI_string},
                                                                                  {"Number", CMPI_uint16},
                                                                                  {"Text", CMPI_string},
                                                                                  {"Array", CMPI_uint16A},
                                                                                  {"Reference", CMPI_ref}}) {
        const CMPIData data = CMGetKey(path, name, &status);
        EXPECT_EQ(CMPI_RC_OK, status.rc) << name;
        EXPECT_TRUE(CMIsNullValue(data)) << name;
        EXPECT_EQ(type, data.type) << name;
        EXPECT_EQ(nullptr, data.value.string) << name;
    }
}

TEST_F(GivenValuesTest, ObjectsAreCopied) {
    CMPIObjectPath* disk = newPath();
    CMAddKey(disk, "Name", "before", CMPI_chars);
    CMAddKey(path, "Disk", &disk, CMPI_ref);
    CMAddKey(disk, "Name", "after", CMPI_chars);
    EXPECT_EQ("before", text(CMGetKey(CMGetKey(path, "Disk", nullptr).value.ref, "Name", nullptr)));
}

TEST_F(GivenValuesTest, AnObjectThatIsReadIsACopy) {
    CMAddKey(path, "Name", "a", CMPI_chars);
    CMPIString* name = CMGetKey(path, "Name", nullptr).value.string;
    EXPECT_EQ(CMPI_RC_OK, CMRelease(name).rc);
    EXPECT_EQ("a", text(CMGetKey(path, "Name", nullptr)));
    EXPECT_EQ("", request.misuse());
}

TEST_F(GivenValuesTest, AnArrayOfAnotherTypeIsAMismatch) {
    const CMPIArray* array = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    EXPECT_EQ(CMPI_RC_ERR_TYPE_MISMATCH, CMAddKey(path, "Array", &array, CMPI_uint32A).rc);
    EXPECT_EQ(CMPI_RC_OK, CMAddKey(path, "Array", &array, CMPI_uint16A).rc);
}

TEST_F(GivenValuesTest, ObjectsThatHoldNothingAreRefused) {
    CMPIString* string = CMNewString(mb, "text", nullptr);
    CMRelease(string);
    EXPECT_EQ(CMPI_RC_ERR_INVALID_HANDLE, CMAddKey(path, "Name", &string, CMPI_string).rc);
    EXPECT_EQ(0U, CMGetKeyCount(path, nullptr));
    EXPECT_EQ("used a CMPIString after it was released", request.misuse());
}

} // namespace
} // namespace ObjectManager

#include "model/DateTime.h"

#include "RequestTest.h"

namespace ObjectManager {
namespace {

using testing::Values;

struct DateTimeCase {
    const char* text;
    std::uint64_t microseconds;
    bool interval;
    /** The text that the value has when it is written again: in UTC, and without asterisks. */
    const char* written;
};

class ValidDateTime : public testing::TestWithParam<DateTimeCase> {};

TEST_P(ValidDateTime, IsReadAndWritten) {
    const std::optional<DateTime> value = parseDateTime(GetParam().text);
    ASSERT_TRUE(value);
    EXPECT_EQ(GetParam().microseconds, value->microseconds);
    EXPECT_EQ(GetParam().interval, value->interval);
    EXPECT_EQ(GetParam().written, formatDateTime(*value));
}

INSTANTIATE_TEST_SUITE_P(
    , ValidDateTime,
    Values(DateTimeCase{"19700101000000.000000+000", 0, false, "19700101000000.000000+000"},
           DateTimeCase{"20260228235959.123456+000", 1772323199123456, false, "20260228235959.123456+000"},
           DateTimeCase{"20240229120000.000000+060", 1709204400000000, false, "20240229110000.000000+000"},
           DateTimeCase{"20240229120000.000000-300", 1709226000000000, false, "20240229170000.000000+000"},
           DateTimeCase{"99991231235959.999999+000", 253402300799999999, false, "99991231235959.999999+000"},
           DateTimeCase{"202602********.******+000", 1769904000000000, false, "20260201000000.000000+000"},
           DateTimeCase{"20260201000000.1234**+000", 1769904000123400, false, "20260201000000.123400+000"},
           DateTimeCase{"00000001122334.567890:000", 131014567890, true, "00000001122334.567890:000"},
           DateTimeCase{"99999999235959.999999:000", 8639999999999999999U, true, "99999999235959.999999:000"}));

class InvalidDateTime : public testing::TestWithParam<const char*> {};

TEST_P(InvalidDateTime, IsRefused) {
    EXPECT_FALSE(parseDateTime(GetParam()));
}

INSTANTIATE_TEST_SUITE_P(, InvalidDateTime,
                         Values("", "2026", "20260228235959.123456+0000", "20260230000000.000000+000",
                                "20261301000000.000000+000", "20260001000000.000000+000", "20260101240000.000000+000",
                                "20260101006000.000000+000", "20260101000060.000000+000", "20260101000000,000000+000",
                                "20260101000000.000000*000", "20260101000000.00000a+000", "20260101000000.0*0000+000",
                                "2026-1-1000000.000000+000", "19691231235959.000000+000", "19700101000000.000000+060",
                                "00000001250000.000000:000", "00000001000000.000000:001", "0000000 000000.000000:000"));

TEST(DateTimeTest, ValuesThatDoNotFitTheFormAreNotWritten) {
    EXPECT_FALSE(formatDateTime({253402300800000000, false}));
    EXPECT_FALSE(formatDateTime({8640000000000000000U, true}));
    EXPECT_FALSE(formatDateTime({UINT64_MAX, false}));
}

class DateTimeObjectTest : public RequestTest {};

TEST_F(DateTimeObjectTest, KeepsTheTextThatItWasMadeFrom) {
    const CMPIDateTime* dateTime = CMNewDateTimeFromChars(mb, "20240229120000.000000+060", &status);
    ASSERT_NE(nullptr, dateTime);
    EXPECT_EQ("20240229120000.000000+060", text(CMGetStringFormat(dateTime, nullptr)));
    EXPECT_EQ(1709204400000000U, CMGetBinaryFormat(dateTime, nullptr));
    EXPECT_FALSE(CMIsInterval(dateTime, &status));
    EXPECT_EQ(CMPI_RC_OK, status.rc);
}

TEST_F(DateTimeObjectTest, IsMadeFromMicroseconds) {
    const CMPIDateTime* interval = CMNewDateTimeFromBinary(mb, 60'000'000, 1, nullptr);
    EXPECT_EQ("00000000000100.000000:000", text(CMGetStringFormat(interval, nullptr)));
    EXPECT_TRUE(CMIsInterval(interval, nullptr));
    EXPECT_EQ(nullptr, CMNewDateTimeFromBinary(mb, UINT64_MAX, 0, &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
}

TEST_F(DateTimeObjectTest, IsNowIfItIsMadeWithoutAText) {
    const auto now = static_cast<CMPIUint64>(time(nullptr)) * 1'000'000;
    const CMPIUint64 made = CMGetBinaryFormat(CMNewDateTime(mb, nullptr), nullptr);
    EXPECT_THAT(made, testing::AllOf(testing::Ge(now), testing::Lt(now + 60'000'000)));
}

TEST_F(DateTimeObjectTest, IsNotMadeFromAnotherText) {
    EXPECT_EQ(nullptr, CMNewDateTimeFromChars(mb, "yesterday", &status));
    EXPECT_EQ(CMPI_RC_ERR_INVALID_PARAMETER, status.rc);
}

} // namespace
} // namespace ObjectManager

#include "classes/Literals.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <utility>

namespace ObjectManager {
namespace {

using testing::HasSubstr;

struct TextOfType {
    std::string text;
    Value value;
};

class LiteralTest : public testing::TestWithParam<TextOfType> {};

TEST_P(LiteralTest, MeansItsValue) {
    EXPECT_EQ(valueOfText(GetParam().text, GetParam().value.type), GetParam().value);
}

INSTANTIATE_TEST_SUITE_P(
    ofEveryType, LiteralTest,
    testing::Values(
        TextOfType{"0", unsignedValue(CMPI_uint8, 0)}, TextOfType{"255", unsignedValue(CMPI_uint8, 255)},
        TextOfType{"65535", unsignedValue(CMPI_uint16, 65535)}, TextOfType{"+5", unsignedValue(CMPI_uint16, 5)},
        TextOfType{"-0", unsignedValue(CMPI_uint16, 0)}, TextOfType{"0x7fff", unsignedValue(CMPI_uint16, 32767)},
        TextOfType{"017", unsignedValue(CMPI_uint16, 15)}, TextOfType{"101b", unsignedValue(CMPI_uint16, 5)},
        TextOfType{"4294967295", unsignedValue(CMPI_uint32, 4294967295)},
        TextOfType{"18446744073709551615", unsignedValue(CMPI_uint64, std::numeric_limits<std::uint64_t>::max())},
        TextOfType{"-128", signedValue(CMPI_sint8, -128)}, TextOfType{"127", signedValue(CMPI_sint8, 127)},
        TextOfType{"-32768", signedValue(CMPI_sint16, -32768)},
        TextOfType{"-2147483648", signedValue(CMPI_sint32, -2147483648LL)},
        TextOfType{"-9223372036854775808", signedValue(CMPI_sint64, std::numeric_limits<std::int64_t>::min())},
        TextOfType{"9223372036854775807", signedValue(CMPI_sint64, std::numeric_limits<std::int64_t>::max())},
        TextOfType{"1.5", realValue(CMPI_real32, 1.5)}, TextOfType{"-1e300", realValue(CMPI_real64, -1e300)},
        TextOfType{"true", booleanValue(true)}, TextOfType{"FALSE", booleanValue(false)},
        TextOfType{"x", Value{CMPI_char16, u'x'}}, TextOfType{"\u00e4", Value{CMPI_char16, u'\u00e4'}},
        TextOfType{"\u96fb", Value{CMPI_char16, u'\u96fb'}}, TextOfType{"", stringValue("")},
        TextOfType{"a \"b\" \\", stringValue("a \"b\" \\")},
        TextOfType{"20261120123107.123456+060", dateTimeValue("20261120123107.123456+060")},
        TextOfType{"00000001000000.000000:000", dateTimeValue("00000001000000.000000:000")}));

struct NoValue {
    std::string text;
    CMPIType type;
    std::string expected;
};

class NoLiteralTest : public testing::TestWithParam<NoValue> {};

TEST_P(NoLiteralTest, SaysWhatWasExpected) {
    try {
        valueOfText(GetParam().text, GetParam().type);
        FAIL() << GetParam().text << " was taken";
    } catch (const LiteralError& error) {
        EXPECT_THAT(error.what(), HasSubstr("found '" + GetParam().text + "', expected " + GetParam().expected));
    }
}

INSTANTIATE_TEST_SUITE_P(
    ofEveryType, NoLiteralTest,
    testing::Values(
        NoValue{"65536", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"-1", CMPI_uint16, "a uint16 from 0 to 65535"}, NoValue{"", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"5 ", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"five", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"08", CMPI_uint16, "a uint16 from 0 to 65535"}, NoValue{"0x", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"12b", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"1.0", CMPI_uint16, "a uint16 from 0 to 65535"},
        NoValue{"--5", CMPI_sint16, "a sint16 from -32768 to 32767"},
        NoValue{"18446744073709551616", CMPI_uint64, "a uint64 from 0 to 18446744073709551615"},
        NoValue{"-9223372036854775809", CMPI_sint64, "a sint64 from -9223372036854775808 to 9223372036854775807"},
        NoValue{"128", CMPI_sint8, "a sint8 from -128 to 127"}, NoValue{"1e39", CMPI_real32, "a real32"},
        NoValue{"inf", CMPI_real64, "a real64"}, NoValue{"1.5x", CMPI_real64, "a real64"},
        NoValue{"1", CMPI_boolean, "TRUE or FALSE"}, NoValue{"xy", CMPI_char16, "one character"},
        NoValue{"", CMPI_char16, "one character"}, NoValue{"\xc1\x81", CMPI_char16, "one character"},
        NoValue{"tomorrow", CMPI_dateTime, "a datetime"},
        NoValue{"20261320123107.123456+060", CMPI_dateTime, "a datetime"},
        NoValue{"20261120123107.123456+6", CMPI_dateTime, "a datetime"},
        NoValue{"00000001000000.000000:060", CMPI_dateTime, "a datetime"}));

TEST(Literals, WithoutADeclaredTypeMeanWhatTheyLookLike) {
    EXPECT_EQ(valueOfUntypedText("TRUE"), booleanValue(true));
    EXPECT_EQ(valueOfUntypedText("-5"), signedValue(CMPI_sint64, -5));
    EXPECT_EQ(valueOfUntypedText("9223372036854775808"), unsignedValue(CMPI_uint64, 9223372036854775808U));
    EXPECT_EQ(valueOfUntypedText("1.5"), realValue(CMPI_real64, 1.5));
    EXPECT_EQ(valueOfUntypedText("-9223372036854775808"),
              signedValue(CMPI_sint64, std::numeric_limits<std::int64_t>::min()));
    EXPECT_EQ(valueOfUntypedText("text"), std::nullopt);
    EXPECT_EQ(valueOfUntypedText("18446744073709551616"), std::nullopt);
    EXPECT_EQ(valueOfUntypedText("-9223372036854775809"), std::nullopt);
}

struct QuotedText {
    std::string text;
    std::string literal;
};

class QuotedTextTest : public testing::TestWithParam<QuotedText> {};

TEST_P(QuotedTextTest, IsWrittenWithItsEscapesAndReadBack) {
    EXPECT_EQ(inQuotes(GetParam().text), GetParam().literal);
    std::size_t position = 3;
    EXPECT_EQ(readQuoted("..." + GetParam().literal + "...", position), GetParam().text);
    EXPECT_EQ(position, 3 + GetParam().literal.size());
}

INSTANTIATE_TEST_SUITE_P(texts, QuotedTextTest,
                         testing::Values(QuotedText{"", "\"\""}, QuotedText{"a b", "\"a b\""},
                                         QuotedText{"say \"no\"", R"("say \"no\"")"}, QuotedText{"it's", R"("it's")"},
                                         QuotedText{R"(C:\x)", R"("C:\\x")"},
                                         QuotedText{"a\nb\tc\r\b\f", R"("a\nb\tc\r\b\f")"},
                                         QuotedText{"\x01\x7f", R"("\x0001\x007f")"},
                                         QuotedText{"\u96fb\u6e90", "\"\u96fb\u6e90\""}));

TEST(QuotedLiteral, MayHaveAnyCharacterByItsNumber) {
    std::size_t position = 0;
    EXPECT_EQ(readQuoted(R"("\x41\xE4\x96fb.")", position), "A\u00e4\u96fb.");
}

struct BadQuotedText {
    std::string literal;
    std::size_t position;
    std::string found;
};

class BadQuotedTextTest : public testing::TestWithParam<BadQuotedText> {};

TEST_P(BadQuotedTextTest, SaysWhereAndWhatWasFound) {
    std::size_t position = 0;
    try {
        readQuoted(GetParam().literal, position);
        FAIL() << GetParam().literal << " was taken";
    } catch (const LiteralError& error) {
        EXPECT_EQ(error.position(), GetParam().position);
        EXPECT_THAT(error.what(), HasSubstr(GetParam().found));
    }
}

INSTANTIATE_TEST_SUITE_P(texts, BadQuotedTextTest,
                         testing::Values(BadQuotedText{R"("abc)", 0, "found no closing \""},
                                         BadQuotedText{R"('abc")", 0, "found no closing '"},
                                         BadQuotedText{R"("abc\)", 0, "found no closing \""},
                                         BadQuotedText{R"("ab\qc")", 3, R"(found the escape '\q')"},
                                         BadQuotedText{R"("ab\xq")", 3, R"(found the escape '\x')"}));

TEST(TypeNames, AreReadInAnyCaseAndWrittenAsDeclared) {
    EXPECT_EQ(typeByName("UInt16"), CMPI_uint16);
    EXPECT_EQ(typeByName("datetime"), CMPI_dateTime);
    EXPECT_EQ(typeByName("integer"), std::nullopt);
    EXPECT_EQ(typeName(CMPI_uint16A), "uint16[]");
    EXPECT_EQ(typeName(CMPI_ref), "reference");
    EXPECT_EQ(typeName(CMPI_instance), "instance");
    EXPECT_EQ(typeName(CMPI_args), "type 0x1200");
}

} // namespace
} // namespace ObjectManager

#include "cimxml/ValueReader.h"

#include <gtest/gtest.h>

#include <optional>

namespace ObjectManager::CimXml {
namespace {

/** The value; no value if the text is refused. */
std::optional<Value> read(const std::string& text, CMPIType type) {
    try {
        return valueOfWireText(text, type);
    } catch (const CimError& error) {
        EXPECT_EQ(error.code, CMPI_RC_ERR_INVALID_PARAMETER);
        return std::nullopt;
    }
}

struct Read {
    std::string text;
    Value value;
};

class WireText : public testing::TestWithParam<Read> {};

TEST_P(WireText, IsReadAsItsType) {
    const auto value = read(GetParam().text, GetParam().value.type);
    ASSERT_TRUE(value.has_value()) << GetParam().text;
    EXPECT_TRUE(*value == GetParam().value) << GetParam().text;
}

INSTANTIATE_TEST_SUITE_P(
    Values, WireText,
    testing::Values(Read{"TRUE", booleanValue(true)}, Read{" false\n", booleanValue(false)},
                    Read{"0", unsignedValue(CMPI_uint8, 0)}, Read{"+7", unsignedValue(CMPI_uint8, 7)},
                    Read{"0017", unsignedValue(CMPI_uint16, 17)}, Read{"000", unsignedValue(CMPI_uint16, 0)},
                    Read{"0xFF", unsignedValue(CMPI_uint8, 255)}, Read{"-128", signedValue(CMPI_sint8, -128)},
                    Read{"18446744073709551615", unsignedValue(CMPI_uint64, 18446744073709551615U)},
                    Read{"1.5", realValue(CMPI_real32, 1.5)}, Read{"-1E3", realValue(CMPI_real64, -1000)},
                    Read{" a ", stringValue(" a ")}, Read{"", stringValue("")},
                    Read{" 20260101000000.000000+000 ", dateTimeValue("20260101000000.000000+000")}));

struct Refused {
    std::string text;
    CMPIType type;
};

class RefusedWireText : public testing::TestWithParam<Refused> {};

TEST_P(RefusedWireText, IsNoValueOfTheType) {
    EXPECT_FALSE(read(GetParam().text, GetParam().type).has_value());
}

INSTANTIATE_TEST_SUITE_P(
    Values, RefusedWireText,
    testing::Values(Refused{"yes", CMPI_boolean}, Refused{"", CMPI_boolean}, Refused{"256", CMPI_uint8},
                    Refused{"-1", CMPI_uint8}, Refused{"18446744073709551616", CMPI_uint64},
                    Refused{"99999999999999999999999999", CMPI_sint64}, Refused{"128", CMPI_sint8},
                    Refused{"101b", CMPI_uint8}, Refused{"1 2", CMPI_uint8}, Refused{"1.0", CMPI_uint8},
                    Refused{"", CMPI_uint8}, Refused{"-", CMPI_sint8}, Refused{"0x", CMPI_uint8},
                    Refused{"1e39", CMPI_real32}, Refused{"1e400", CMPI_real64}, Refused{"nan", CMPI_real64},
                    Refused{"ab", CMPI_char16}, Refused{"", CMPI_char16}, Refused{"\xF0\x9F\x94\x8C", CMPI_char16},
                    Refused{"20261301000000.000000+000", CMPI_dateTime}, Refused{"", CMPI_dateTime}));

} // namespace
} // namespace ObjectManager::CimXml

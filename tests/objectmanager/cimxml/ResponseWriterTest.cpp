#include "cimxml/ResponseWriter.h"

#include "classes/MofReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <memory>

namespace ObjectManager::CimXml {
namespace {

using testing::HasSubstr;

class ResponseWriterTest : public testing::Test {
protected:
    /** The text that a writer writes when `write` uses it. */
    template <typename Write>
    std::string written(Write write) {
        ResponseWriter writer(_catalogue, "host.example", "root/cimv2");
        write(writer);
        return writer.take();
    }

    std::string written(const Value& value) {
        return written([&](ResponseWriter& writer) { writer.value(value); });
    }

    std::string property(const Value& value) {
        return written([&](ResponseWriter& writer) {
            writer.instance({{"", "", "Test_Any", {}}, {{"P", value}}}, {});
        });
    }

    const Catalogue _catalogue{readMof("class Test_Any { [Key] string Name; uint16 P[]; };", "any.mof")};
};

TEST_F(ResponseWriterTest, WritesScalars) {
    EXPECT_EQ(written(booleanValue(false)), "<VALUE>FALSE</VALUE>");
    EXPECT_EQ(written(signedValue(CMPI_sint64, std::numeric_limits<std::int64_t>::min())),
              "<VALUE>-9223372036854775808</VALUE>");
    EXPECT_EQ(written(Value{CMPI_char16, u'\u00e4'}), "<VALUE>\xC3\xA4</VALUE>");
    EXPECT_EQ(written(stringValue("")), "<VALUE></VALUE>");
    EXPECT_EQ(written(nullValue(CMPI_string)), "");
}

TEST_F(ResponseWriterTest, WritesRealsWithAPointAndAsShortAsTheirTypeAllows) {
    EXPECT_EQ(written(realValue(CMPI_real64, 5)), "<VALUE>5.0</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real64, -0.25)), "<VALUE>-0.25</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real64, 1e100)), "<VALUE>1.0e+100</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real64, 1.5e-9)), "<VALUE>1.5e-09</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real64, 0.1F)), "<VALUE>0.10000000149011612</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real32, 0.1F)), "<VALUE>0.1</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real64, -std::numeric_limits<double>::infinity())), "<VALUE>-INF</VALUE>");
    EXPECT_EQ(written(realValue(CMPI_real64, std::numeric_limits<double>::quiet_NaN())), "<VALUE>NaN</VALUE>");
}

TEST_F(ResponseWriterTest, WritesArrays) {
    EXPECT_EQ(written(arrayValue(CMPI_uint16, {})), "<VALUE.ARRAY></VALUE.ARRAY>");
    EXPECT_EQ(written(arrayValue(CMPI_uint16, {unsignedValue(CMPI_uint16, 1), nullValue(CMPI_uint16)})),
              "<VALUE.ARRAY><VALUE>1</VALUE><VALUE.NULL/></VALUE.ARRAY>");
}

TEST_F(ResponseWriterTest, WritesReferencesInTheNamespaceOfTheRequestWhereTheyNameNone) {
    EXPECT_EQ(written(referenceValue({"far.example", "root/a/b", "Test_Any", {{"Name", stringValue("<")}}})),
              "<VALUE.REFERENCE>\n<LOCALINSTANCEPATH>\n"
              "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"a\"/><NAMESPACE NAME=\"b\"/>"
              "</LOCALNAMESPACEPATH>\n"
              "<INSTANCENAME CLASSNAME=\"Test_Any\">\n"
              "<KEYBINDING NAME=\"Name\"><KEYVALUE VALUETYPE=\"string\" TYPE=\"string\">&lt;</KEYVALUE></KEYBINDING>\n"
              "</INSTANCENAME>\n</LOCALINSTANCEPATH>\n</VALUE.REFERENCE>\n");
    EXPECT_EQ(written(referenceValue({"", "", "Test_Any", {}})),
              "<VALUE.REFERENCE>\n<LOCALCLASSPATH>\n"
              "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/></LOCALNAMESPACEPATH>\n"
              "<CLASSNAME NAME=\"Test_Any\"/>\n</LOCALCLASSPATH>\n</VALUE.REFERENCE>\n");
}

TEST_F(ResponseWriterTest, NamesTheKindOfKeys) {
    const std::string name = written([](ResponseWriter& writer) {
        writer.instanceName({"",
                             "",
                             "C",
                             {{"B", booleanValue(true)},
                              {"N", signedValue(CMPI_sint8, -1)},
                              {"D", dateTimeValue("20260101000000.000000+000")}}});
    });
    EXPECT_THAT(name, HasSubstr("<KEYVALUE VALUETYPE=\"boolean\" TYPE=\"boolean\">TRUE</KEYVALUE>"));
    EXPECT_THAT(name, HasSubstr("<KEYVALUE VALUETYPE=\"numeric\" TYPE=\"sint8\">-1</KEYVALUE>"));
    EXPECT_THAT(name,
                HasSubstr("<KEYVALUE VALUETYPE=\"string\" TYPE=\"datetime\">20260101000000.000000+000</KEYVALUE>"));
}

TEST_F(ResponseWriterTest, WritesPropertiesWithTheTypeOfTheirValueElseOfTheirDeclaration) {
    EXPECT_THAT(property(unsignedValue(CMPI_uint8, 1)),
                HasSubstr("<PROPERTY NAME=\"P\" TYPE=\"uint8\"><VALUE>1</VALUE></PROPERTY>"));
    EXPECT_THAT(property(nullValue(CMPI_null)),
                HasSubstr("<PROPERTY.ARRAY NAME=\"P\" TYPE=\"uint16\"></PROPERTY.ARRAY>"));
    EXPECT_THAT(property(nullValue(CMPI_ref)), HasSubstr("<PROPERTY.REFERENCE NAME=\"P\"></PROPERTY.REFERENCE>"));
}

TEST_F(ResponseWriterTest, WritesAnEmbeddedInstanceAsText) {
    const Value embedded{CMPI_instance, std::make_shared<const Instance>(
                                            Instance{{"", "", "Inner", {}}, {{"T", stringValue("a & b")}}})};
    EXPECT_THAT(property(embedded),
                HasSubstr("<PROPERTY NAME=\"P\" TYPE=\"string\" EmbeddedObject=\"instance\"><VALUE>"
                          "&lt;INSTANCE CLASSNAME=\"Inner\"&gt;\n"
                          "&lt;PROPERTY NAME=\"T\" TYPE=\"string\"&gt;&lt;VALUE&gt;a &amp;amp; b&lt;/VALUE&gt;"
                          "&lt;/PROPERTY&gt;\n&lt;/INSTANCE&gt;\n</VALUE></PROPERTY>"));
}

TEST_F(ResponseWriterTest, TellsOfCodesThatAreNoneOfCimAsFailures) {
    const auto error = [&](CMPIrc code) {
        return written([&](ResponseWriter& writer) { writer.error(code, "\"why\""); });
    };
    EXPECT_EQ(error(CMPI_RC_ERR_METHOD_NOT_FOUND), "<ERROR CODE=\"17\" DESCRIPTION=\"&quot;why&quot;\"/>\n");
    EXPECT_EQ(error(CMPI_RC_ERROR_SYSTEM), "<ERROR CODE=\"1\" DESCRIPTION=\"&quot;why&quot;\"/>\n");
}

} // namespace
} // namespace ObjectManager::CimXml

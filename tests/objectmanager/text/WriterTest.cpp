#include "text/Writer.h"
#include "basics/Files.h"
#include "classes/MofReader.h"
#include "text/MofText.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <sstream>
#include <string>

namespace ObjectManager {
namespace {

constexpr const char* schema = R"mof(
    [Abstract, Version("1.0.0")]
    class Base {
        [Key, Description("Which one.")] string Name;
        sint16 Level = -1;
    };
    class Thing : Base {
        [ValueMap{"2", "5", "8", "9", "10", "11", "12"},
         Values{"On", "Power Cycle (Off-Soft)",
                     "Off-Soft", "Power Cycle (Off-Hard)", "Master Bus Reset", "Diagnostic Interrupt (NMI)",
                     "Off-Soft Graceful"
}]
        uint16 States[];
Thing REF Next;
[ ValueMap{"0", "1"},
  Values{"Done", "Not Done"} ] uint32 Do([ In, ValueMap{"5"}, Values{"Reboot"} ] uint16 How,
                                         [ In(false), Out, ValueMap{"7"}, Values{"Seven"} ] uint8 Got);
};)mof";

/** An instance with a property of every type. */
Instance thing() {
    const ObjectPath next{"host", "root/cimv2", "Thing", {{"Name", stringValue("a \"b\"")}}};
    const Instance embedded{{"", "", "Part", {}},
                            {{"Text", stringValue("in")}, {"Count", unsignedValue(CMPI_uint8, 1)}}};
    Value::Array states;
    for (const std::uint64_t state : {2, 5, 8, 9, 10, 11, 12}) {
        states.push_back(unsignedValue(CMPI_uint16, state));
    }
    return {{"host", "root/cimv2", "Thing", {{"Name", stringValue("one")}}},
            {{"Name", stringValue("one")},
             {"Level", signedValue(CMPI_sint16, -1)},
             {"States", arrayValue(CMPI_uint16, states)},
             {"Next", referenceValue(next)},
             {"Text", stringValue("line one\nline \"two\"")},
             {"Wide", stringValue("\u96fb\u6e90 \u00e4")},
             {"Flag", booleanValue(true)},
             {"Large", unsignedValue(CMPI_uint64, ~std::uint64_t{0})},
             {"Ratio", realValue(CMPI_real32, 0.1F)},
             {"Whole", realValue(CMPI_real64, 3)},
             {"Letter", Value{CMPI_char16, u'\''}},
             {"When", dateTimeValue("20261120123107.123456+060")},
             {"Nothing", nullValue(CMPI_string)},
             {"Texts", arrayValue(CMPI_string, {stringValue("a"), stringValue("b, c")})},
             {"None", arrayValue(CMPI_uint16, {})},
             {"Part", Value{CMPI_instance, std::make_shared<const Instance>(embedded)}}}};
}

std::string dataFile(const std::string& name) {
    return contentOf(std::string(ORV_TEST_DATA) + "/" + name);
}

struct FormatName {
    Format format;
    const char* name;
};

/** The file data/<answer>.<format> has the expected text of an answer in a format. */
class WriterTest : public testing::TestWithParam<FormatName> {
protected:
    void expectFile(const std::string& answer) const {
        EXPECT_EQ(_out.str(), dataFile(answer + "." + GetParam().name));
    }

    Catalogue _catalogue{readMof(schema, "x.mof")};
    std::ostringstream _out;
    std::unique_ptr<Writer> _writer = makeWriter(GetParam().format, _out, _catalogue);
};

INSTANTIATE_TEST_SUITE_P(formats, WriterTest,
                         testing::Values(FormatName{Format::table, "table"}, FormatName{Format::json, "json"},
                                         FormatName{Format::mof, "mof"}),
                         [](const auto& format) { return std::string(format.param.name); });

TEST_P(WriterTest, WritesNames) {
    ObjectPath second = thing().path;
    second.keys = {{"Name", stringValue("say \"no\"")}};
    _writer->names({thing().path, second});
    expectFile("names");
}

TEST_P(WriterTest, WritesOneInstance) {
    _writer->instance(thing());
    expectFile("instance");
}

TEST_P(WriterTest, WritesInstances) {
    _writer->instances({{{"", "root/cimv2", "Thing", {}}, {{"Name", stringValue("one")}}},
                        {{"", "root/cimv2", "Unknown", {}}, {{"Name", stringValue("two")}}}});
    expectFile("instances");
}

TEST_P(WriterTest, WritesAssociatedNamesByTheirAssociation) {
    _writer->associatedNames({{"Has", {thing().path, thing().path}}, {"Knows", {thing().path}}});
    expectFile("associatedNames");
}

TEST_P(WriterTest, WritesAssociatedInstancesByTheirAssociation) {
    const Instance one{{"", "root/cimv2", "Thing", {}}, {{"Name", stringValue("one")}}};
    _writer->associatedInstances({{"Has", {one, one}}, {"Knows", {one}}});
    expectFile("associatedInstances");
}

TEST_P(WriterTest, WritesClasses) {
    _writer->classes({*_catalogue.find("Base"), *_catalogue.find("Thing")});
    expectFile("classes");
}

TEST_P(WriterTest, WritesTheResultOfAMethod) {
    _writer->methodResult(*_catalogue.find("Thing")->method("Do"), unsignedValue(CMPI_uint32, 1),
                          {{"Got", unsignedValue(CMPI_uint8, 7)}});
    expectFile("result");
}

TEST_P(WriterTest, WritesASummary) {
    _writer->summary(
        {{"NAME", "LEVEL"}, {"one", "-1"}},
        {{{"", "root/cimv2", "Thing", {}}, {{"Name", stringValue("one")}, {"Level", signedValue(CMPI_sint16, -1)}}}});
    expectFile("summary");
}

TEST_P(WriterTest, TakesATextThatIsNoUtf8) {
    _writer->instance({{"", "root/cimv2", "Thing", {}}, {{"Name", stringValue("a\xff")}}});
    EXPECT_THAT(_out.str(), testing::HasSubstr("a"));
}

TEST(MofText, OfAClassIsReadBackAsTheSameClass) {
    const auto declared = readMof(schema, "x.mof");
    for (const Class& each : declared.classes) {
        const auto again = readMof(mofClass(each), "x.mof").classes;
        ASSERT_EQ(again.size(), 1U);
        EXPECT_EQ(mofClass(again[0]), mofClass(each));
        EXPECT_EQ(again[0].properties.size(), each.properties.size());
        EXPECT_EQ(again[0].methods.size(), each.methods.size());
    }
}

} // namespace
} // namespace ObjectManager

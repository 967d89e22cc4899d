#include "text/ObjectPathText.h"
#include "classes/MofReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ObjectManager {
namespace {

using testing::IsEmpty;

class ObjectPathTextTest : public testing::Test {
protected:
    ObjectPath parse(const std::string& text) const { return parseObjectPath(text, _catalogue, "root/default"); }

    std::string errorOf(const std::string& text) const {
        try {
            parse(text);
            return "taken";
        } catch (const ObjectPathError& error) {
            return error.what();
        }
    }

    Catalogue _catalogue{readMof(R"(
        class Thing {
            [Key] string Name;
            [Key] uint16 Number;
            [Key] boolean Flag;
            [Key] char16 Letter;
            [Key] datetime When;
            [Key] real64 Ratio;
            string Caption;
        };
        class Link {
            [Key] Thing REF First;
            [Key] Link REF Second;
        };
        class Keyless {};)",
                                 "x.mof")};
};

TEST_F(ObjectPathTextTest, NamesAClass) {
    const ObjectPath path = parse("root/cimv2:Thing");
    EXPECT_EQ(path.host, "");
    EXPECT_EQ(path.nameSpace, "root/cimv2");
    EXPECT_EQ(path.className, "Thing");
    EXPECT_THAT(path.keys, IsEmpty());
}

TEST_F(ObjectPathTextTest, HasTheDefaultNamespaceIfItNamesNone) {
    EXPECT_EQ(parse("Thing").nameSpace, "root/default");
    EXPECT_EQ(parse("Thing.Name=\"a:b\"").nameSpace, "root/default");
    EXPECT_EQ(parse("/root/cimv2:Thing").nameSpace, "root/cimv2");
}

TEST_F(ObjectPathTextTest, MayNameAHost) {
    const ObjectPath path = parse("//some.host:5989/root/cimv2:Thing.Number=1");
    EXPECT_EQ(path.host, "some.host:5989");
    EXPECT_EQ(path.nameSpace, "root/cimv2");
    EXPECT_EQ(path.className, "Thing");
}

TEST_F(ObjectPathTextTest, GivesKeysTheTypesThatTheClassDeclares) {
    const ObjectPath path =
        parse(R"(Thing.Name="5",Number=0x10,Flag=true,Letter='x',When="00000001000000.000000:000",Ratio=2)");
    EXPECT_EQ(find(path.keys, "Name")->value, stringValue("5"));
    EXPECT_EQ(find(path.keys, "Number")->value, unsignedValue(CMPI_uint16, 16));
    EXPECT_EQ(find(path.keys, "Flag")->value, booleanValue(true));
    EXPECT_EQ(find(path.keys, "Letter")->value, (Value{CMPI_char16, u'x'}));
    EXPECT_EQ(find(path.keys, "When")->value, dateTimeValue("00000001000000.000000:000"));
    EXPECT_EQ(find(path.keys, "Ratio")->value, realValue(CMPI_real64, 2));
}

TEST_F(ObjectPathTextTest, GivesKeysOfAnUnknownClassTheTypesThatTheyLookLike) {
    const ObjectPath path = parse(R"(Other.A="x:y.z=1",B=-5,C=FALSE,D='x',E=1.5)");
    EXPECT_EQ(find(path.keys, "A")->value, stringValue("x:y.z=1"));
    EXPECT_EQ(find(path.keys, "B")->value, signedValue(CMPI_sint64, -5));
    EXPECT_EQ(find(path.keys, "C")->value, booleanValue(false));
    EXPECT_EQ(find(path.keys, "D")->value, (Value{CMPI_char16, u'x'}));
    EXPECT_EQ(find(path.keys, "E")->value, realValue(CMPI_real64, 1.5));
}

TEST_F(ObjectPathTextTest, SpellsNamesAsTheyAreDeclared) {
    const ObjectPath path = parse("thing.NUMBER=1");
    EXPECT_EQ(path.className, "Thing");
    EXPECT_EQ(path.keys.at(0).name, "Number");
}

TEST_F(ObjectPathTextTest, ReadsReferencesInReferences) {
    const ObjectPath path = parse(R"(root/a:Link.First="Thing.Name=\"say \\\"no\\\"\"",)"
                                  R"(Second="//h/root/b:Link.First=\"root/c:Thing.Number=1\"")");
    const ObjectPath thing{"", "root/a", "Thing", {{"Name", stringValue("say \"no\"")}}};
    const ObjectPath inner{"", "root/c", "Thing", {{"Number", unsignedValue(CMPI_uint16, 1)}}};
    const ObjectPath link{"h", "root/b", "Link", {{"First", referenceValue(inner)}}};
    EXPECT_EQ(find(path.keys, "First")->value, referenceValue(thing));
    EXPECT_EQ(find(path.keys, "Second")->value, referenceValue(link));
}

TEST_F(ObjectPathTextTest, IsReadBackAsItWasWritten) {
    for (const char* text :
         {R"(root/cimv2:Thing)", R"(//h:1/root/cimv2:Thing)",
          R"(root/cimv2:Thing.Name="a \"b\" \\ c,d=e",Number=65535,Flag=TRUE,Letter='\'',Ratio=0.5)",
          R"(root/cimv2:Link.First="//h/root/a:Thing.Name=\"\\\"\\\\\"",Second="root/b:Link.Second=\"root/b:Link\"")",
          R"(root/cimv2:Other.Key="\n")"}) {
        EXPECT_EQ(formatObjectPath(parse(text)), text);
    }
}

TEST_F(ObjectPathTextTest, LeavesHostsOutOfALocalPathAtEveryDepth) {
    EXPECT_EQ(formatLocalPath(parse(R"(//h/root/a:Link.First="//h/root/a:Thing.Number=1")")),
              R"(root/a:Link.First="root/a:Thing.Number=1")");
}

TEST_F(ObjectPathTextTest, IsReportedWithThePositionWhereItIsWrong) {
    const std::pair<const char*, const char*> cases[] = {
        {"", "position 1: found the end, expected the name of a class"},
        {"root/cimv2:", "position 12: found the end, expected the name of a class"},
        {":Thing", "position 1: found ':', expected a namespace"},
        {"//host//root/cimv2:Thing", "position 8: found '/', expected a namespace"},
        {"//", "position 3: found the end, expected a host name"},
        {"//host", "position 7: found the end, expected '/' and a namespace"},
        {"//host/Thing", "position 13: found the end, expected ':' behind the namespace"},
        {"9Thing", "position 1: found '9', expected the name of a class"},
        {"Thing:", "position 7: found the end, expected the name of a class"},
        {"Thing Name", "position 6: found ' ', expected '.' and keys, or the end"},
        {"Thing.", "position 7: found the end, expected the name of a key"},
        {"Thing.Name", "position 11: found the end, expected '=' behind the key Name"},
        {"Thing.Name=", "position 12: found the end, expected a quoted string (quotes must be kept from the shell)"},
        {"Thing.Name=abc,Number=1",
         "position 12: found 'abc', expected a quoted string (quotes must be kept from the shell)"},
        {"Thing.Name=\"abc", "position 12: found no closing \", expected one for the \" here"},
        {"Thing.Name='abc'", "position 12: found a text in single quotes, expected a string in double quotes"},
        {"Thing.Name=\"a\"x", "position 15: found 'x', expected ',' and another key, or the end"},
        {"Thing.Name=\"a\",", "position 16: found the end, expected the name of a key"},
        {"Thing.Name=\"a\",name=\"b\"", "position 16: found 'name', expected every key once"},
        {"Thing.Nam=\"a\"",
         "position 7: found 'Nam', expected a key of Thing: Name, Number, Flag, Letter, When, Ratio"},
        {"Thing.Caption=\"a\"",
         "position 7: found 'Caption', expected a key of Thing: Name, Number, Flag, Letter, When, Ratio"},
        {"Keyless.A=1", "position 9: found 'A', expected a key of Keyless: none"},
        {"Thing.Number=65536", "position 14: found '65536', expected a uint16 from 0 to 65535"},
        {"Thing.Number=\"5\"", "position 14: found a quoted text, expected a uint16"},
        {"Thing.Flag=yes", "position 12: found 'yes', expected TRUE or FALSE"},
        {"Thing.Letter='xy'", "position 14: found 'xy', expected one character"},
        {"Other.Key=abc",
         "position 11: found 'abc', expected a quoted text, a number, TRUE or FALSE (quotes must be kept from the "
         "shell)"},
        {"Link.First=\"Thing.Number=x\"",
         "position 12: found a quoted text that is no object path (object path Thing.Number=x, position 14: found 'x', "
         "expected a uint16 from 0 to 65535), expected an object path"}};
    for (const auto& [text, error] : cases) {
        EXPECT_EQ(errorOf(text), std::string("object path ") + text + ", " + error);
    }
}

} // namespace
} // namespace ObjectManager

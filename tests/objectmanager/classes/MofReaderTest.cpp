#include "classes/MofReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {
namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::Field;
using testing::SizeIs;

std::vector<Class> classesOf(std::string_view text, std::string_view file) {
    return readMof(text, file).classes;
}

TEST(MofReader, ReadsNothingFromAnEmptyText) {
    EXPECT_THAT(classesOf("", "x.mof"), SizeIs(0));
    EXPECT_THAT(classesOf("// a comment\n/* and\nanother */ #pragma locale(\"en_US\")\n", "x.mof"), SizeIs(0));
}

TEST(MofReader, ReadsAClassWithItsSuperclassAndPlace) {
    const auto classes = classesOf("#pragma namespace(\"root\")\n\nclass A {\n};\nCLASS B : A {};", "x.mof");
    ASSERT_THAT(classes, SizeIs(2));
    EXPECT_EQ(classes[0].name, "A");
    EXPECT_EQ(classes[0].superClass, "");
    EXPECT_EQ(classes[0].place, "x.mof:3");
    EXPECT_EQ(classes[1].name, "B");
    EXPECT_EQ(classes[1].superClass, "A");
    EXPECT_EQ(classes[1].place, "x.mof:5");
}

TEST(MofReader, ReadsPropertiesWithTypesAndDefaults) {
    const auto classes = classesOf(R"(
        class A {
            string Text = "a\"b";
            uint16 Codes[] = {2, 0x10};
            uint8 Fixed[4];
            boolean Flag = TRUE;
            sint32 Number = -5;
            real64 Real = 1.5;
            char16 Letter = 'x';
            datetime When = "00000001000000.000000:000";
            uint32 Unset = NULL;
            A REF Other;
        };)",
                                   "x.mof");
    ASSERT_THAT(classes, SizeIs(1));
    const auto& properties = classes[0].properties;
    const auto valueOf = [&](const char* name) { return findElement(properties, name)->defaultValue; };
    EXPECT_EQ(valueOf("Text"), stringValue("a\"b"));
    EXPECT_EQ(valueOf("Codes"),
              arrayValue(CMPI_uint16, {unsignedValue(CMPI_uint16, 2), unsignedValue(CMPI_uint16, 16)}));
    EXPECT_EQ(valueOf("Fixed"), nullValue(CMPI_uint8A));
    EXPECT_EQ(valueOf("Flag"), booleanValue(true));
    EXPECT_EQ(valueOf("Number"), signedValue(CMPI_sint32, -5));
    EXPECT_EQ(valueOf("Real"), realValue(CMPI_real64, 1.5));
    EXPECT_EQ(valueOf("Letter"), (Value{CMPI_char16, u'x'}));
    EXPECT_EQ(valueOf("When"), dateTimeValue("00000001000000.000000:000"));
    EXPECT_EQ(valueOf("Unset"), nullValue(CMPI_uint32));
    EXPECT_EQ(classes[0].property("other")->type, CMPI_ref);
    EXPECT_EQ(classes[0].property("other")->referenceClass, "A");
}

TEST(MofReader, ReadsQualifiersOfEveryForm) {
    const auto classes = classesOf(R"(
        [Abstract, Version("1.2"), Min(1), Max(-2), Ratio(0.5), Sign('+'), Off(FALSE), Empty(NULL),
         Values{"one", "two"}, Numbers{1, 2}, None{},
         Text("one " "text"   // put together
              " of three") : DisableOverride ToSubclass]
        class A {};)",
                                   "x.mof");
    ASSERT_THAT(classes, SizeIs(1));
    const auto& qualifiers = classes[0].qualifiers;
    const auto valueOf = [&](const char* name) { return find(qualifiers, name)->value; };
    EXPECT_TRUE(hasFlag(qualifiers, "ABSTRACT"));
    EXPECT_EQ(valueOf("Version"), stringValue("1.2"));
    EXPECT_EQ(valueOf("Min"), signedValue(CMPI_sint64, 1));
    EXPECT_EQ(valueOf("Max"), signedValue(CMPI_sint64, -2));
    EXPECT_EQ(valueOf("Ratio"), realValue(CMPI_real64, 0.5));
    EXPECT_EQ(valueOf("Sign"), (Value{CMPI_char16, u'+'}));
    EXPECT_FALSE(hasFlag(qualifiers, "Off"));
    EXPECT_TRUE(valueOf("Empty").isNull());
    EXPECT_EQ(valueOf("Values"), arrayValue(CMPI_string, {stringValue("one"), stringValue("two")}));
    EXPECT_EQ(valueOf("Numbers"), arrayValue(CMPI_sint64, {signedValue(CMPI_sint64, 1), signedValue(CMPI_sint64, 2)}));
    EXPECT_EQ(valueOf("None"), arrayValue(CMPI_string, {}));
    EXPECT_EQ(valueOf("Text"), stringValue("one text of three"));
}

TEST(MofReader, ReadsMethodsWithQualifiedParameters) {
    const auto classes = classesOf(R"(
        class A {
            uint32 Stop();
            [Description("Does it.")]
            uint32 Do([In] uint16 How, [In(false), Out] string Names[], A REF Whom, [In, Out] datetime When);
        };)",
                                   "x.mof");
    ASSERT_THAT(classes, SizeIs(1));
    EXPECT_THAT(classes[0].method("stop")->parameters, SizeIs(0));
    const Method& method = *classes[0].method("do");
    EXPECT_EQ(method.type, CMPI_uint32);
    EXPECT_THAT(method.parameters,
                ElementsAre(Field(&Parameter::type, CMPI_uint16), Field(&Parameter::type, CMPI_stringA),
                            Field(&Parameter::type, CMPI_ref), Field(&Parameter::type, CMPI_dateTime)));
    const auto directions = [&](std::size_t index) {
        return std::pair(method.parameters[index].isIn(), method.parameters[index].isOut());
    };
    EXPECT_EQ(directions(0), std::pair(true, false));
    EXPECT_EQ(directions(1), std::pair(false, true));
    EXPECT_EQ(directions(2), std::pair(true, false));
    EXPECT_EQ(directions(3), std::pair(true, true));
}

TEST(MofReader, ReadsQualifierTypesWithTheirScopesAndFlavors) {
    const auto types = readMof(R"(
        Qualifier Key : boolean = false, Scope(property, reference), Flavor(DisableOverride, ToSubclass);
        Qualifier Values : string[], Scope(any), Flavor(Translatable);
        class A {};
        QUALIFIER Since : datetime = NULL, Flavor(restricted);
        Qualifier Plain : uint32;)",
                               "x.mof")
                           .qualifierTypes;
    const auto type = [](const char* name, CMPIType of, bool overridable, bool toSubclass, bool translatable) {
        return AllOf(Field(&QualifierType::name, name), Field(&QualifierType::type, of),
                     Field(&QualifierType::overridable, overridable), Field(&QualifierType::toSubclass, toSubclass),
                     Field(&QualifierType::translatable, translatable));
    };
    EXPECT_THAT(types, ElementsAre(type("Key", CMPI_boolean, false, true, false),
                                   type("Values", CMPI_stringA, true, true, true),
                                   type("Since", CMPI_dateTime, true, false, false),
                                   type("Plain", CMPI_uint32, true, true, false)));
    EXPECT_EQ(types[2].place, "x.mof:5");
    EXPECT_EQ(types[0].scopes, aProperty | aReference);
    EXPECT_EQ(types[0].defaultValue, booleanValue(false));
    EXPECT_EQ(types[1].scopes, anyScope);
    EXPECT_TRUE(types[1].defaultValue.isNull());
}

struct BadMof {
    std::string text;
    std::string error;
};

class BadMofTest : public testing::TestWithParam<BadMof> {};

TEST_P(BadMofTest, IsReportedByFileAndLine) {
    try {
        readMof(GetParam().text, "x.mof");
        FAIL() << GetParam().text << " was taken";
    } catch (const SchemaError& error) {
        EXPECT_EQ(error.what(), GetParam().error);
    }
}

INSTANTIATE_TEST_SUITE_P(
    texts, BadMofTest,
    testing::Values(
        BadMof{"instance of A {};",
               "x.mof:1: found 'instance', expected the declaration of a class or of a qualifier type"},
        BadMof{"Qualifier Q;", "x.mof:1: found ';', expected ':' and a type"},
        BadMof{"Qualifier Q : text;", "x.mof:1: found 'text', expected the name of a type"},
        BadMof{"Qualifier Q : string = 5;", "x.mof:1: found '5', expected a string"},
        BadMof{"Qualifier Q : string,\nFlavour(any);", "x.mof:2: found 'Flavour', expected Scope(...) or Flavor(...)"},
        BadMof{
            "Qualifier Q : string, Flavor(Strong);",
            "x.mof:1: found 'Strong', expected EnableOverride, DisableOverride, ToSubclass, Restricted or Translatable"},
        BadMof{"Qualifier Q : string, Scope(any;", "x.mof:1: found ';', expected ',' or ')'"},
        BadMof{"Qualifier Q : string\n\nclass A {};",
               "x.mof:3: found 'class', expected ';' behind the qualifier type Q"},
        BadMof{"\n\nclass {};", "x.mof:3: found '{', expected the name of the class"},
        BadMof{"class A : {};", "x.mof:1: found '{', expected the name of the superclass"},
        BadMof{"class A;", "x.mof:1: found ';', expected ':' and a superclass, or '{'"},
        BadMof{"class A {}\nclass B {};", "x.mof:2: found 'class', expected ';' behind the class declaration"},
        BadMof{"class A {\n", "x.mof:2: found the end of the file, expected a property, a method or '}'"},
        BadMof{"class A {\n  text T;\n};", "x.mof:2: found 'text', expected the name of a type, or of a class and REF"},
        BadMof{"class A { string; };", "x.mof:1: found ';', expected a name"},
        BadMof{"class A { string T };", "x.mof:1: found '}', expected ';' behind the property T"},
        BadMof{"class A { string T;\nuint8 t; };", "x.mof:2: found a second property t of A, expected every name once"},
        BadMof{"class A { string T = 5; };", "x.mof:1: found '5', expected a string"},
        BadMof{"class A { uint8 N = 256; };", "x.mof:1: found '256', expected a uint8 from 0 to 255"},
        BadMof{"class A { uint8 N = \"5\"; };", "x.mof:1: found the string \"5\", expected a uint8"},
        BadMof{"class A { uint8 N[] = 5; };",
               "x.mof:1: found '5', expected '{' and the elements of the array, or NULL"},
        BadMof{"class A { uint8 N[] = {5; };", "x.mof:1: found ';', expected ',' or '}' behind an element"},
        BadMof{"class A { A REF R = \"x\"; };", "x.mof:1: found the string \"x\", expected NULL"},
        BadMof{"class A { char16 C = 'xy'; };", "x.mof:1: found 'xy', expected one character"},
        BadMof{"class A { uint32 M(; };", "x.mof:1: found ';', expected a parameter"},
        BadMof{"class A { uint32 M(uint8 N; };", "x.mof:1: found ';', expected ',' or ')' behind a parameter"},
        BadMof{"class A { uint32 M() };", "x.mof:1: found '}', expected ';' behind the method M"},
        BadMof{"[Key", "x.mof:1: found the end of the file, expected ',' or ']' behind a qualifier"},
        BadMof{"[Key(] class A {};",
               "x.mof:1: found ']', expected a string, a character, a number, TRUE, FALSE or NULL"},
        BadMof{"[Values{\"a\",\n 1}] class A {};", "x.mof:2: found '1', expected a string like the elements before"},
        BadMof{"class A { /* \n };", "x.mof:1: found no end of the comment that begins here, expected */"},
        BadMof{"#include \"x\"", "x.mof:1: found '#', expected #pragma name(...)"},
        BadMof{"class A { string T = \"a\n\n; };", "x.mof:1: found no closing \", expected one for the \" here"},
        BadMof{"class A { ? };", "x.mof:1: found '?', expected a token of MOF"}));

} // namespace
} // namespace ObjectManager

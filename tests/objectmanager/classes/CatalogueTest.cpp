#include "classes/Catalogue.h"
#include "classes/MofReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

namespace ObjectManager {
namespace {

using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;
using testing::Optional;

/** Superclasses are declared after their subclasses here, since the order must not matter. */
constexpr const char* family = R"(
    class Child : Parent {
        [Override("Name"), Description("more")] string Name;
        uint16 Own;
        [Description("again")] uint32 Act(uint16 How);
    };
    class Parent : Base {
        [Key, ValueMap{"1"}, Values{"one"}, Description("less")] string Name;
        uint32 Act(uint16 How);
    };
    class Base {
        string Caption;
        [Key] string Id;
    };
    class Stranger {};)";

class CatalogueTest : public testing::Test {
protected:
    Catalogue _catalogue{readMof(family, "family.mof")};
};

TEST_F(CatalogueTest, FindsAClassInAnyLetterCase) {
    ASSERT_NE(_catalogue.find("PARENT"), nullptr);
    EXPECT_EQ(_catalogue.find("parent")->name, "Parent");
    EXPECT_EQ(_catalogue.find("Nobody"), nullptr);
}

TEST_F(CatalogueTest, GivesAClassWhatItInheritsWithTheAncestorsElementsFirst) {
    const Class& child = *_catalogue.find("Child");
    EXPECT_THAT(child.properties, ElementsAre(Field(&Property::name, "Caption"), Field(&Property::name, "Id"),
                                              Field(&Property::name, "Name"), Field(&Property::name, "Own")));
    EXPECT_THAT(child.methods, ElementsAre(Field(&Method::name, "Act")));
    EXPECT_EQ(child.superClass, "Parent");
}

TEST_F(CatalogueTest, TellsWhichClassDeclaredAnElementFirstAndWhichLast) {
    const Class& child = *_catalogue.find("Child");
    const auto isDeclared = [](const char* origin, const char* last) {
        return testing::AllOf(Field(&Element::origin, origin), Field(&Element::declaredBy, last));
    };
    EXPECT_THAT(*child.property("Caption"), isDeclared("Base", "Base"));
    EXPECT_THAT(*child.property("Name"), isDeclared("Parent", "Child"));
    EXPECT_THAT(*child.property("Own"), isDeclared("Child", "Child"));
    EXPECT_THAT(*child.method("Act"), isDeclared("Parent", "Child"));
    EXPECT_TRUE(child.property("Name")->isDeclaredBy(child));
    EXPECT_FALSE(child.property("Caption")->isDeclaredBy(child));
}

TEST_F(CatalogueTest, ListsAllClassesByName) {
    EXPECT_THAT(_catalogue.all(), ElementsAre(testing::Pointee(Field(&Class::name, "Base")),
                                              testing::Pointee(Field(&Class::name, "Child")),
                                              testing::Pointee(Field(&Class::name, "Parent")),
                                              testing::Pointee(Field(&Class::name, "Stranger"))));
}

TEST_F(CatalogueTest, KeepsInheritedQualifiersThatADeclarationDoesNotChange) {
    const Property& name = *_catalogue.find("Child")->property("Name");
    EXPECT_TRUE(name.isKey());
    EXPECT_EQ(find(name.qualifiers, "Description")->value, stringValue("more"));
    EXPECT_EQ(find(_catalogue.find("Parent")->property("Name")->qualifiers, "Description")->value, stringValue("less"));
}

TEST_F(CatalogueTest, KnowsTheKeysOfAClass) {
    EXPECT_THAT(_catalogue.keyNames("child"), ElementsAre("Id", "Name"));
    EXPECT_THAT(_catalogue.keyNames("Stranger"), IsEmpty());
    EXPECT_THAT(_catalogue.keyNames("Nobody"), IsEmpty());
}

TEST_F(CatalogueTest, KnowsWhatAClassDescendsFrom) {
    EXPECT_TRUE(_catalogue.isA("Child", "Child"));
    EXPECT_TRUE(_catalogue.isA("child", "BASE"));
    EXPECT_FALSE(_catalogue.isA("Base", "Child"));
    EXPECT_FALSE(_catalogue.isA("Stranger", "Base"));
    EXPECT_FALSE(_catalogue.isA("Nobody", "Base"));
    EXPECT_TRUE(_catalogue.isA("Nobody", "nobody"));
}

struct Misfit {
    std::string mof;
    std::string error;
};

class MisfitTest : public testing::TestWithParam<Misfit> {};

TEST_P(MisfitTest, IsReportedByFileAndLine) {
    try {
        const Catalogue catalogue(readMof(GetParam().mof, "x.mof"));
        FAIL() << GetParam().mof << " was taken";
    } catch (const SchemaError& error) {
        EXPECT_EQ(error.what(), GetParam().error);
    }
}

INSTANTIATE_TEST_SUITE_P(
    declarations, MisfitTest,
    testing::Values(
        Misfit{"class A {};\nclass a {};",
               "x.mof:2: found a second declaration of a, expected only the one at x.mof:1"},
        Misfit{"class A : B {};", "x.mof:1: found B as superclass of A, expected a declared class"},
        Misfit{"class A : A {};", "x.mof:1: found A as superclass of A, expected a class that is not its descendant"},
        Misfit{"class A : B {};\nclass B : A {};",
               "x.mof:2: found A as superclass of B, expected a class that is not its descendant"},
        Misfit{"class A { uint8 N; };\nclass B : A { string N; };",
               "x.mof:2: found string N, expected the inherited type uint8"},
        Misfit{"class A { B REF R; };", "x.mof:1: found B REF R in A, expected a declared class"},
        Misfit{"class A { uint32 M(B REF R); };", "x.mof:1: found B REF R in A, expected a declared class"},
        Misfit{"class A { [MaxLen(\"5\")] string T; };",
               "x.mof:1: found string as value of the qualifier MaxLen, expected uint32"},
        Misfit{"class A { [MaxLen(-5)] string T; };",
               "x.mof:1: found sint64 as value of the qualifier MaxLen, expected uint32"},
        Misfit{"class A { uint32 M([Values(\"one\")] uint8 N); };",
               "x.mof:1: found string as value of the qualifier Values, expected string[]"},
        Misfit{
            "Qualifier Q : string;\nQualifier q : string[];",
            "x.mof:2: found another declaration of the qualifier type q, expected one that is equal to that at x.mof:1"}));

TEST(ReadCatalogue, ReportsAFolderThatIsNotThere) {
    try {
        readCatalogue("/nowhere/at/all");
        FAIL() << "read";
    } catch (const SchemaError& error) {
        EXPECT_STREQ(error.what(), "/nowhere/at/all: cannot be read: No such file or directory");
    }
}

std::vector<std::string> namesOf(const Qualifiers& qualifiers) {
    std::vector<std::string> names;
    for (const NamedValue& qualifier : qualifiers) {
        names.push_back(qualifier.name);
    }
    std::sort(names.begin(), names.end());
    return names;
}

TEST(QualifiersOfACatalogue, GoToSubclassesUnlessTheyAreRestricted) {
    const Catalogue catalogue(readMof(R"(
        [Association, Abstract, Version("1"), UMLPackagePath("A::B")]
        class Parent {
            [Key, Max(1), Deprecated{"Other"}, Experimental] Parent REF One;
            [Deprecated{"None"}, Description("d")] uint32 Act([In, Required, Experimental] uint16 How);
        };
        [Version("2")]
        class Child : Parent {
            [Override("One"), Min(1)] Child REF One;
            [Override("Act")] uint32 Act(uint16 How);
        };
        class GrandChild : Child {
            [Min(0)] Child REF One;
        };)",
                                      "x.mof"));
    const Class& child = *catalogue.find("Child");
    EXPECT_THAT(namesOf(child.qualifiers), ElementsAre("Association", "UMLPackagePath", "Version"));
    EXPECT_THAT(namesOf(child.property("One")->qualifiers), ElementsAre("Key", "Max", "Min", "Override"));
    EXPECT_THAT(namesOf(child.method("Act")->qualifiers), ElementsAre("Description", "Override"));
    EXPECT_THAT(namesOf(child.method("Act")->parameters[0].qualifiers), ElementsAre("In", "Required"));
    EXPECT_THAT(namesOf(catalogue.find("GrandChild")->property("One")->qualifiers), ElementsAre("Key", "Max", "Min"));
}

TEST(QualifiersOfACatalogue, HaveValuesOfTheirTypes) {
    const Catalogue catalogue(readMof(R"(
        Qualifier Shade : uint8[], Flavor(Restricted);
        class A { [MaxLen(64), MinValue(-1), Shade{1, 2}, Unknown(3)] string P; };)",
                                      "x.mof"));
    const Qualifiers& qualifiers = catalogue.find("A")->property("P")->qualifiers;
    EXPECT_EQ(find(qualifiers, "MaxLen")->value, unsignedValue(CMPI_uint32, 64));
    EXPECT_EQ(find(qualifiers, "MinValue")->value, signedValue(CMPI_sint64, -1));
    EXPECT_EQ(find(qualifiers, "Shade")->value,
              arrayValue(CMPI_uint8, {unsignedValue(CMPI_uint8, 1), unsignedValue(CMPI_uint8, 2)}));
    EXPECT_EQ(find(qualifiers, "Unknown")->value, signedValue(CMPI_sint64, 3));
    EXPECT_FALSE(catalogue.qualifierTypes().find("shade")->toSubclass);
    EXPECT_FALSE(catalogue.qualifierTypes().find("Key")->overridable);
    EXPECT_EQ(catalogue.qualifierTypes().find("Unknown"), nullptr);
}

TEST(QualifiersOfACatalogue, MayBeDeclaredTwiceInTheSameWay) {
    const Catalogue catalogue(readMof("Qualifier Key : boolean, Flavor(DisableOverride);\n"
                                      "Qualifier KEY : boolean, Flavor(DisableOverride);\n"
                                      "class A {};",
                                      "x.mof"));
    EXPECT_NE(catalogue.find("A"), nullptr);
}

struct Code {
    Value value;
    std::optional<std::string> means;
};

class ValueMapTest : public testing::TestWithParam<Code> {};

TEST_P(ValueMapTest, TellsWhatACodeMeans) {
    const auto declared = readMof(R"(
        class A {
            [ValueMap{"1", "2", "3..5", "..", "0x8000..", "..-5"},
             Values{"one", "two", "a few", "any", "many", "none"}] sint64 N;
        };)",
                                  "x.mof");
    EXPECT_EQ(meaning(*declared.classes[0].property("N"), GetParam().value), GetParam().means);
}

INSTANTIATE_TEST_SUITE_P(
    codes, ValueMapTest,
    testing::Values(Code{unsignedValue(CMPI_uint16, 1), "one"}, Code{unsignedValue(CMPI_uint16, 3), "a few"},
                    Code{unsignedValue(CMPI_uint16, 5), "a few"}, Code{unsignedValue(CMPI_uint16, 6), "any"},
                    Code{unsignedValue(CMPI_uint64, ~std::uint64_t{0}), "many"},
                    Code{signedValue(CMPI_sint64, -5), "none"}, Code{signedValue(CMPI_sint64, -4), "any"},
                    Code{nullValue(CMPI_sint64), std::nullopt}, Code{stringValue("other"), std::nullopt}));

TEST(ValueMap, MayBeOfTexts) {
    const auto declared =
        readMof(R"(class A { [ValueMap{"a", "b"}, Values{"first", "second"}] string T; string U; };)", "x.mof");
    const auto& classes = declared.classes;
    EXPECT_THAT(meaning(*classes[0].property("T"), stringValue("b")), Optional(std::string("second")));
    EXPECT_EQ(meaning(*classes[0].property("T"), stringValue("c")), std::nullopt);
    EXPECT_EQ(meaning(*classes[0].property("U"), stringValue("a")), std::nullopt);
}

} // namespace
} // namespace ObjectManager

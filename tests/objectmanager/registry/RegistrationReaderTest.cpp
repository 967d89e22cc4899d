#include "registry/RegistrationReader.h"
#include "classes/MofLexer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ObjectManager {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

TEST(RegistrationReader, ReadsSectionsWithLinesInAnyOrder) {
    const auto registrations = readRegistrations(std::string_view("# two classes\n"
                                                                  "[A]\n"
                                                                  "   provider: AProvider\n"
                                                                  "   location: alib   # a comment\n"
                                                                  "   type: instance method\n"
                                                                  "   namespace: root/cimv2 root/interop\n"
                                                                  "   methods: Start Stop\n"
                                                                  "\r\n"
                                                                  "[ B ]\r\n"
                                                                  "type: association property indication\r\n"
                                                                  "namespace:root/cimv2\r\n"
                                                                  "location:blib\r\n"
                                                                  "unload: never\r\n"
                                                                  "group: b\r\n"
                                                                  "provider:BProvider"),
                                                 "x.reg");
    ASSERT_THAT(registrations, SizeIs(2));
    const Registration& a = registrations[0];
    EXPECT_EQ(a.className, "A");
    EXPECT_EQ(a.provider, "AProvider");
    EXPECT_EQ(a.location, "alib");
    EXPECT_THAT(a.nameSpaces, ElementsAre("root/cimv2", "root/interop"));
    EXPECT_TRUE(a.instance && a.method && !a.association && !a.property && !a.indication);
    EXPECT_THAT(a.methods, ElementsAre("Start", "Stop"));
    const Registration& b = registrations[1];
    EXPECT_EQ(b.className, "B");
    EXPECT_EQ(b.provider, "BProvider");
    EXPECT_EQ(b.location, "blib");
    EXPECT_THAT(b.nameSpaces, ElementsAre("root/cimv2"));
    EXPECT_THAT(b.methods, IsEmpty());
    EXPECT_TRUE(!b.instance && !b.method && b.association && b.property && b.indication);
}

TEST(RegistrationReader, ReadsNothingFromAnEmptyText) {
    EXPECT_THAT(readRegistrations(std::string_view(""), "x.reg"), IsEmpty());
}

struct BadRegistration {
    std::string text;
    std::string error;
};

class BadRegistrationTest : public testing::TestWithParam<BadRegistration> {};

TEST_P(BadRegistrationTest, IsReportedByFileAndLine) {
    try {
        readRegistrations(std::string_view(GetParam().text), "x.reg");
        FAIL() << GetParam().text << " was taken";
    } catch (const SchemaError& error) {
        EXPECT_EQ(error.what(), GetParam().error);
    }
}

INSTANTIATE_TEST_SUITE_P(
    texts, BadRegistrationTest,
    testing::Values(
        BadRegistration{"provider: X", "x.reg:1: found 'provider: X', expected [CLASS]"},
        BadRegistration{"\n[]", "x.reg:2: found '[]', expected [CLASS]"},
        BadRegistration{"[A", "x.reg:1: found '[A', expected [CLASS]"},
        BadRegistration{"[A]\nprovider X", "x.reg:2: found 'provider X', expected [CLASS] or KEY: VALUE"},
        BadRegistration{"[A]\nprovider: X\nprovider: Y", "x.reg:3: found 'provider', expected every key of [A] once"},
        BadRegistration{"[A]\nprovider:", "x.reg:2: found 'provider', expected a value behind 'provider:'"},
        BadRegistration{
            "[A]\nlibrary: x",
            "x.reg:2: found 'library', expected provider, location, type, namespace, methods, unload or group"},
        BadRegistration{"[A]\ntype: instance methods",
                        "x.reg:2: found 'methods', expected instance, method, association, property or indication"},
        BadRegistration{"\n[A]\nprovider: X\ntype: instance\n[B]\n",
                        "x.reg:2: found [A] without location, namespace, expected provider, location, type and "
                        "namespace"},
        BadRegistration{"[A]", "x.reg:1: found [A] without provider, location, type, namespace, expected provider, "
                               "location, type and namespace"}));

} // namespace
} // namespace ObjectManager

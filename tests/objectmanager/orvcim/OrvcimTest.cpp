#include "Orvcim.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

namespace OrvcimTest {
namespace {

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

constexpr const char* thing = R"(root/cimv2:Test_Thing.Name="one")";

void expectDone(const Outcome& outcome, const std::string& out) {
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(outcome.out, out);
}

TEST(Orvcim, ListsTheClassesOfANamespace) {
    expectDone(orvcim({"classes", "--namespace", "root/test"}), "CLASS       SUPERCLASS  METHODS\n"
                                                                "Test_Thing              Add, Refuse, Throw, Absent\n");
}

TEST(Orvcim, NamesInstancesByPathsThatGetTakes) {
    expectDone(orvcim({"names", "Test_Thing"}), "root/cimv2:Test_Thing.Name=\"one\"\n"
                                                "root/cimv2:Test_Thing.Name=\"two \\\"quoted\\\"\"\n");
    expectDone(orvcim({"get", R"(root/cimv2:Test_Thing.Name="two \"quoted\"")"}), "root/cimv2:Test_Thing\n"
                                                                                  "  * Name  two \"quoted\"\n"
                                                                                  "    Size  5\n");
}

TEST(Orvcim, ShowsInstancesAsTableJsonAndMof) {
    expectDone(orvcim({"instances", "Test_Thing"}), "root/cimv2:Test_Thing\n"
                                                    "  * Name  one\n"
                                                    "    Size  5\n"
                                                    "\n"
                                                    "root/cimv2:Test_Thing\n"
                                                    "  * Name  two \"quoted\"\n"
                                                    "    Size  5\n");
    expectDone(orvcim({"--format", "mof", "instances", "Test_Thing"}), "instance of Test_Thing {\n"
                                                                       "    Name = \"one\";\n"
                                                                       "    Size = 5;\n"
                                                                       "};\n"
                                                                       "instance of Test_Thing {\n"
                                                                       "    Name = \"two \\\"quoted\\\"\";\n"
                                                                       "    Size = 5;\n"
                                                                       "};\n");
    expectDone(orvcim({"get", thing, "--format", "json"}), R"({
  "path": "root/cimv2:Test_Thing.Name=\"one\"",
  "host": "testhost",
  "namespace": "root/cimv2",
  "class": "Test_Thing",
  "properties": {
    "Name": "one",
    "Size": 5
  }
}
)");
}

TEST(Orvcim, TakesClassesAndPropertiesInAnyLetterCase) {
    expectDone(orvcim({"instances", "root/test:TEST_thing", "--properties", "NAME"}), "root/test:Test_Thing\n"
                                                                                      "  * Name  one\n"
                                                                                      "\n"
                                                                                      "root/test:Test_Thing\n"
                                                                                      "  * Name  two \"quoted\"\n");
    expectDone(orvcim({"get", thing, "--properties", "name,size"}), "root/cimv2:Test_Thing\n"
                                                                    "  * Name  one\n"
                                                                    "    Size  5\n");
}

TEST(Orvcim, PassesArgumentsInTheTypesOfTheMethod) {
    expectDone(orvcim({"invoke", thing, "Add", "left=65535", "RIGHT=1", "Right=2",
                       "Other=//elsewhere/ROOT/cimv2:test_thing.NAME=\"one\"", "When=00000000000001.500000:000"}),
               "Add\n"
               "    ReturnValue  1 (Not Added)\n"
               "    Sum          65538\n"
               "    Seen         other ROOT/cimv2 one when 1500000\n");
    expectDone(orvcim({"invoke", thing, "add", "Left=1", "--format", "json"}), R"({
  "method": "Add",
  "returnValue": 1,
  "outputs": {
    "Sum": 1,
    "Seen": ""
  }
}
)");
    expectDone(orvcim({"invoke", thing, "Add", "Left=1", "--format", "mof"}), "// Add\n"
                                                                              "instance of __MethodParameters {\n"
                                                                              "    ReturnValue = 1;\n"
                                                                              "    Sum = 1;\n"
                                                                              "    Seen = \"\";\n"
                                                                              "};\n");
}

struct Mistake {
    std::vector<std::string> arguments;
    int status;
    std::string error;
};

void PrintTo(const Mistake& mistake, std::ostream* out) {
    *out << testing::PrintToString(mistake.arguments);
}

class MistakeTest : public testing::TestWithParam<Mistake> {};

TEST_P(MistakeTest, GetsOneClearLineAndItsStatus) {
    const Outcome outcome = orvcim(GetParam().arguments);
    EXPECT_EQ(outcome.err, "orvcim: " + GetParam().error + "\n");
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, GetParam().status);
}

const std::string noCommand =
    "found no command, expected one of classes, names, instances, get, invoke, associators, associator-names, "
    "references, reference-names, graph, profiles, power status, power reboot, power shutdown, power cancel, serve, check";

std::string withoutCommand(const std::string& word) {
    return "found no command " + word + noCommand.substr(std::string("found no command").size());
}

INSTANTIATE_TEST_SUITE_P(
    ofTheCommandLine, MistakeTest,
    testing::Values(
        Mistake{{}, 2, noCommand}, Mistake{{"power"}, 2, noCommand},
        Mistake{{"names"}, 2, "CLASS is required ('orvcim --help' lists the commands)"},
        Mistake{{"nonsense"}, 2, withoutCommand("nonsense")},
        Mistake{{"power", "off"},
                2,
                "found no command power off, expected one of power status, power reboot, power shutdown, "
                "power cancel"},
        Mistake{{"names", "Test_Thing", "more"},
                2,
                "The following argument was not expected: more ('orvcim --help' lists the commands)"},
        Mistake{{"classes", "--format", "xml"},
                2,
                "--format: xml not in {json,mof,table} ('orvcim --help' lists the commands)"},
        Mistake{{"check", "--format", "mof"}, 2, "found --format mof, expected table or json for check"},
        Mistake{{"graph", "--format", "json"}, 2, "found --format, expected none: graph writes DOT"},
        Mistake{{"profiles", "--format", "json"}, 2, "found --format, expected none: profiles writes for people"}));

INSTANTIATE_TEST_SUITE_P(
    ofNames, MistakeTest,
    testing::Values(
        Mistake{{"names", "Nothing"},
                1,
                "Nothing: CIM_ERR_INVALID_CLASS (5): no provider is registered for class \"Nothing\" in namespace "
                "\"root/cimv2\""},
        Mistake{{"instances", "Test_Other"},
                1,
                "Test_Other: CIM_ERR_INVALID_CLASS (5): no provider is registered for class \"Test_Other\" in "
                "namespace \"root/cimv2\""},
        Mistake{{"names", "Test_Thing", "--namespace", "root/nowhere"},
                1,
                "Test_Thing: CIM_ERR_INVALID_NAMESPACE (3): no provider is registered in namespace \"root/nowhere\""},
        Mistake{{"classes", "--namespace", "root/nowhere"},
                1,
                "classes: CIM_ERR_INVALID_NAMESPACE (3): no class is registered in root/nowhere"},
        Mistake{{"names", "Test_Thing.Name=\"one\""},
                2,
                "found the keys of an instance in Test_Thing.Name=\"one\", expected the name of a class"},
        Mistake{{"get", "Test_Thing.Name=one"},
                2,
                "object path Test_Thing.Name=one, position 17: found 'one', expected a quoted string (quotes must be "
                "kept from the shell)"},
        Mistake{{"get", "Test_Thing.Size=5"},
                2,
                "object path Test_Thing.Size=5, position 12: found 'Size', expected a key of Test_Thing: Name"},
        Mistake{{"get", "Test_Thing"},
                1,
                "Test_Thing: CIM_ERR_INVALID_PARAMETER (4): found no Name, expected every key of Test_Thing"},
        Mistake{{"get", "Test_Thing.Name=\"nobody\""},
                1,
                "Test_Thing.Name=\"nobody\": CIM_ERR_NOT_FOUND (6): there is no such instance"},
        Mistake{{"get", "Test_Thing.Name=\"damaged\""},
                1,
                "Test_Thing.Name=\"damaged\": CMPI_RC_ERROR_SYSTEM (100): cannot be read; the provider logged: the "
                "disk is on fire"},
        Mistake{{"get", thing, "--properties", "Name,Colour"},
                1,
                std::string(thing) + ": CIM_ERR_NO_SUCH_PROPERTY (12): Test_Thing has no property Colour"}));

INSTANTIATE_TEST_SUITE_P(
    ofAssociations, MistakeTest,
    testing::Values(Mistake{{"associators", "Nothing.Name=\"x\""},
                            1,
                            "Nothing.Name=\"x\": CIM_ERR_INVALID_PARAMETER (4): the class \"Nothing\" is not declared"},
                    Mistake{{"associator-names", thing, "--assoc-class", "Nothing"},
                            1,
                            std::string(thing) + ": CIM_ERR_INVALID_PARAMETER (4): the association class \"Nothing\" "
                                                 "is not declared"},
                    Mistake{{"references", "Test_Thing"},
                            1,
                            "Test_Thing: CIM_ERR_INVALID_PARAMETER (4): found no Name, expected every key of "
                            "Test_Thing"},
                    Mistake{{"reference-names"}, 2, "PATH is required ('orvcim --help' lists the commands)"}));

INSTANTIATE_TEST_SUITE_P(
    ofMethods, MistakeTest,
    testing::Values(
        Mistake{{"invoke", thing, "Subtract"},
                1,
                "Subtract: CIM_ERR_METHOD_NOT_FOUND (17): Test_Thing has no method Subtract; it has Add, Refuse, "
                "Throw, Absent"},
        Mistake{{"invoke", "Test_Thing.Name=\"three\"", "Add", "Left=1"},
                1,
                "Add: CIM_ERR_NOT_FOUND (6): there is no such instance"},
        Mistake{{"invoke", "Nothing.Name=\"x\"", "Add"},
                1,
                "Add: CIM_ERR_INVALID_CLASS (5): no provider is registered for class \"Nothing\" in namespace "
                "\"root/cimv2\""},
        Mistake{{"invoke", "TALVO_PowerManagementCapabilities.InstanceID=\"x\"", "Add"},
                1,
                "Add: CIM_ERR_METHOD_NOT_AVAILABLE (16): no method provider is registered for class "
                "\"TALVO_PowerManagementCapabilities\""},
        Mistake{{"invoke", thing, "Add", "Left"}, 2, "found the argument 'Left', expected NAME=VALUE"},
        Mistake{{"invoke", thing, "Add"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): found no argument Left, expected it since Add requires it"},
        Mistake{{"invoke", thing, "Add", "Left=1", "Up=2"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): found the argument Up, expected an input of Add: Left, Right, "
                "Other, When"},
        Mistake{{"invoke", thing, "Add", "Left=1", "Sum=2"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): found the argument Sum, expected an input of Add: Left, Right, "
                "Other, When"},
        Mistake{{"invoke", thing, "Add", "Left=65536"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): argument Left: found '65536', expected a uint16 from 0 to 65535"},
        Mistake{{"invoke", thing, "Add", "Left=one"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): argument Left: found 'one', expected a uint16 from 0 to 65535"},
        Mistake{{"invoke", thing, "Add", "Left=1", "Left=2"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): argument Left: found 2 values, expected one"},
        Mistake{{"invoke", thing, "Add", "Left=1", "Other=Test_Thing.Name=a"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): argument Other: object path Test_Thing.Name=a, position 17: found "
                "'a', expected a quoted string (quotes must be kept from the shell)"},
        Mistake{{"invoke", thing, "Add", "Left=1", "Other=Test_Other.Name=\"a\""},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): argument Other: found a Test_Other, expected a Test_Thing"},
        Mistake{{"invoke", thing, "Add", "Left=1", "When=now"},
                1,
                "Add: CIM_ERR_INVALID_PARAMETER (4): argument When: found 'now', expected a datetime: "
                "yyyymmddhhmmss.mmmmmm+uuu (local time and its minutes east of UTC) or ddddddddhhmmss.mmmmmm:000 (an "
                "interval)"},
        Mistake{{"invoke", thing, "Refuse"}, 1, "Refuse was refused: it is Sunday; and it rains"},
        Mistake{{"invoke", thing, "Throw"},
                1,
                "Throw: CIM_ERR_FAILED (1): Thing threw an exception: thrown by the provider"},
        Mistake{{"invoke", thing, "Absent"}, 1, "Absent: CIM_ERR_METHOD_NOT_AVAILABLE (16): Thing gave no reason"}));

TEST(Orvcim, ReportsASchemaThatCannotBeRead) {
    const Outcome outcome = runProcess({ORVCIM_PROGRAM, "--schema", "/nowhere/at/all", "classes"}, {});
    EXPECT_EQ(outcome.err, "orvcim: /nowhere/at/all: cannot be read: No such file or directory\n");
    EXPECT_EQ(outcome.status, 1);
}

TEST(Orvcim, ReportsALibraryThatIsNotThere) {
    const Outcome outcome =
        runProcess({ORVCIM_PROGRAM, "--schema", ORVCIM_BROKEN_SCHEMA, "names", "Test_NoLibrary"}, {});
    EXPECT_THAT(outcome.err,
                StartsWith("orvcim: Test_NoLibrary: CIM_ERR_FAILED (1): provider library libnosuchlibrary.so"));
    EXPECT_EQ(outcome.status, 1);
}

TEST(Orvcim, TellsHowItIsUsed) {
    const Outcome help = orvcim({"--help"});
    EXPECT_EQ(help.status, 0);
    EXPECT_THAT(help.out, AllOf(HasSubstr("--provider-path"), HasSubstr("invoke"), HasSubstr("check")));
    EXPECT_THAT(orvcim({"invoke", "--help"}).out, HasSubstr("NAME=VALUE"));
    for (const std::vector<std::string>& words : {std::vector<std::string>{"power"}, {"power", "status"}, {"check"}}) {
        std::vector<std::string> command = words;
        command.emplace_back("--help");
        EXPECT_THAT(orvcim(command).out, HasSubstr("The options that 'orvcim --help' shows may be given here too."))
            << words.back();
    }
    EXPECT_THAT(orvcim({"--version"}).out, StartsWith("orvcim 1."));
}

TEST(Orvcim, SaysWhereStandardOutputCannotBeWritten) {
    const Outcome outcome =
        runProcess({"/bin/sh", "-c", "\"$0\" \"$@\" > /dev/full", ORVCIM_PROGRAM, "--schema", ORVCIM_TEST_SCHEMA,
                    "--provider-path", ORVCIM_TEST_LIBRARIES, "names", "Test_Thing"},
                   {});
    EXPECT_EQ(outcome.err, "orvcim: standard output cannot be written\n");
    EXPECT_EQ(outcome.status, 1);
}

TEST(Check, SaysWhichProvidersLoadAndFromWhere) {
    const Outcome outcome = orvcim({"check"});
    EXPECT_EQ(outcome.err, "");
    EXPECT_EQ(outcome.status, 0);
    EXPECT_THAT(outcome.out, StartsWith("Test_Thing: ok\n"
                                        "  namespaces  root/cimv2, root/test\n"
                                        "  provider    Thing\n"
                                        "  library     "));
    EXPECT_THAT(outcome.out, HasSubstr("liborvcimtestprovider.so\n"));
    EXPECT_THAT(outcome.out, HasSubstr("  factory     Thing_Create_InstanceMI: instanceThing, versions 200 and 200\n"
                                       "  factory     Thing_Create_MethodMI: methodThing, versions 200 and 200\n"));
}

TEST(Check, SaysWhatIsWrongAndFails) {
    const Outcome outcome = runProcess(
        {ORVCIM_PROGRAM, "--schema", ORVCIM_BROKEN_SCHEMA, "--provider-path", ORVCIM_TEST_LIBRARIES, "check"}, {});
    EXPECT_EQ(outcome.err, "orvcim: not usable: Test_NoLibrary, Test_NoFactory, Test_Undeclared\n");
    EXPECT_EQ(outcome.status, 1);
    EXPECT_THAT(outcome.out, StartsWith("Test_Good: ok\n"));
    EXPECT_THAT(outcome.out, HasSubstr("Test_NoLibrary: not usable\n"
                                       "  namespaces  root/cimv2\n"
                                       "  provider    Thing\n"
                                       "  library     nosuchlibrary\n"
                                       "  problem     provider library libnosuchlibrary.so"));
    EXPECT_THAT(outcome.out, HasSubstr("  factory     Nobody_Create_InstanceMI: "));
    EXPECT_THAT(outcome.out, HasSubstr("  problem     the class is not declared in "));
}

TEST(Check, SaysTheSameAsJson) {
    const Outcome outcome = runProcess({ORVCIM_PROGRAM, "--schema", ORVCIM_BROKEN_SCHEMA, "--provider-path",
                                        ORVCIM_TEST_LIBRARIES, "check", "--format", "json"},
                                       {});
    EXPECT_EQ(outcome.status, 1);
    EXPECT_THAT(outcome.out, StartsWith("{\n  \"providers\": [\n    {\n      \"class\": \"Test_Good\",\n"));
    EXPECT_THAT(outcome.out, AllOf(HasSubstr("\"usable\": true"), HasSubstr("\"usable\": false"),
                                   HasSubstr("\"name\": \"instanceThing\""), EndsWith("}\n")));
}

} // namespace
} // namespace OrvcimTest

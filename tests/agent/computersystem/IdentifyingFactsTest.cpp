#include "computersystem/IdentifyingFacts.h"

#include "TestSupport.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

namespace Norv::ComputerSystemProvider {

void PrintTo(const IdentifyingFact& fact, std::ostream* stream) {
    *stream << fact.description << ": " << testing::PrintToString(fact.value);
}

namespace {

using AgentTest::writeFile;
using testing::ElementsAre;
using testing::IsEmpty;

class Facts : public testing::Test {
protected:
    Facts() { std::filesystem::create_directory(folder / "dmi"); }

    void haveFirmware(const std::string& file, const std::string& content) {
        writeFile(folder / "dmi" / file, content);
    }
    void haveSystem(const std::string& content) { writeFile(folder / "os-release", content); }

    std::vector<IdentifyingFact> facts() const { return identifyingFacts(sources); }

    AgentTest::TemporaryFolder folder;
    FactSources sources = {.firmware = folder / "dmi",
                           .operatingSystem = {folder / "os-release", folder / "usr-os-release"}};
};

TEST_F(Facts, AreWhatTheMachineTellsInAFixedOrder) {
    for (const char* file : {"bios_date", "bios_vendor", "bios_version", "board_asset_tag", "board_name",
                             "board_vendor", "board_version", "chassis_asset_tag", "chassis_vendor", "chassis_version",
                             "product_family", "product_name", "product_sku", "product_version", "sys_vendor"}) {
        haveFirmware(file, std::string("the ") + file + '\n');
    }
    haveSystem("VERSION_ID=4\nID=some\nPRETTY_NAME=\"Some System 4\"\n");

    EXPECT_THAT(
        facts(),
        ElementsAre(
            IdentifyingFact{"System vendor", "the sys_vendor"}, IdentifyingFact{"Product name", "the product_name"},
            IdentifyingFact{"Product version", "the product_version"},
            IdentifyingFact{"Product family", "the product_family"}, IdentifyingFact{"Product SKU", "the product_sku"},
            IdentifyingFact{"Board vendor", "the board_vendor"}, IdentifyingFact{"Board name", "the board_name"},
            IdentifyingFact{"Board version", "the board_version"},
            IdentifyingFact{"Board asset tag", "the board_asset_tag"},
            IdentifyingFact{"Chassis vendor", "the chassis_vendor"},
            IdentifyingFact{"Chassis version", "the chassis_version"},
            IdentifyingFact{"Chassis asset tag", "the chassis_asset_tag"},
            IdentifyingFact{"BIOS vendor", "the bios_vendor"}, IdentifyingFact{"BIOS version", "the bios_version"},
            IdentifyingFact{"BIOS date", "the bios_date"}, IdentifyingFact{"Operating system", "Some System 4"},
            IdentifyingFact{"Operating system identifier", "some"}, IdentifyingFact{"Operating system version", "4"}));
}

TEST_F(Facts, AreNoneWhereTheMachineTellsNothing) {
    EXPECT_THAT(facts(), IsEmpty());
}

TEST_F(Facts, LeaveOutWhatOnlyRootMayRead) {
    for (const char* file : {"product_serial", "product_uuid", "board_serial", "chassis_serial"}) {
        haveFirmware(file, "secret\n");
    }
    EXPECT_THAT(facts(), IsEmpty());
}

TEST_F(Facts, LeaveOutWhatCannotBeRead) {
    std::filesystem::create_directory(folder / "dmi" / "sys_vendor");
    haveFirmware("product_name", "Box\n");
    std::filesystem::create_directory(folder / "os-release");
    EXPECT_THAT(facts(), ElementsAre(IdentifyingFact{"Product name", "Box"}));
}

/** A text of the firmware, and the value of the fact that is made from it; empty if none is. */
struct FirmwareText {
    const char* name;
    std::string content;
    std::string value;
};

void PrintTo(const FirmwareText& text, std::ostream* stream) {
    *stream << text.name;
}

class FirmwareTexts : public Facts, public testing::WithParamInterface<FirmwareText> {};

TEST_P(FirmwareTexts, GiveFactsWhereTheyAreOneLineOfUtf8) {
    haveFirmware("product_name", GetParam().content);
    if (GetParam().value.empty()) {
        EXPECT_THAT(facts(), IsEmpty());
    } else {
        EXPECT_THAT(facts(), ElementsAre(IdentifyingFact{"Product name", GetParam().value}));
    }
}

INSTANTIATE_TEST_SUITE_P(
    All, FirmwareTexts,
    testing::Values(FirmwareText{"Plain", "Box\n", "Box"}, FirmwareText{"WithoutEndOfLine", "Box", "Box"},
                    FirmwareText{"BlanksAround", " \tBox 2000 \t \n", "Box 2000"},
                    FirmwareText{"Utf8", "Gerät\n", "Gerät"}, FirmwareText{"Empty", "", ""},
                    FirmwareText{"BlanksOnly", "   \n", ""}, FirmwareText{"TwoLines", "Box\n2000\n", ""},
                    FirmwareText{"ControlCharacter", "Box\x01\n", ""}, FirmwareText{"Delete", "Box\x7f\n", ""},
                    FirmwareText{"NullCharacter", std::string("Bo\0x\n", 5), ""},
                    FirmwareText{"NoUtf8", "Ger\xe4t\n", ""}, FirmwareText{"CutOffUtf8", "Box\xc3\n", ""},
                    FirmwareText{"Surrogate", "Box\xed\xa0\x80\n", ""}),
    [](const auto& test) { return test.param.name; });

/** A line of os-release, and the value that is read from it; empty if none is. */
struct Assignment {
    const char* name;
    std::string content;
    std::string value;
};

void PrintTo(const Assignment& assignment, std::ostream* stream) {
    *stream << assignment.name;
}

class Assignments : public Facts, public testing::WithParamInterface<Assignment> {};

TEST_P(Assignments, AreReadAsTheShellReadsThem) {
    haveSystem(GetParam().content);
    if (GetParam().value.empty()) {
        EXPECT_THAT(facts(), IsEmpty());
    } else {
        EXPECT_THAT(facts(), ElementsAre(IdentifyingFact{"Operating system", GetParam().value}));
    }
}

INSTANTIATE_TEST_SUITE_P(
    All, Assignments,
    testing::Values(Assignment{"Bare", "PRETTY_NAME=Some\n", "Some"},
                    Assignment{"DoubleQuotes", "PRETTY_NAME=\"Some System\"\n", "Some System"},
                    Assignment{"SingleQuotes", "PRETTY_NAME='Some \\ System'\n", "Some \\ System"},
                    Assignment{"Escapes", "PRETTY_NAME=\"The \\\"\\$\\`\\\\\\\" System\"\n", "The \"$`\\\" System"},
                    Assignment{"BackslashAtTheEnd", "PRETTY_NAME=Some\\", "Some\\"},
                    Assignment{"OneQuote", "PRETTY_NAME=\"", "\""},
                    Assignment{"BlanksAround", "  PRETTY_NAME=Some \r\n", "Some"},
                    Assignment{"Utf8", "PRETTY_NAME=\"Système\"", "Système"},
                    Assignment{"LastOneCounts", "PRETTY_NAME=Old\nPRETTY_NAME=New\n", "New"},
                    Assignment{"AmongOthers", "\n# Comment\nnonsense\nNAME=x\nPRETTY_NAME=Some\n", "Some"},
                    Assignment{"Comment", "#PRETTY_NAME=Some\n# PRETTY_NAME=Some\n", ""},
                    Assignment{"OtherVariable", "X_PRETTY_NAME=Some\n", ""},
                    Assignment{"EmptyValue", "PRETTY_NAME=\n", ""}, Assignment{"EmptyQuotes", "PRETTY_NAME=\"\"\n", ""},
                    Assignment{"NoUtf8", "PRETTY_NAME=Syst\xe8me\n", ""}),
    [](const auto& test) { return test.param.name; });

TEST_F(Facts, ComeFromTheSecondDescriptionWhereTheFirstCannotBeRead) {
    writeFile(folder / "usr-os-release", "ID=usr\n");
    EXPECT_THAT(facts(), ElementsAre(IdentifyingFact{"Operating system identifier", "usr"})) << "absent";
    std::filesystem::create_directory(folder / "os-release");
    EXPECT_THAT(facts(), ElementsAre(IdentifyingFact{"Operating system identifier", "usr"})) << "a folder";
}

TEST_F(Facts, ComeFromOneDescriptionOnly) {
    writeFile(folder / "usr-os-release", "ID=usr\nVERSION_ID=1\n");
    haveSystem("ID=etc\n");
    EXPECT_THAT(facts(), ElementsAre(IdentifyingFact{"Operating system identifier", "etc"}));
}

} // namespace
} // namespace Norv::ComputerSystemProvider

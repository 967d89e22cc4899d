#include "TestSupport.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <string>
#include <vector>

namespace {

namespace fs = std::filesystem;

using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;

constexpr const char* caption = "Energieverwaltungsdienst";
constexpr const char* id = "MSGID_POWER_MANAGEMENT_CAPTION";

/** An installation with nothing but the locale library and what it needs. */
class Installation {
public:
    explicit Installation(const std::string& libraryFolder) : _libraryFolder(folder / libraryFolder) {
        fs::create_directories(_libraryFolder);
        fs::copy_file(ORV_LOCALE_LIBRARY, _libraryFolder / "liborvlocale.so.1");
        fs::copy_file(ORV_LOG_LIBRARY, _libraryFolder / "liborvlog.so.1");
        AgentTest::writeFile(folder / "agent.toml", "");
    }

    /** The path of the installation's German catalogue. */
    fs::path catalogue() const { return folder / "share/locale/de/LC_MESSAGES/orv-agent.mo"; }

    void addCatalogue(const std::string& content) const {
        fs::create_directories(catalogue().parent_path());
        AgentTest::writeFile(catalogue(), content);
    }

    /** The output of a German program that loads its libraries from a folder: log records, then the caption. */
    std::vector<std::string> output(const fs::path& libraries) const {
        return AgentTest::linesOf("LC_ALL=de_DE.UTF-8 ORV_AGENT_CONFIG='" + (folder / "agent.toml").string() +
                                  "' LD_LIBRARY_PATH='" + libraries.string() + "' " ORV_LOCALE_PROBE " 2>&1");
    }
    std::vector<std::string> output() const { return output(_libraryFolder); }

    const AgentTest::TemporaryFolder folder;

private:
    fs::path _libraryFolder;
};

std::string germanCatalogue() {
    return AgentTest::contentOf(ORV_CATALOGUES "/de/LC_MESSAGES/orv-agent.mo");
}

class LibraryFolderTest : public testing::TestWithParam<const char*> {};

TEST_P(LibraryFolderTest, CataloguesAreFoundBesideIt) {
    const Installation installation(GetParam());
    installation.addCatalogue(germanCatalogue());
    EXPECT_THAT(installation.output(), ElementsAre(caption));
}

INSTANTIATE_TEST_SUITE_P(CatalogueSearch, LibraryFolderTest, testing::Values("lib", "lib64", "lib/x86_64-linux-gnu"));

TEST(CatalogueSearchTest, ALinkToTheLibraryIsFollowed) {
    const Installation installation("lib");
    installation.addCatalogue(germanCatalogue());
    const fs::path links = installation.folder / "some/where/else";
    fs::create_directories(links.parent_path());
    fs::create_directory_symlink(installation.folder / "lib", links);
    EXPECT_THAT(installation.output(links), ElementsAre(caption));
}

TEST(CatalogueSearchTest, AMissingCatalogueGivesIdsAndIsLogged) {
    if (fs::exists("/usr/share/locale/de/LC_MESSAGES/orv-agent.mo")) {
        GTEST_SKIP() << "this machine has catalogues of its own";
    }
    const Installation installation("lib");
    EXPECT_THAT(installation.output(),
                ElementsAre(AllOf(HasSubstr(" log 6000 Corvane.Locale "),
                                  EndsWith("no catalogue orv-agent.mo for language \"de\": expected one in "
                                           "share/locale beside " +
                                           (installation.folder / "lib").string())),
                            id));
}

TEST(CatalogueSearchTest, ACatalogueThatCannotBeReadGivesIdsAndIsLogged) {
    const Installation installation("lib");
    std::filesystem::create_directories(installation.catalogue());
    EXPECT_THAT(
        installation.output(),
        ElementsAre(EndsWith(installation.catalogue().string() + ": is not a regular file: Invalid argument"), id));
}

TEST(CatalogueSearchTest, ADamagedCatalogueGivesIdsAndIsLogged) {
    const Installation installation("lib");
    installation.addCatalogue("damaged");
    EXPECT_THAT(installation.output(),
                ElementsAre(EndsWith(installation.catalogue().string() +
                                     ": no message catalogue: its first four bytes are not the magic number"),
                            id));
}

} // namespace

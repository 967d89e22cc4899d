#include "ResourceLibrary.h"

#include "TestSupport.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

using Norv::ResourceLibrary;
using testing::HasSubstr;

/** The numbers of a catalogue with one message, in the order of the format. */
struct CatalogueData {
    std::uint32_t magic = 0x950412de;
    std::uint32_t revision = 0;
    std::uint32_t count = 1;
    std::uint32_t idPlace = 44;
    std::uint32_t idSize = 2;
    std::uint32_t textPlace = 47;
    std::uint32_t textSize = 4;
    std::string strings{"id\0t\xc3\xa4xt\0", 9};

    std::string bytes(bool bigEndian = false) const {
        const std::vector<std::uint32_t> numbers{magic, revision, count,   28,       36,       0,
                                                 0,     idSize,   idPlace, textSize, textPlace};
        std::string bytes;
        for (const std::uint32_t number : numbers) {
            std::string four;
            for (int shift = 0; shift < 32; shift += 8) {
                four += static_cast<char>(number >> shift & 0xff);
            }
            if (bigEndian) {
                std::ranges::reverse(four);
            }
            bytes += four;
        }
        return bytes + strings;
    }
};

std::string errorOf(const std::string& catalogue) {
    try {
        const ResourceLibrary library(catalogue);
    } catch (const std::runtime_error& error) {
        return error.what();
    }
    return "no error";
}

TEST(ResourceLibraryTest, FindsTextsInBothByteOrders) {
    for (const bool bigEndian : {false, true}) {
        const ResourceLibrary library(CatalogueData{}.bytes(bigEndian));
        EXPECT_EQ(library.find(L"id"), L"t\u00e4x");
    }
}

TEST(ResourceLibraryTest, GivesUnknownIdsBack) {
    EXPECT_EQ(ResourceLibrary(CatalogueData{}.bytes()).find(L"other"), L"other");
    EXPECT_EQ(ResourceLibrary().find(L"id"), L"id");
}

TEST(ResourceLibraryTest, TheCataloguesDescriptionOfItselfIsNoText) {
    EXPECT_EQ(ResourceLibrary(CatalogueData{.idSize = 0}.bytes()).find(L""), L"");
}

TEST(ResourceLibraryTest, SaysWhatIsWrongWithADamagedCatalogue) {
    EXPECT_EQ(errorOf(""), "ends after 0 bytes: expected 4 more at 0");
    EXPECT_EQ(errorOf("no catalogue at all"), "no message catalogue: its first four bytes are not the magic number");
    EXPECT_EQ(errorOf(CatalogueData{.revision = 0x20000}.bytes()), "a message catalogue of revision 2: expected 0");
    EXPECT_EQ(errorOf(CatalogueData{.textPlace = 50}.bytes()), "ends after 53 bytes: expected 4 more at 50");
    EXPECT_EQ(errorOf(CatalogueData{.textPlace = 0xffffffff}.bytes()),
              "ends after 53 bytes: expected 4 more at 4294967295");
    EXPECT_EQ(errorOf(CatalogueData{.idSize = 0xffffffff}.bytes()),
              "ends after 53 bytes: expected 4294967295 more at 44");
    EXPECT_EQ(errorOf(CatalogueData{.textPlace = 48, .textSize = 1}.bytes()), "message 0 is not in UTF-8");
    EXPECT_THAT(errorOf(CatalogueData{.count = 0xffffffff}.bytes()), HasSubstr("ends after 53 bytes"));
}

// However a catalogue is damaged, it is either read or refused. The sanitizers check for invalid reads.
TEST(ResourceLibraryTest, NoDamageIsTakenForMemory) {
    for (const char* language : {"en", "de", "ja"}) {
        const std::string whole =
            AgentTest::contentOf(std::string(ORV_CATALOGUES "/") + language + "/LC_MESSAGES/orv-agent.mo");
        ASSERT_EQ(errorOf(whole), "no error");
        for (std::size_t size = 0; size < 28; ++size) {
            EXPECT_NE(errorOf(whole.substr(0, size)), "no error") << language << ", the first " << size << " bytes";
        }
        for (std::size_t place = 0; place < whole.size(); ++place) {
            errorOf(whole.substr(0, place));
            for (const char value : {'\x00', '\x7f', '\xff'}) {
                std::string damaged = whole;
                damaged[place] = value;
                errorOf(damaged);
            }
        }
    }
}

} // namespace

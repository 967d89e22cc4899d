/**
 * The built library's file: its exports, its names, and the libraries that it needs.
 */
#include "ProviderLibrary.h"
#include "Transcript.h"

#include <gmock/gmock.h>

#include <array>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <sstream>
#include <stdexcept>

namespace OrvTest {
namespace {

using testing::AnyOf;
using testing::Each;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::IsSupersetOf;
using testing::Not;
using testing::SizeIs;
using testing::StartsWith;
using testing::UnorderedElementsAre;
using testing::UnorderedElementsAreArray;

/** The lines that a command prints. */
Lines outputOf(const std::string& command) {
    const std::unique_ptr<std::FILE, int (*)(std::FILE*)> pipe(popen(command.c_str(), "r"), &pclose);
    if (pipe == nullptr) {
        throw std::runtime_error(command + ": cannot be run");
    }
    std::string text;
    std::array<char, 4096> chunk = {};
    while (const std::size_t size = std::fread(chunk.data(), 1, chunk.size(), pipe.get())) {
        text.append(chunk.data(), size);
    }
    std::istringstream stream(text);
    Lines lines;
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::string quotedFile() {
    return " '" + ProviderLibrary::file + '\'';
}

/** The last words of nm's lines, or all from the symbol's name on where names are demangled. */
Lines symbols(const std::string& options) {
    Lines names;
    for (const std::string& line : outputOf(ORV_NM " --dynamic --format=posix " + options + quotedFile())) {
        names.push_back(line.substr(0, line.find(" U ") == std::string::npos ? line.find(' ') : line.find(" U ")));
    }
    return names;
}

/** The lines of readelf that have a text in them. */
Lines readelf(const std::string& options, const std::string& text) {
    Lines lines = outputOf(ORV_READELF " --wide " + options + quotedFile());
    std::erase_if(lines, [&](const std::string& line) { return line.find(text) == std::string::npos; });
    return lines;
}

/** One kind of entry in the dynamic section. */
Lines dynamicLines(const std::string& kind) {
    return readelf("--dynamic", '(' + kind + ')');
}

/** The values between brackets of one kind of entry in the dynamic section. */
Lines dynamicEntries(const std::string& kind) {
    Lines values;
    for (const std::string& line : dynamicLines(kind)) {
        const std::size_t opening = line.find('[');
        values.push_back(line.substr(opening + 1, line.find(']') - opening - 1));
    }
    return values;
}

/** The program headers of one kind. */
Lines segment(const std::string& kind) {
    return readelf("--program-headers", "  " + kind + ' ');
}

TEST(ProviderFile, ExportsTheFactoriesAndNothingElse) {
    EXPECT_THAT(symbols("--defined-only"),
                UnorderedElementsAre("PowerManagementServiceProvider_Create_InstanceMI",
                                     "PowerManagementServiceProvider_Create_MethodMI",
                                     "PowerManagementCapabilitiesProvider_Create_InstanceMI",
                                     "AssociatedPowerManagementServiceProvider_Create_InstanceMI",
                                     "AssociatedPowerManagementServiceProvider_Create_AssociationMI",
                                     "PowerManagementElementCapabilitiesProvider_Create_InstanceMI",
                                     "PowerManagementElementCapabilitiesProvider_Create_AssociationMI",
                                     "PowerManagementHostedServiceProvider_Create_InstanceMI",
                                     "PowerManagementHostedServiceProvider_Create_AssociationMI"));
}

TEST(ProviderFile, IsCalledByItsSoname) {
    EXPECT_THAT(dynamicEntries("SONAME"), ElementsAre("liborvpowerstatemanagementprovider.so.1"));
    const std::filesystem::path folder = std::filesystem::path(ProviderLibrary::file).parent_path();
    EXPECT_TRUE(std::filesystem::equivalent(folder / "liborvpowerstatemanagementprovider.so.1", ProviderLibrary::file));
}

TEST(ProviderFile, HasNoExecutableStack) {
    EXPECT_THAT(segment("GNU_STACK"), ElementsAre(HasSubstr(" RW ")));
}

TEST(ProviderFile, IsReadOnlyWhereTheLoaderIsDone) {
    EXPECT_THAT(segment("GNU_RELRO"), SizeIs(1));
    EXPECT_THAT(dynamicLines("FLAGS"), ElementsAre(HasSubstr("BIND_NOW")));
    EXPECT_THAT(dynamicLines("FLAGS_1"), ElementsAre(HasSubstr("NOW")));
}

TEST(ProviderFile, HasNoRelocationsInItsCode) {
    EXPECT_THAT(dynamicLines("TEXTREL"), IsEmpty());
    EXPECT_THAT(dynamicLines("FLAGS"), Each(Not(HasSubstr("TEXTREL"))));
}

TEST(ProviderFile, NeedsTheAgentsLibrariesAndTheRuntimeOnly) {
    const Lines needed = dynamicEntries("NEEDED");
    EXPECT_THAT(needed, IsSupersetOf({"liborvcommon.so.1", "liborvinstrumentation.so.1", "liborvlocale.so.1",
                                      "liborvlog.so.1", "libstdc++.so.6"}));
    EXPECT_THAT(needed, Each(AnyOf(StartsWith("liborvcommon.so.1"), StartsWith("liborvinstrumentation.so.1"),
                                   StartsWith("liborvlocale.so.1"), StartsWith("liborvlog.so.1"),
                                   StartsWith("libstdc++.so"), StartsWith("libgcc_s.so"), StartsWith("libc.so"),
                                   StartsWith("libm.so"), StartsWith("ld-linux"), StartsWith("libasan.so"),
                                   StartsWith("libubsan.so"), StartsWith("libtsan.so"))));
}

TEST(ProviderFile, UsesOfTheAgentExactlyWhatItsContractHas) {
    const Lines contract = {
        "Norv::getSystemName[abi:cxx11]()",
        "Norv::isObjPathsEqual(_CMPIObjectPath const*, _CMPIObjectPath const*, bool)",
        "Norv::Instrumentation::Instrumentation()",
        "Norv::Instrumentation::~Instrumentation()",
        "Norv::Instrumentation::selectNode(Norv::NodeLexicon::NodeType)",
        "Norv::Instrumentation::operator bool()",
        "Norv::Instrumentation::operator++()",
        "Norv::Instrumentation::getPathToNode[abi:cxx11]()",
        "Norv::Instrumentation::convertPathToString(std::__cxx11::basic_string<char, std::char_traits<char>, "
        "std::allocator<char> > const&)",
        "Norv::Instrumentation::getProperty(Norv::NodeLexicon::Properties, std::vector<unsigned int, "
        "std::allocator<unsigned int> >&)",
        "Norv::Instrumentation::getProperty(Norv::NodeLexicon::Properties, unsigned int&)",
        "Norv::Instrumentation::setProperty(Norv::NodeLexicon::Properties, unsigned int&)",
        "Norv::Locale::getLanguageId()",
        "Norv::Locale::getResourceLibrary(unsigned int, unsigned int)",
        "Norv::ResourceString::ResourceString(Norv::ResourceLibrary const&, std::__cxx11::basic_string<wchar_t, "
        "std::char_traits<wchar_t>, std::allocator<wchar_t> > const&)",
        "Norv::ResourceString::operator std::__cxx11::basic_string<wchar_t, std::char_traits<wchar_t>, "
        "std::allocator<wchar_t> > const&() const",
        "Norv::make_string(std::__cxx11::basic_string<wchar_t, std::char_traits<wchar_t>, "
        "std::allocator<wchar_t> > const&)",
        "OrvLog::OrvMessageBuffer::OrvMessageBuffer()",
        "OrvLog::OrvMessageBuffer::~OrvMessageBuffer()",
        "OrvLog::OrvMessageBuffer::operator<<(char const*)",
        "OrvLog::OrvMessageBuffer::operator std::ostream&()",
        "OrvLog::OrvMessageBuffer::str[abi:cxx11](OrvLog::OrvMessageBuffer&)",
        "OrvLog::OrvMessageBuffer::str[abi:cxx11](std::ostream&)",
        "OrvLog::OrvLogger::logLevelMessage(char const*, char const*, int, std::__cxx11::basic_string<char, "
        "std::char_traits<char>, std::allocator<char> > const&, int, char*, int, int, "
        "std::__cxx11::basic_string<char, std::char_traits<char>, std::allocator<char> > const&)",
        "OrvLog::OrvLogger::traceLevelMessage(char const*, char const*, int, std::__cxx11::basic_string<char, "
        "std::char_traits<char>, std::allocator<char> > const&, int, char*, int, int, "
        "std::__cxx11::basic_string<char, std::char_traits<char>, std::allocator<char> > const&)",
    };
    Lines used;
    for (const std::string& name : symbols("--undefined-only --demangle")) {
        if (name.find("Norv::") == 0 || name.find("OrvLog::") == 0) {
            used.push_back(name);
        }
    }
    EXPECT_THAT(used, UnorderedElementsAreArray(contract));
}

} // namespace
} // namespace OrvTest

#include "Norv/Locale.h"

#include "ResourceLibrary.h"
#include "base/RegularFile.h"
#include "base/Utf8.h"

#include "OrvLog/OrvLogger.h"

#include <dlfcn.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <string_view>

namespace Norv {

namespace Locale {

namespace {

namespace fs = std::filesystem;

/** The language's id is its index. */
constexpr auto languages = std::to_array<std::string_view>({ORV_LANGUAGES});
constexpr unsigned int english = 0;

constexpr unsigned int powerManagementLibrary = 2;

// A locale name is language[_territory][.codeset][@modifier].
std::string_view languageOf(std::string_view locale) {
    return locale.substr(0, locale.find_first_of("_.@"));
}

std::string_view localeOfEnvironment() {
    for (const char* variable : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
        if (const char* value = std::getenv(variable); value != nullptr && *value != '\0') {
            return value;
        }
    }
    return "C";
}

// The folder of this library's file. Symbolic links to the file are resolved, since they may be in another folder.
fs::path ownFolder() {
    Dl_info information{};
    if (dladdr(languages.data(), &information) == 0) {
        throw std::runtime_error("the library does not know the file that it was loaded from");
    }
    return fs::weakly_canonical(information.dli_fname).parent_path();
}

fs::path catalogueFile(std::string_view language) {
    const fs::path folder = ownFolder();
    for (const fs::path& share : {folder / "../share", folder / "../../share", fs::path("/usr/share")}) {
        fs::path file = (share / "locale" / language / "LC_MESSAGES/orv-agent.mo").lexically_normal();
        if (fs::exists(file)) {
            return file;
        }
    }
    throw std::runtime_error("no catalogue orv-agent.mo for language \"" + std::string(language) +
                             "\": expected one in share/locale beside " + folder.native());
}

ResourceLibrary readCatalogue(const fs::path& file) {
    const auto content = Agent::readRegularFile(file);
    if (!content) {
        throw std::runtime_error(file.native() + ": has been removed");
    }
    try {
        return ResourceLibrary(content->text);
    } catch (const std::runtime_error& error) {
        throw std::runtime_error(file.native() + ": " + error.what());
    }
}

// Loads a language's texts. If its catalogue is missing or damaged, the language has no texts; the reason is logged.
ResourceLibrary load(std::string_view language) {
    try {
        return readCatalogue(catalogueFile(language));
    } catch (const std::runtime_error& error) {
        OrvLog::OrvLogger::logLevelMessage(__func__, __FILE__, __LINE__, "Corvane.Locale", 6000, nullptr, 0, 0,
                                           error.what());
        return {};
    }
}

} // namespace

unsigned int getLanguageId() {
    const auto* found = std::ranges::find(languages, languageOf(localeOfEnvironment()));
    return found == languages.end() ? english : static_cast<unsigned int>(found - languages.begin());
}

const ResourceLibrary& getResourceLibrary(unsigned int number, unsigned int language) {
    struct Language {
        std::once_flag loaded;
        ResourceLibrary texts;
    };
    // Never destroyed: users hold references until the process ends.
    static auto& loadedLanguages = *std::make_unique<std::array<Language, languages.size()>>().release();
    static const auto& withoutTexts = *std::make_unique<ResourceLibrary>().release();

    if (number != powerManagementLibrary || language >= languages.size()) {
        return withoutTexts;
    }
    Language& wanted = loadedLanguages[language];
    std::call_once(wanted.loaded, [&] {
        const int error = errno;
        wanted.texts = load(languages[language]);
        errno = error;
    });
    return wanted.texts;
}

} // namespace Locale

ResourceString::ResourceString(const ResourceLibrary& library, const std::wstring& id) : _text(library.find(id)) {}

ResourceString::operator const std::wstring&() const {
    return _text;
}

std::string make_string(const std::wstring& text) {
    return Agent::utf8From(text);
}

} // namespace Norv

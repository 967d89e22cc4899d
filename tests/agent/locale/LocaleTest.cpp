#include "Norv/Locale.h"

#include "TestSupport.h"

#include <gmock/gmock.h>

#include <cerrno>
#include <clocale>
#include <cstdlib>
#include <optional>
#include <string>
#include <thread>
#include <vector>

namespace {

using Norv::make_string;
using Norv::ResourceLibrary;
using Norv::ResourceString;
using Norv::Locale::getLanguageId;
using Norv::Locale::getResourceLibrary;
using testing::StartsWith;
using testing::UnorderedElementsAre;

constexpr unsigned int powerManagement = 2;
constexpr const wchar_t* caption = L"MSGID_POWER_MANAGEMENT_CAPTION";
constexpr const wchar_t* description = L"MSGID_POWER_MANAGEMENT_DESCRIPTION";

std::string textOf(const ResourceLibrary& library, const std::wstring& id) {
    return make_string(ResourceString(library, id));
}

/** The environment variables that decide the language. One without a value is not set. */
struct Environment {
    std::optional<std::string> all = std::nullopt;
    std::optional<std::string> messages = std::nullopt;
    std::optional<std::string> lang = std::nullopt;

    void set() const {
        set("LC_ALL", all);
        set("LC_MESSAGES", messages);
        set("LANG", lang);
    }

private:
    static void set(const char* name, const std::optional<std::string>& value) {
        if (value) {
            setenv(name, value->c_str(), 1);
        } else {
            unsetenv(name);
        }
    }
};

unsigned int languageIn(const Environment& environment) {
    environment.set();
    return getLanguageId();
}

std::string captionIn(const std::string& locale) {
    return textOf(getResourceLibrary(powerManagement, languageIn({.all = locale})), caption);
}

constexpr const char* englishCaption = "Power Management Service";
constexpr const char* germanCaption = "Energieverwaltungsdienst";
constexpr const char* japaneseCaption = "電源管理サービス";

struct LanguageCase {
    const char* locale;
    const char* caption;
};

class LanguageTest : public testing::TestWithParam<LanguageCase> {};

TEST_P(LanguageTest, FollowsTheLocalesName) {
    EXPECT_EQ(captionIn(GetParam().locale), GetParam().caption);
}

INSTANTIATE_TEST_SUITE_P(Locale, LanguageTest,
                         testing::Values(LanguageCase{"en_GB.UTF-8", englishCaption}, LanguageCase{"de", germanCaption},
                                         LanguageCase{"de_DE", germanCaption}, LanguageCase{"de.UTF-8", germanCaption},
                                         LanguageCase{"de@euro", germanCaption},
                                         LanguageCase{"de_DE.ISO-8859-15@euro", germanCaption},
                                         LanguageCase{"ja_JP.eucJP", japaneseCaption},
                                         LanguageCase{"C", englishCaption}, LanguageCase{"C.UTF-8", englishCaption},
                                         LanguageCase{"POSIX", englishCaption}, LanguageCase{"fr_FR", englishCaption},
                                         LanguageCase{"deu", englishCaption}, LanguageCase{"_", englishCaption}));

TEST(LocaleTest, TheFirstVariableThatIsSetAndNotEmptyDecides) {
    const unsigned int english = languageIn({});
    const unsigned int german = languageIn({.all = "de"});
    const unsigned int japanese = languageIn({.all = "ja"});
    EXPECT_NE(english, german);
    EXPECT_NE(english, japanese);
    EXPECT_NE(german, japanese);

    EXPECT_EQ(languageIn({.all = "de", .messages = "ja", .lang = "en"}), german);
    EXPECT_EQ(languageIn({.messages = "ja", .lang = "de"}), japanese);
    EXPECT_EQ(languageIn({.lang = "de"}), german);
    EXPECT_EQ(languageIn({.all = "", .messages = "", .lang = "ja"}), japanese);
    EXPECT_EQ(languageIn({.all = "C", .lang = "de"}), english);
}

TEST(LocaleTest, EveryLanguageHasBothTexts) {
    for (const char* language : {"en", "de", "ja"}) {
        const auto& library = getResourceLibrary(powerManagement, languageIn({.all = language}));
        for (const wchar_t* id : {caption, description}) {
            EXPECT_NE(textOf(library, id), make_string(id)) << language;
        }
    }
}

TEST(LocaleTest, AnUnknownIdIsItsOwnText) {
    const auto& library = getResourceLibrary(powerManagement, languageIn({}));
    EXPECT_EQ(textOf(library, L"MSGID_UNKNOWN"), "MSGID_UNKNOWN");
    EXPECT_EQ(textOf(library, L""), "");
}

TEST(LocaleTest, AnUnknownLibraryOrLanguageHasNoTexts) {
    EXPECT_EQ(textOf(getResourceLibrary(1, languageIn({})), caption), make_string(caption));
    EXPECT_EQ(textOf(getResourceLibrary(powerManagement, 999), caption), make_string(caption));
}

TEST(LocaleTest, ALibraryIsTheSameOneEachTime) {
    const unsigned int language = languageIn({});
    EXPECT_EQ(&getResourceLibrary(powerManagement, language), &getResourceLibrary(powerManagement, language));
}

TEST(LocaleTest, ThreadsGetTheSameTexts) {
    const unsigned int language = languageIn({.all = "ja"});
    std::vector<std::thread> threads;
    std::vector<std::string> texts(8);
    for (std::string& text : texts) {
        threads.emplace_back(
            [&text, language] { text = textOf(getResourceLibrary(powerManagement, language), caption); });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_THAT(texts, testing::Each(japaneseCaption));
}

TEST(LocaleTest, TheLocaleAndTheErrorNumberOfTheProcessStay) {
    errno = EXDEV;
    EXPECT_EQ(captionIn("de_DE.UTF-8"), germanCaption);
    EXPECT_EQ(errno, EXDEV);
    EXPECT_STREQ(std::setlocale(LC_ALL, nullptr), "C");
}

TEST(LocaleTest, WideTextBecomesUtf8) {
    EXPECT_EQ(make_string(L""), "");
    EXPECT_EQ(make_string(L"a\u007f\u0080\u07ff\u0800\uffff\U00010000\U0010ffff"),
              "a\x7f\xc2\x80\xdf\xbf\xe0\xa0\x80\xef\xbf\xbf\xf0\x90\x80\x80\xf4\x8f\xbf\xbf");
    EXPECT_EQ(make_string(std::wstring(L"a\0b", 3)), std::string("a\0b", 3));
}

TEST(LocaleTest, WhatIsNoCharacterIsReplaced) {
    for (const long code : {0xD800L, 0xDFFFL, 0x110000L, -1L}) {
        EXPECT_EQ(make_string({L'a', static_cast<wchar_t>(code), L'b'}), "a\uFFFDb") << code;
    }
}

TEST(LocaleTest, TheLibraryExportsItsInterfaceAndNothingElse) {
    EXPECT_THAT(AgentTest::linesOf("nm -DC --defined-only --format=just-symbols '" ORV_LOCALE_LIBRARY "' | sort -u"),
                UnorderedElementsAre(
                    "Norv::Locale::getLanguageId()", "Norv::Locale::getResourceLibrary(unsigned int, unsigned int)",
                    StartsWith("Norv::ResourceString::ResourceString(Norv::ResourceLibrary const&, "),
                    StartsWith("Norv::ResourceString::operator std::"), StartsWith("Norv::make_string(")));
}

} // namespace

#include "base/Utf8.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <iterator>
#include <string>

namespace {

using Norv::Agent::beginningOf;
using Norv::Agent::utf8From;
using Norv::Agent::wideFrom;

TEST(Utf8Test, IsReadAsItIsWritten) {
    const std::wstring text = L"a\u007f\u0080\u07ff\u0800\ud7ff\ue000\uffff\U00010000\U0010ffff";
    EXPECT_EQ(wideFrom(utf8From(text)), text);
    EXPECT_EQ(wideFrom(""), L"");
}

TEST(Utf8Test, IsNotReadFromAnythingElse) {
    for (const char* text : {"\x80", "\xc3", "\xc3(", "\xc0\xaf", "\xe0\x80\xaf", "\xed\xa0\x80", "\xf4\x90\x80\x80",
                             "\xff", "a\xe3\x81"}) {
        EXPECT_EQ(wideFrom(text), std::nullopt) << testing::PrintToString(text);
    }
}

TEST(Utf8Test, BeginsWithWholeCharacters) {
    const std::string text = "a\u00e4\u96fbb";
    const char* const beginnings[] = {"", "a", "a", "a\u00e4", "a\u00e4", "a\u00e4", "a\u00e4\u96fb", "a\u00e4\u96fbb"};
    for (std::size_t longest = 0; longest < std::size(beginnings); ++longest) {
        EXPECT_EQ(beginningOf(text, longest), beginnings[longest]);
    }
    EXPECT_EQ(beginningOf(text, 1000), text);
}

} // namespace

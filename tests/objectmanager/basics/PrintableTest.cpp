#include "basics/Printable.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>

namespace ObjectManager {
namespace {

TEST(PrintableTest, LeavesNothingThatBreaksALogOrATerminal) {
    const std::pair<std::string, const char*> cases[] = {
        {"name \xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80", "name \xc3\xa4\xe2\x82\xac\xf0\x9f\x98\x80"},
        {"a\nb\x1b[31m\x7f", "a\\x0ab\\x1b[31m\\x7f"},
        {std::string("\0", 1), "\\x00"},
        {"\xc2\x9b"
         "31m",
         "\\xc2\\x9b31m"}, // U+009B begins a control sequence, as ESC [ does
        {"\x9b"
         "31m",
         "\\x9b31m"}, // not valid in UTF-8
        {"\xe2\x80\xae"
         "x",
         "\\xe2\\x80\\xaex"},                // U+202E reverses the direction of text
        {"\xc0\x8a", "\\xc0\\x8a"},          // a line feed, encoded in too many bytes
        {"\xed\xa0\x80", "\\xed\\xa0\\x80"}, // half of a surrogate pair
        {"\xe2\x82", "\\xe2\\x82"},          // an incomplete character
    };
    for (const auto& [text, expected] : cases) {
        EXPECT_EQ(printable(text), expected);
    }
}

TEST(PrintableTest, CutsNoCharacterInTwo) {
    EXPECT_EQ(printable("abc", 3), "abc");
    EXPECT_EQ(printable("abcd", 3), "abc...");
    EXPECT_EQ(printable("ab\xc3\xa4z", 3), "ab\xc3\xa4...");
    EXPECT_EQ(printable("ab\nz", 3), "ab\\x0a...");
}

} // namespace
} // namespace ObjectManager

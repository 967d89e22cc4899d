#include "text/Layout.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ObjectManager {
namespace {

using testing::ElementsAre;

TEST(Layout, CountsCharactersAndNotBytes) {
    EXPECT_EQ(columnsOf(""), 0U);
    EXPECT_EQ(columnsOf("abc"), 3U);
    EXPECT_EQ(columnsOf("\u00e4\u96fb"), 2U);
}

TEST(Layout, SplitsATextAtItsBlanks) {
    EXPECT_THAT(wordsOf("a bc d"), ElementsAre("a", "bc", "d"));
    EXPECT_THAT(wordsOf(""), ElementsAre(""));
    EXPECT_EQ(filled(wordsOf("two  blanks "), 0), "two  blanks ");
}

TEST(Layout, BreaksALineThatWouldBeTooLong) {
    const std::string word(40, 'x');
    EXPECT_EQ(filled({word, word, "y"}, 0), word + " " + word + " y");
    EXPECT_EQ(filled({word, word, word}, 4), word + " " + word + "\n    " + word);
    EXPECT_EQ(filled({word, word}, 19), word + " " + word);
    EXPECT_EQ(filled({word, word}, 20), word + "\n" + std::string(20, ' ') + word);
}

TEST(Layout, DoesNotBreakAWord) {
    const std::string word(200, 'x');
    EXPECT_EQ(filled({word, "y"}, 2), word + "\n  y");
}

TEST(Layout, AlignsColumnsAndLeavesNoBlanksAtTheEnd) {
    EXPECT_EQ(aligned({rowOf({"NAME", "CODE", "TEXT"}), rowOf({"a", "12345", ""}),
                       rowOf({"\u00e4\u00f6\u00fcb", "1", "x y"})}),
              "NAME  CODE   TEXT\n"
              "a     12345\n"
              "\u00e4\u00f6\u00fcb  1      x y\n");
    EXPECT_EQ(aligned({rowOf({"a", "b"})}, 2), "  a  b\n");
    EXPECT_EQ(aligned({}), "");
}

TEST(Layout, DoesNotBreakThePiecesOfTheLastCell) {
    const std::string piece = std::string(30, 'x') + " " + std::string(29, 'x');
    EXPECT_EQ(aligned({{{"a"}, {piece, piece}}}), "a  " + piece + "\n   " + piece + "\n");
}

TEST(Layout, FillsTheLastColumn) {
    const std::string word(60, 'x');
    EXPECT_EQ(aligned({rowOf({"a", word + " " + word})}, 1), " a  " + word + "\n    " + word + "\n");
}

} // namespace
} // namespace ObjectManager

#include "cimxml/Characters.h"

#include <gtest/gtest.h>

namespace ObjectManager::CimXml {
namespace {

std::string inText(std::string_view text) {
    std::string document = "|";
    appendText(document, text);
    return document;
}

std::string inAttribute(std::string_view text) {
    std::string document = "|";
    appendAttributeText(document, text);
    return document;
}

TEST(Characters, areWrittenSoThatTheyAreReadBack) {
    EXPECT_EQ(inText(""), "|");
    EXPECT_EQ(inText("plain \xC3\xA4 \xE2\x82\xAC \xF0\x9F\x94\x8C"), "|plain \xC3\xA4 \xE2\x82\xAC \xF0\x9F\x94\x8C");
    EXPECT_EQ(inText("<a> & \"b\"\tc\r\n"), "|&lt;a&gt; &amp; \"b\"\tc&#13;\n");
    EXPECT_EQ(inAttribute("<a> & \"b\"\tc\r\n"), "|&lt;a&gt; &amp; &quot;b&quot;&#9;c&#13;&#10;");
}

TEST(Characters, thatXmlCannotSayAreReplaced) {
    const std::string replacement = "\xEF\xBF\xBD";
    EXPECT_EQ(inText(std::string("a\0b", 3)), "|a" + replacement + "b");
    EXPECT_EQ(inText("a\x1B"), "|a" + replacement);
    EXPECT_EQ(inText("\xFF"), "|" + replacement);
    EXPECT_EQ(inText("\xC3("), "|" + replacement + "(");
    EXPECT_EQ(inText("\xE2\x82"), "|" + replacement + replacement);
}

struct Sequence {
    std::string_view bytes;
    std::size_t length;
};

TEST(Characters, haveTheLengthOfTheirUtf8) {
    const Sequence sequences[] = {
        {"a", 1},
        {"\n", 1},
        {"\x0B", 0},
        {"\xC2\x80", 2},
        {"\xC1\xBF", 0},     // too long a form
        {"\xE0\x9F\xBF", 0}, // too long a form
        {"\xED\xA0\x80", 0}, // half of a surrogate pair
        {"\xEF\xBF\xBE", 0}, // no character
        {"\xEF\xBF\xBD", 3},
        {"\xF0\x8F\xBF\xBF", 0}, // too long a form
        {"\xF4\x8F\xBF\xBF", 4},
        {"\xF4\x90\x80\x80", 0}, // beyond the last
        {"\x80", 0},
    };
    for (const Sequence& sequence : sequences) {
        EXPECT_EQ(characterLength(sequence.bytes, 0), sequence.length) << testing::PrintToString(sequence.bytes);
    }
}

} // namespace
} // namespace ObjectManager::CimXml

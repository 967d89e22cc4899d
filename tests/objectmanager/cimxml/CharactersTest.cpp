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

TEST(Characters, AreWrittenSoThatTheyAreReadBack) {
    EXPECT_EQ(inText(""), "|");
    EXPECT_EQ(inText("plain \xC3\xA4 \xE2\x82\xAC \xF0\x9F\x94\x8C"), "|plain \xC3\xA4 \xE2\x82\xAC \xF0\x9F\x94\x8C");
    EXPECT_EQ(inText("<a> & \"b\"\tc\r\n"), "|&lt;a&gt; &amp; \"b\"\tc&#13;\n");
    EXPECT_EQ(inAttribute("<a> & \"b\"\tc\r\n"), "|&lt;a&gt; &amp; &quot;b&quot;&#9;c&#13;&#10;");
}

TEST(Characters, ThatXmlCannotSayAreReplaced) {
    const std::string replacement = "\xEF\xBF\xBD";
    EXPECT_EQ(inText(std::string("a\0b", 3)), "|a" + replacement + "b");
    EXPECT_EQ(inText("a\x1B"), "|a" + replacement);
    EXPECT_EQ(inText("\xFF"), "|" + replacement);
    EXPECT_EQ(inText("\xC3("), "|" + replacement + "(");
    EXPECT_EQ(inText("\xE2\x82"), "|" + replacement + replacement);
}

TEST(Characters, AreThoseOfUtf8AndXml) {
    for (const std::string_view character :
         {"a", "\n", "\xC2\x80", "\xEF\xBF\xBD", "\xF0\x90\x80\x80", "\xF4\x8F\xBF\xBF"}) {
        EXPECT_EQ(inText(character), "|" + std::string(character)) << testing::PrintToString(character);
    }
    const std::string_view wrong[] = {
        "\x0B",
        "\x80",
        "\xC1\xBF",         // too long a form
        "\xE0\x9F\xBF",     // too long a form
        "\xED\xA0\x80",     // half of a surrogate pair
        "\xEF\xBF\xBE",     // no character
        "\xF0\x8F\xBF\xBF", // too long a form
        "\xF4\x90\x80\x80", // beyond the last
    };
    for (const std::string_view bytes : wrong) {
        std::string replaced = "|";
        for (std::size_t i = 0; i < bytes.size(); ++i) {
            replaced += "\xEF\xBF\xBD";
        }
        EXPECT_EQ(inText(bytes), replaced) << testing::PrintToString(bytes);
    }
}

} // namespace
} // namespace ObjectManager::CimXml

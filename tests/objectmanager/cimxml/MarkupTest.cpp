#include "cimxml/Markup.h"

#include "cimxml/ProtocolError.h"

#include <gtest/gtest.h>

namespace ObjectManager::CimXml {
namespace {

/** The text of the root; the error message if the document is refused. */
std::string read(const std::string& text) {
    try {
        return parseMarkup(text).text;
    } catch (const ProtocolError& error) {
        EXPECT_STREQ(error.cimError(), error.status() == Http::badRequest ? "request-not-well-formed" : nullptr);
        return std::to_string(error.status()) + ' ' + error.what();
    }
}

std::string repeated(const std::string& text, std::size_t times) {
    std::string all;
    for (std::size_t i = 0; i < times; ++i) {
        all += text;
    }
    return all;
}

TEST(Markup, GivesTheTextOfAnElement) {
    EXPECT_EQ(read("<A>x</A>"), "x");
    EXPECT_EQ(read("\xEF\xBB\xBF<?xml version='1.0' encoding='UTF-8'?>\n<!-- c --><A >x</A >\n<!-- d -->\n"), "x");
    EXPECT_EQ(read("<!DOCTYPE CIM SYSTEM \"http://example.com/[x].dtd\">\n<A>x</A>"), "x");
    EXPECT_EQ(read("<A a=\"1 > 2\" b='\"'> <![CDATA[<x>]]> &lt;&#x20AC;&#65;<?pi?><!-- c --> </A>"),
              " <x> <\xE2\x82\xAC"
              "A ");
    EXPECT_EQ(read("<A/>"), "");
    EXPECT_EQ(read("<A>&#00000000065;&#x" + repeated("0", 1000) + "41;</A>"), "AA");
}

struct Malformed {
    std::string text;
    std::string complaint;
};

class MalformedMarkup : public testing::TestWithParam<Malformed> {};

TEST_P(MalformedMarkup, IsRefused) {
    EXPECT_EQ(read(GetParam().text), "400 the body is not XML: at byte " + GetParam().complaint);
}

INSTANTIATE_TEST_SUITE_P(
    Documents, MalformedMarkup,
    testing::Values(
        Malformed{"", "1, found the end of the document, expected an element"},
        Malformed{"<!-- c -->", "11, found the end of the document, expected an element"},
        Malformed{"text", "1, found 'text', expected the root, and at most one document type before it"},
        Malformed{"<A/>x", "5, found 'x', expected nothing after the root"},
        Malformed{"<A/>&amp;", "5, found '&amp;', expected what XML allows there"},
        Malformed{"<A/><![CDATA[x]]>", "5, found '<![CDATA[x]]>', expected nothing after the root"},
        Malformed{"<A/><B/>", "5, found '<B/>', expected nothing after the root"},
        Malformed{"<A>", "4, found the end of the document, expected the end of the element A"},
        Malformed{"<A></B>", "6, found 'B>', expected the end of the element A"},
        Malformed{"</A>", "2, found '/A>', expected what XML allows there"},
        Malformed{"<A></A b=\"c\">", "8, found 'b=\"c\">', expected what XML allows there"},
        Malformed{"<A></A", "4, found '</A', expected the end of what begins there"},
        Malformed{"<A", "1, found '<A', expected the end of what begins there"},
        Malformed{"<", "1, found '<', expected the end of what begins there"},
        Malformed{"<A b>", "5, found '>', expected what XML allows there"},
        Malformed{"<A b=c>", "6, found 'c>', expected what XML allows there"},
        Malformed{"<A b=\"c>", "1, found '<A b=\"c>', expected the end of what begins there"},
        Malformed{"<A b=\"<\"/>", "7, found '<\"/>', expected what XML allows there"},
        Malformed{"<A b=\"1\"c=\"2\"/>", "9, found 'c=\"2\"/>', expected what XML allows there"},
        Malformed{"<A b=\"1\" b=\"2\"/>", "10, found 'b=\"2\"/>', expected every attribute of an element once"},
        Malformed{
            "<A>&nbsp;</A>",
            "4, found '&nbsp;</A>', expected one of the five entities of XML or a reference to a character that it allows"},
        Malformed{
            "<A b=\"&#0;\"/>",
            "7, found '&#0;\"/>', expected one of the five entities of XML or a reference to a character that it allows"},
        Malformed{
            "<A>&#xD800;</A>",
            "4, found '&#xD800;</A>', expected one of the five entities of XML or a reference to a character that it allows"},
        Malformed{
            "<A>&#99999999999;</A>",
            "4, found '&#99999999999;</A>', expected one of the five entities of XML or a reference to a character that it allows"},
        Malformed{"<A>&#;</A>", "6, found ';</A>', expected what XML allows there"},
        Malformed{"<A>& b</A>", "5, found ' b</A>', expected what XML allows there"},
        Malformed{"<!DOCTYPE A [<!ENTITY e \"x\">]><A>&e;</A>",
                  "13, found declarations in the document type, expected none"},
        Malformed{"<!DOCTYPE A [<!ENTITY % e SYSTEM \"x\">%e;]><A/>",
                  "13, found declarations in the document type, expected none"},
        Malformed{"<!DOCTYPE A []><A/>", "13, found declarations in the document type, expected none"},
        Malformed{"<!DOCTYPE A", "12, found the end of the document, expected an element"},
        Malformed{"<!DOCTYPE A><!DOCTYPE A><A/>",
                  "13, found '<!DOCTYPE A><A/>', expected the root, and at most one document type before it"},
        Malformed{"<A/><!DOCTYPE A>", "5, found '<!DOCTYPE A>', expected nothing after the root"},
        Malformed{"<A><!ENTITY e \"x\"></A>", "6, found 'ENTITY e \"x\"></A>', expected what XML allows there"},
        Malformed{
            "<!DOCTYPE A SYSTEM \"x\"><A>&e;</A>",
            "27, found '&e;', expected one of the five entities of XML or a reference to a character that it allows"},
        Malformed{
            "<!DOCTYPE A SYSTEM \"x\"><A b=\"&e;\"/>",
            "24, found '&e;', expected one of the five entities of XML or a reference to a character that it allows"},
        Malformed{"<A><!-- ", "4, found '<!-- ', expected the end of what begins there"},
        Malformed{"<A><!-- a -- b --></A>", "13, found ' b --></A>', expected what XML allows there"},
        Malformed{"<A>]]></A>", "6, found '></A>', expected what XML allows there"},
        Malformed{"<A><![CDATA[ ]]", "14, found ']]', expected the end of a CDATA section"},
        Malformed{"<?xml version='1.0'", "1, found '<?xml version='1.0'', expected the end of what begins there"},
        Malformed{" <?xml version='1.0'?><A/>",
                  "2, found '<?xml version='1.0'?', expected the XML declaration at the beginning only"},
        Malformed{"<?xml encoding='utf-8'?><A/>",
                  "7, found 'encoding='utf-8'?><A', expected an XML declaration with a version"},
        Malformed{"<A>\xFF</A>", "4, found the byte 0xFF, expected what XML allows there"},
        Malformed{"<A>\x01</A>", "4, found the byte 0x01, expected what XML allows there"},
        Malformed{"<A>\xE2\x82", "4, found the byte 0xE2, expected a whole character of UTF-8"},
        Malformed{"<A>\xED\xA0\x80</A>", "4, found the byte 0xED, expected what XML allows there"},
        Malformed{"<1/>", "2, found '1/>', expected what XML allows there"},
        Malformed{std::string("<A>\0</A>", 8), "4, found the byte 0x00, expected a character of UTF-8 that XML allows"},
        Malformed{std::string("\xFF\xFE<\0A\0/\0>\0", 10),
                  "4, found the byte 0x00, expected a character of UTF-8 that XML allows"}));

TEST(Markup, InAnotherEncodingIsRefused) {
    EXPECT_EQ(read("<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?><A/>"),
              "415 found the encoding \"ISO-8859-1\", expected utf-8");
}

/** If the document type has an external part, expat assumes that every unknown entity is declared there. */
TEST(Markup, HasNoOtherEntitiesUnderADocumentTypeThatIsNotRead) {
    EXPECT_EQ(read("<!DOCTYPE A SYSTEM \"x\"><A b=\"&lt;&#65;\">&lt;</A>"), "<");
}

TEST(Markup, InUtf8IsReadWhenItSaysAscii) {
    EXPECT_EQ(read("<?xml version='1.0' encoding='US-ASCII'?><A>\xC3\xA4</A>"), "\xC3\xA4");
}

TEST(Markup, GivesAttributesAndChildrenInTheirOrder) {
    const XmlElement root = parseMarkup("<A b='1' c='&quot;'><B/>x<C>y</C></A>");
    EXPECT_EQ(root.name, "A");
    ASSERT_NE(root.attribute("c"), nullptr);
    EXPECT_EQ(*root.attribute("c"), "\"");
    EXPECT_EQ(root.attribute("B"), nullptr);
    ASSERT_EQ(root.children.size(), 2U);
    EXPECT_EQ(root.children[0].name, "B");
    EXPECT_EQ(root.children[1].text, "y");
    EXPECT_EQ(root.text, "x");
}

TEST(Markup, IsBoundedInDepthAttributesAndElements) {
    EXPECT_EQ(read(repeated("<A>", maximumDepth) + repeated("</A>", maximumDepth)), "");
    EXPECT_EQ(read(repeated("<A>", 1'000'000)), "400 the body is not XML: at byte " +
                                                    std::to_string(maximumDepth * 3 + 1) +
                                                    ", found more than 100 nested elements");
    std::string attributes = "<A";
    for (std::size_t i = 0; i <= maximumAttributes; ++i) {
        attributes += " a" + std::to_string(i) + "=''";
    }
    EXPECT_NE(read(attributes + "/>").find("found more than 50 attributes"), std::string::npos);
    EXPECT_EQ(read("<A>" + repeated("<B/>", maximumElements - 1) + "</A>"), "");
    EXPECT_NE(read("<A>" + repeated("<B/>", maximumElements) + "</A>").find("found more than 100000 elements"),
              std::string::npos);
}

} // namespace
} // namespace ObjectManager::CimXml

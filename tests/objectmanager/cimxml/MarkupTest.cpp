#include "cimxml/Markup.h"

#include "cimxml/ProtocolError.h"

#include <gtest/gtest.h>

namespace ObjectManager::CimXml {
namespace {

/** The text of the root; what is wrong where it is not read. */
std::string read(const std::string& text) {
    pugi::xml_document document;
    try {
        parseMarkup(text, document);
    } catch (const ProtocolError& error) {
        EXPECT_STREQ(error.cimError(), error.status() == Http::badRequest ? "request-not-well-formed" : nullptr);
        return std::to_string(error.status()) + ' ' + error.what();
    }
    return textOf(document.document_element());
}

std::string repeated(const std::string& text, std::size_t times) {
    std::string all;
    for (std::size_t i = 0; i < times; ++i) {
        all += text;
    }
    return all;
}

TEST(Markup, givesTheTextOfAnElement) {
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

TEST_P(MalformedMarkup, isRefused) {
    EXPECT_EQ(read(GetParam().text), "400 the body is no XML: at byte " + GetParam().complaint);
}

INSTANTIATE_TEST_SUITE_P(
    Documents, MalformedMarkup,
    testing::Values(
        Malformed{"", "1, there is no element"}, Malformed{"<!-- c -->", "11, there is no element"},
        Malformed{"text", "1, found text outside the root"}, Malformed{"<A/>x", "5, found text outside the root"},
        Malformed{"<A/>&amp;", "5, found text outside the root"},
        Malformed{"<A/><![CDATA[x]]>", "14, found text outside the root"},
        Malformed{"<A/><B/>", "6, found a second root, expected one"},
        Malformed{"<A>", "4, the end of the element A is missing"},
        Malformed{"<A></B>", "8, found the end of B, expected that of A"},
        Malformed{"</A>", "5, found the end of A, expected that of nothing"},
        Malformed{"<A></A b=\"c\">", "8, found no '>' behind the end of A"},
        Malformed{"<A></A", "7, found no '>' behind the end of A"}, Malformed{"<A", "3, found no end of the tag A"},
        Malformed{"<", "2, found no name"}, Malformed{"<A b>", "5, found no '=' behind the attribute b"},
        Malformed{"<A b=c>", "6, found no quote before the value of the attribute b"},
        Malformed{"<A b=\"c>", "9, found no end of the value of the attribute b"},
        Malformed{"<A b=\"<\"/>", "7, found no end of the value of the attribute b"},
        Malformed{"<A b=\"1\"c=\"2\"/>", "9, found no end of the tag A"},
        Malformed{"<A b=\"1\" b=\"2\"/>", "11, found the attribute b twice"},
        Malformed{"<A>&nbsp;</A>", "5, found '&nbsp', expected one of the five entities of XML or a reference to a "
                                   "character that it allows"},
        Malformed{"<A b=\"&#0;\"/>", "8, found '&#0', expected one of the five entities of XML or a reference to a "
                                     "character that it allows"},
        Malformed{"<A>&#xD800;</A>", "5, found '&#xD800', expected one of the five entities of XML or a reference to "
                                     "a character that it allows"},
        Malformed{"<A>&#99999999999;</A>", "5, found '&#999999999', expected one of the five entities of XML or a "
                                           "reference to a character that it allows"},
        Malformed{"<A>&#" + repeated("9", 1000) + ";</A>",
                  "5, found '&#999999999', expected one of the five entities of XML or a reference to a character that "
                  "it allows"},
        Malformed{"<A>&#00000000000;</A>",
                  "5, found '&#000000000', expected one of the five entities of XML or a reference to a character that "
                  "it allows"},
        Malformed{"<A>&#;</A>", "5, found '&#', expected one of the five entities of XML or a reference to a character "
                                "that it allows"},
        Malformed{"<A>& b</A>", "5, found '&', expected one of the five entities of XML or a reference to a character "
                                "that it allows"},
        Malformed{"<!DOCTYPE A [<!ENTITY e \"x\">]><A>&e;</A>",
                  "13, found declarations in the document type, expected none"},
        Malformed{"<!DOCTYPE A", "12, the end of the document type is missing"},
        Malformed{"<A/><!DOCTYPE A>", "14, found a document type, expected it before the root"},
        Malformed{"<A><!ENTITY e \"x\"></A>", "6, found a declaration, expected none"},
        Malformed{"<A><!-- ", "8, the end of a comment is missing"},
        Malformed{"<A><![CDATA[ ]]", "13, the end of a CDATA section is missing"},
        Malformed{"<?xml version='1.0'", "1, the end of the XML declaration is missing"},
        Malformed{"<A>\xFF</A>", "4, there is a byte that is not UTF-8, or a character that XML does not allow"},
        Malformed{std::string("<A>\0</A>", 8),
                  "4, there is a byte that is not UTF-8, or a character that XML does not allow"},
        Malformed{"<A>\x01</A>", "4, there is a byte that is not UTF-8, or a character that XML does not allow"}));

TEST(Markup, inAnotherEncodingIsRefused) {
    EXPECT_EQ(read("<?xml version=\"1.0\" encoding=\"ISO-8859-1\"?><A/>"),
              "415 found the encoding \"ISO-8859-1\", expected utf-8");
}

TEST(Markup, isBoundedInDepthAndAttributes) {
    EXPECT_EQ(read(repeated("<A>", maximumDepth) + repeated("</A>", maximumDepth)), "");
    EXPECT_EQ(read(repeated("<A>", 1'000'000)), "400 the body is no XML: at byte " +
                                                    std::to_string(maximumDepth * 3 + 3) +
                                                    ", found more than 100 elements within each other");
    std::string attributes = "<A";
    for (std::size_t i = 0; i <= maximumAttributes; ++i) {
        attributes += " a" + std::to_string(i) + "=''";
    }
    EXPECT_NE(read(attributes + "/>").find("found more than 50 attributes"), std::string::npos);
}

} // namespace
} // namespace ObjectManager::CimXml

#include "cimxml/Query.h"

#include "classes/Catalogue.h"
#include "classes/MofReader.h"
#include "model/CimError.h"

#include <gtest/gtest.h>

namespace ObjectManager::CimXml {
namespace {

class QueryTest : public testing::Test {
protected:
    /** "yes" or "no"; if the query is refused, the status code and the reason. */
    std::string answer(const std::string& condition) const { return answerTo("SELECT * FROM C WHERE " + condition); }

    std::string answerTo(const std::string& text, const std::string& language = "WQL") const {
        try {
            const Query query = parseQuery(text, language);
            checkQuery(query, *_catalogue.find("C"));
            return matches(query, _instance) ? "yes" : "no";
        } catch (const CimError& error) {
            return std::to_string(static_cast<int>(error.code)) + ' ' + error.what();
        }
    }

    const Catalogue _catalogue{
        readMof("class C { [Key] string Name; uint64 Large; sint64 Small; real64 Real; boolean On; "
                "char16 Letter; datetime Made; string None; uint8 Many[]; };",
                "c.mof")};
    const Instance _instance{{"", "", "C", {}},
                             {{"Name", stringValue("it's")},
                              {"Large", unsignedValue(CMPI_uint64, 18446744073709551615U)},
                              {"Small", signedValue(CMPI_sint64, -5)},
                              {"Real", realValue(CMPI_real64, 0.5)},
                              {"On", booleanValue(true)},
                              {"Letter", Value{CMPI_char16, u'x'}},
                              {"Made", dateTimeValue("20260101120000.000000+060")},
                              {"None", nullValue(CMPI_string)}}};
};

struct Asked {
    std::string condition;
    std::string answer;
};

class ConditionTest : public QueryTest, public testing::WithParamInterface<Asked> {};

TEST_P(ConditionTest, IsAnswered) {
    EXPECT_EQ(answer(GetParam().condition), GetParam().answer) << GetParam().condition;
}

INSTANTIATE_TEST_SUITE_P(
    Conditions, ConditionTest,
    testing::Values(
        Asked{"Name = 'it''s'", "yes"}, Asked{"Name = 'it\\'s'", "yes"}, Asked{"Name = \"it's\"", "yes"},
        Asked{"name = \"IT'S\"", "no"}, Asked{"C.Name <> 'x'", "yes"}, Asked{"Name != 'x'", "yes"},
        Asked{"Name > 'a' AND Name <= 'z'", "yes"}, Asked{"Large > 9223372036854775807", "yes"},
        Asked{"Large = 18446744073709551615", "yes"}, Asked{"Large > -1", "yes"}, Asked{"Small < 0", "yes"},
        Asked{"Small > -6 and Small < -4", "yes"}, Asked{"Small = -5.0", "yes"}, Asked{"Real >= 5.0e-1", "yes"},
        Asked{"Real < 1", "yes"}, Asked{"On = TRUE", "yes"}, Asked{"On <> true", "no"}, Asked{"Letter = 'x'", "yes"},
        Asked{"Made = '20260101110000.000000+000'", "yes"}, Asked{"Made < '20260101120000.000000+000'", "yes"},
        Asked{"None IS NULL", "yes"}, Asked{"Name IS NOT NULL", "yes"}, Asked{"Many IS NULL", "yes"},
        Asked{"None = 'x'", "no"}, Asked{"NOT None = 'x'", "no"}, Asked{"None = 'x' OR On = TRUE", "yes"},
        Asked{"NOT (None = 'x' AND On = FALSE)", "yes"}, Asked{"On = TRUE OR On = FALSE AND On = FALSE", "yes"},
        Asked{"(On = TRUE OR On = FALSE) AND On = FALSE", "no"}, Asked{"NOT NOT On = TRUE", "yes"}));

INSTANTIATE_TEST_SUITE_P(
    Refusals, ConditionTest,
    testing::Values(
        Asked{"", "15 found the end in the query, expected a property"},
        Asked{"Name", "15 found the end in the query, expected =, <>, <, <=, >, >= or IS"},
        Asked{"Name = ", "15 found the end in the query, expected a text in quotes, a number, TRUE or FALSE"},
        Asked{"Name = 'x", "15 found the end in the query, expected ' after the text"},
        Asked{"Name = x", "15 found 'x' in the query, expected a text in quotes, a number, TRUE or FALSE"},
        Asked{"(Name = 'x'", "15 found the end in the query, expected AND, OR or ')'"},
        Asked{"Name = 'x' 'y'", "15 found 'y' in the query, expected AND, OR or the end"},
        Asked{"Name IS 'x'", "15 found 'x' in the query, expected NULL"},
        Asked{"D.Name = 'x'", "15 found a property of D in the query, expected properties of C"},
        Asked{"Other = 'x'", "15 found the property Other in the query, expected properties of C"},
        Asked{"Name = 1",
              "15 found a comparison of Name with a sint64 in the query, expected what can be compared with a "
              "string in this way"},
        Asked{"On > TRUE",
              "15 found a comparison of On with a boolean in the query, expected what can be compared with a "
              "boolean in this way"},
        Asked{"Made > 'now'", "15 found a comparison of Made with a string in the query, expected what can be compared "
                              "with a datetime in this way"},
        Asked{"Many = 1",
              "15 found a comparison of Many with a sint64 in the query, expected what can be compared with a "
              "uint8[] in this way"},
        Asked{"Name LIKE 'i%'", "14 found 'LIKE' in the query, expected no more than SELECT properties FROM one class "
                                "WHERE comparisons"},
        Asked{"upper(Name) = 'X'",
              "14 found 'upper(' in the query, expected no more than SELECT properties FROM one class "
              "WHERE comparisons"}));

TEST_F(QueryTest, SelectsPropertiesOfOneClass) {
    EXPECT_EQ(answerTo("select name, c.on from c"), "yes");
    EXPECT_EQ(answerTo("SELECT Name FROM C", "DMTF:CQL"), "yes");
    EXPECT_EQ(answerTo("SELECT Name FROM C", "SQL"), "14 found the query language \"SQL\", expected WQL or DMTF:CQL");
    EXPECT_EQ(answerTo("SELECT Other FROM C"), "15 found the property Other in the query, expected properties of C");
    EXPECT_EQ(
        answerTo("SELECT * FROM C, D"),
        "14 found 'FROM C,' in the query, expected no more than SELECT properties FROM one class WHERE comparisons");
    EXPECT_EQ(
        answerTo("SELECT COUNT(*) FROM C"),
        "14 found 'COUNT(' in the query, expected no more than SELECT properties FROM one class WHERE comparisons");
    EXPECT_EQ(answerTo("DELETE FROM C"), "15 found 'DELETE' in the query, expected SELECT");
    EXPECT_EQ(answerTo("SELECT * FROM C ORDER BY Name"), "14 found 'ORDER' in the query, expected no more than SELECT "
                                                         "properties FROM one class WHERE comparisons");
}

/** A query cannot be made so deep or so long that it keeps a thread busy or exhausts its stack. */
TEST_F(QueryTest, IsBoundedInDepthAndLength) {
    EXPECT_EQ(answer(std::string(100'000, '(')), "15 found '(' in the query, expected at most 50 nested conditions");
    std::string text = "On = FALSE";
    for (int i = 0; i < 999; ++i) {
        text += " OR On = FALSE";
    }
    EXPECT_EQ(answer(text), "no");
    EXPECT_EQ(answer(text + " OR On = TRUE"), "15 found 'On' in the query, expected at most 1000 comparisons");
}

} // namespace
} // namespace ObjectManager::CimXml

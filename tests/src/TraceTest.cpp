#include "Trace.h"

#include "RequestFixture.h"

#include <gmock/gmock.h>

#include <cstring>
#include <map>
#include <stdexcept>
#include <thread>

namespace OrvTest {
namespace {

using testing::Each;
using testing::ElementsAre;

struct Shape {
    const char* what;
    int type;
    const char* plain;
    const char* withParameters;
};

void PrintTo(const Shape& shape, std::ostream* out) {
    *out << shape.what;
}

class TraceShapes : public testing::TestWithParam<Shape> {
protected:
    Norv::MessageType type = static_cast<Norv::MessageType>(GetParam().type);
};

TEST_P(TraceShapes, ATextIsFormattedByItsType) {
    EXPECT_STREQ(Norv::trace("doIt", "src/A.cpp", 17, type), GetParam().plain);
}

TEST_P(TraceShapes, AParameterListIsAppended) {
    EXPECT_STREQ(Norv::tracepara("doIt", "src/A.cpp", 17, " a=1 b=2", type), GetParam().withParameters);
}

INSTANTIATE_TEST_SUITE_P(
    Trace, TraceShapes,
    testing::Values(Shape{"entering", 0, "ENTERING: doIt() in src/A.cpp [Line: 17]",
                          "ENTERING: doIt() in src/A.cpp [Line: 17],Parameters List:  a=1 b=2"},
                    Shape{"exiting", 1, "EXITING: doIt() in src/A.cpp [Line: 17]",
                          "EXITING: doIt() in src/A.cpp [Line: 17],Parameters List:  a=1 b=2"},
                    Shape{"method", 2, "METHOD: doIt() was invoked in src/A.cpp [Line: 17]",
                          "METHOD: doIt() was invoked in src/A.cpp [Line: 17],Parameters List:  a=1 b=2"},
                    Shape{"message", 3, "MESSAGE [File: src/A.cpp, Line: 17]: doIt",
                          "MESSAGE [File: src/A.cpp, Line: 17]: doIt,Parameters List:  a=1 b=2"},
                    Shape{"above the known types", 4, "ENTERING: doIt() in src/A.cpp [Line: 17]",
                          "ENTERING: doIt() in src/A.cpp [Line: 17],Parameters List:  a=1 b=2"},
                    Shape{"below the known types", -1, "ENTERING: doIt() in src/A.cpp [Line: 17]",
                          "ENTERING: doIt() in src/A.cpp [Line: 17],Parameters List:  a=1 b=2"}));

TEST(Trace, TheNumbersOfTheTypesAreFixed) {
    EXPECT_EQ(Norv::ENTERING, 0);
    EXPECT_EQ(Norv::EXITING, 1);
    EXPECT_EQ(Norv::METHOD, 2);
    EXPECT_EQ(Norv::MESSAGE, 3);
}

TEST(Trace, AVariableIsShownWithItsText) {
    EXPECT_STREQ(Norv::trace("name", "src/A.cpp", 17, "a value"),
                 "VARIABLE: 'name' has Value 'a value' at line 17 in src/A.cpp");
}

TEST(Trace, AVariableIsShownWithItsNumber) {
    EXPECT_STREQ(Norv::trace("powerState", "src/A.cpp", 17, 65535U),
                 "VARIABLE: 'powerState' has Value '65535' at line 17 in src/A.cpp");
}

TEST(Trace, ANumberThatIsNoSignedOneIsShownAsIfItWere) {
    EXPECT_STREQ(Norv::trace("value", "src/A.cpp", 17, 4294967295U),
                 "VARIABLE: 'value' has Value '-1' at line 17 in src/A.cpp");
}

TEST(Trace, ATextThatIsMissingIsShownAsSuch) {
    EXPECT_STREQ(Norv::trace("name", "src/A.cpp", 17, nullptr),
                 "VARIABLE: 'name' has Value '(null)' at line 17 in src/A.cpp");
    EXPECT_STREQ(Norv::tracepara("doIt", "src/A.cpp", 17, nullptr, Norv::EXITING),
                 "EXITING: doIt() in src/A.cpp [Line: 17],Parameters List: (null)");
}

/** The four helpers, each with a text of the caller's choice in it. */
struct Helper {
    const char* name;
    char* (*format)(const char* text);
    /** What stands before the text. */
    const char* before;
};

void PrintTo(const Helper& helper, std::ostream* out) {
    *out << helper.name;
}

const Helper helpers[] = {
    {"trace of a type", [](const char* text) { return Norv::trace(text, "f", 1, Norv::MESSAGE); },
     "MESSAGE [File: f, Line: 1]: "},
    {"tracepara", [](const char* text) { return Norv::tracepara(text, "f", 1, "p", Norv::MESSAGE); },
     "MESSAGE [File: f, Line: 1]: "},
    {"trace of a text variable", [](const char* text) { return Norv::trace(text, "f", 1, "v"); }, "VARIABLE: '"},
    {"trace of a number variable", [](const char* text) { return Norv::trace(text, "f", 1, 2U); }, "VARIABLE: '"},
};

class TraceBuffers : public testing::TestWithParam<Helper> {
protected:
    const Helper& helper = GetParam();
};

TEST_P(TraceBuffers, TheSecondCallOverwritesTheFirst) {
    const char* first = helper.format("first");
    const char* second = helper.format("second");
    EXPECT_EQ(first, second);
    EXPECT_THAT(first, testing::HasSubstr("second"));
}

TEST_P(TraceBuffers, TheWholeBufferIsClearedFirst) {
    helper.format(std::string(400, 'x').c_str());
    const char* text = helper.format("y");
    const std::size_t length = std::strlen(text);
    EXPECT_THAT(std::string(text + length, 512 - length), Each('\0'));
}

TEST_P(TraceBuffers, ATextThatIsTooLongIsCutAt511Characters) {
    const std::string whole = helper.before + std::string(1000, 'x');
    EXPECT_EQ(std::string(helper.format(std::string(1000, 'x').c_str())), whole.substr(0, 511));
}

TEST_P(TraceBuffers, ATextOf511CharactersIsWhole) {
    const std::string longest(511 - std::strlen(helper.format("")), 'x');
    const std::string text = helper.format(longest.c_str());
    EXPECT_EQ(text.size(), 511);
    EXPECT_THAT(text, testing::HasSubstr(longest));
}

TEST_P(TraceBuffers, EachThreadHasItsOwn) {
    const char* mine = helper.format("mine");
    const char* other = nullptr;
    std::string othersText;
    std::thread([&] {
        other = helper.format("other");
        othersText = other;
    }).join();
    EXPECT_NE(mine, other);
    EXPECT_THAT(mine, testing::HasSubstr("mine"));
    EXPECT_THAT(othersText, testing::HasSubstr("other"));
}

INSTANTIATE_TEST_SUITE_P(Trace, TraceBuffers, testing::ValuesIn(helpers));

TEST(Trace, EachHelperHasItsOwnBuffer) {
    const char* plain = Norv::trace("a", "f", 1, Norv::METHOD);
    const char* withParameters = Norv::tracepara("b", "f", 2, "p", Norv::METHOD);
    const char* text = Norv::trace("c", "f", 3, "v");
    const char* number = Norv::trace("d", "f", 4, 5U);
    EXPECT_STREQ(plain, "METHOD: a() was invoked in f [Line: 1]");
    EXPECT_STREQ(withParameters, "METHOD: b() was invoked in f [Line: 2],Parameters List: p");
    EXPECT_STREQ(text, "VARIABLE: 'c' has Value 'v' at line 3 in f");
    EXPECT_STREQ(number, "VARIABLE: 'd' has Value '5' at line 4 in f");
}

class TraceMarks : public RequestFixture {
protected:
    const std::string category = "Corvane.Test";
    const std::string separator = std::string(78, '=');
};

TEST_F(TraceMarks, TheEntryMarkIsASeparatorAndAnEnteringLine) {
    Norv::markProviderEntry(category, "Some_Operation", "src/Some.cpp", 1234);
    const std::string entering = "ENTERING: Some_Operation() in src/Some.cpp [Line: 1234]";
    const std::string mark = "4000 Corvane.Test markProviderEntry include/Trace.h:";
    EXPECT_THAT(transcript.everything(),
                ElementsAre("OrvMessageBuffer()",                                                    //
                            "OrvMessageBuffer << " + separator, "log " + mark + "336: " + separator, //
                            "OrvMessageBuffer << " + separator, "trace " + mark + "336: " + separator,
                            "~OrvMessageBuffer()",                                                 //
                            "OrvMessageBuffer()",                                                  //
                            "OrvMessageBuffer << " + entering, "log " + mark + "337: " + entering, //
                            "OrvMessageBuffer << " + entering, "trace " + mark + "337: " + entering,
                            "~OrvMessageBuffer()"));
}

TEST_F(TraceMarks, TheExitMarkIsAnExitingLineAndASeparator) {
    Norv::markProviderExit(category, "Some_Operation", "src/Some.cpp", 1234);
    const std::string exiting = "EXITING: Some_Operation() in src/Some.cpp [Line: 1234]";
    const std::string mark = "4000 Corvane.Test markProviderExit include/Trace.h:";
    EXPECT_THAT(transcript.everything(),
                ElementsAre("OrvMessageBuffer()",                                                //
                            "OrvMessageBuffer << " + exiting, "log " + mark + "348: " + exiting, //
                            "OrvMessageBuffer << " + exiting, "trace " + mark + "348: " + exiting,
                            "~OrvMessageBuffer()",                                                   //
                            "OrvMessageBuffer()",                                                    //
                            "OrvMessageBuffer << " + separator, "log " + mark + "349: " + separator, //
                            "OrvMessageBuffer << " + separator, "trace " + mark + "349: " + separator,
                            "~OrvMessageBuffer()"));
}

TEST_F(TraceMarks, TheBufferIsReleasedWhereTheLogThrows) {
    agent.faults.at("traceLevelMessage", 1, throws(std::runtime_error("disk full")));
    EXPECT_THROW(Norv::markProviderEntry(category, "Some_Operation", "src/Some.cpp", 1), std::runtime_error);
    EXPECT_EQ(agent.messageBuffers, 0);
}

TEST_F(TraceMarks, ThreadsDoNotMixTheirTexts) {
    constexpr int times = 500;
    const auto mark = [&](const char* function) {
        for (int time = 0; time < times; ++time) {
            Norv::markProviderEntry(category, function, "src/Some.cpp", 1);
        }
    };
    std::thread other(mark, "A_Short");
    mark("AnOperationWithALongName_EnumerateInstanceNames");
    other.join();

    std::map<std::string, int> counts;
    for (const std::string& line : transcript.everything()) {
        if (line.find("OrvMessageBuffer") == std::string::npos) {
            ++counts[line.substr(line.find(": ") + 2)];
        }
    }
    EXPECT_THAT(counts, testing::UnorderedElementsAre(
                            testing::Pair(separator, 4 * times),
                            testing::Pair("ENTERING: A_Short() in src/Some.cpp [Line: 1]", 2 * times),
                            testing::Pair(
                                "ENTERING: AnOperationWithALongName_EnumerateInstanceNames() in src/Some.cpp [Line: 1]",
                                2 * times)));
}

} // namespace
} // namespace OrvTest

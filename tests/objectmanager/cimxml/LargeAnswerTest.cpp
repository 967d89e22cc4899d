/* Answers that are sent while they are made. */
#include "RecordingOutlet.h"
#include "ServiceFixture.h"

#include <gmock/gmock.h>

#include <cstdlib>

namespace ObjectManager::CimXml {
namespace {

using testing::AllOf;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::SizeIs;

constexpr std::size_t pieceBytes = Server::Outlet::pieceBytes;

class LargeAnswerTest : public ServiceFixture {
protected:
    LargeAnswerTest() { setenv("TEST_MORE_DISKS", "1000", 1); }
    ~LargeAnswerTest() override {
        unsetenv("TEST_MORE_DISKS");
        unsetenv("TEST_FAST_DISKS_FAIL");
    }

    HttpReply ask(const std::string& method, const std::string& parameters, Server::Outlet* outlet) {
        const auto headers = requestHeaders(method);
        const std::string body = requestBody(method, parameters);
        return service().answer({"POST", headers, body, outlet}, {"operator", true, true});
    }

    static std::string className(const std::string& name) {
        return "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"" + name + "\"/></IPARAMVALUE>";
    }

    static std::string number(const std::string& parameter, int value) {
        return "<IPARAMVALUE NAME=\"" + parameter + "\"><VALUE>" + std::to_string(value) + "</VALUE></IPARAMVALUE>";
    }

    static std::string text(const std::string& parameter, const std::string& value) {
        return "<IPARAMVALUE NAME=\"" + parameter + "\"><VALUE>" + value + "</VALUE></IPARAMVALUE>";
    }

    /** The text after the name of an output parameter in the reply to a pull operation. */
    static std::string contextOf(const HttpReply& reply) {
        const std::string before = "NAME=\"EnumerationContext\" PARAMTYPE=\"string\"><VALUE>";
        const std::size_t start = reply.body.find(before);
        return start == std::string::npos ? std::string()
                                          : reply.body.substr(start + before.size(), 2 * sizeof(std::uint64_t) * 2);
    }

    RecordingOutlet _outlet;
};

/** For each operation that can have a large reply: the pieces make up the document, and no piece is much too large. */
TEST_F(LargeAnswerTest, GoInPiecesThatMakeUpTheWhole) {
    const std::pair<std::string, std::string> requests[] = {
        {"EnumerateInstances", className("Test_Disk")},
        {"ExecQuery", text("QueryLanguage", "WQL") + text("Query", "SELECT * FROM Test_Disk")},
        {"OpenEnumerateInstances", className("Test_Disk") + number("MaxObjectCount", 5000)}};
    for (const auto& [method, parameters] : requests) {
        const HttpReply whole = ask(method, parameters, nullptr);
        RecordingOutlet outlet;
        const HttpReply rest = ask(method, parameters, &outlet);
        ASSERT_TRUE(outlet.begun) << method;
        EXPECT_EQ(outlet.joined(rest).body, whole.body) << method;
        EXPECT_EQ(outlet.begun->status, 200U) << method;
        EXPECT_EQ(headerOf(*outlet.begun, "CIMOperation"), "MethodResponse") << method;
        EXPECT_NE(headerOf(*outlet.begun, "WBEMServerResponseTime"), "") << method;
        EXPECT_THAT(whole.body, EndsWith("</CIM>\n")) << method;
        EXPECT_GT(outlet.pieces.size(), 1U) << method;
        for (const std::string& piece : outlet.pieces) {
            EXPECT_LT(piece.size(), 2 * pieceBytes) << method;
        }
        EXPECT_EQ(rest.problem, "") << method;
        EXPECT_LT(rest.body.size(), pieceBytes) << method;
    }
}

TEST_F(LargeAnswerTest, AreReturnedAsAWholeWhereTheyFitOnePiece) {
    const HttpReply reply = ask("EnumerateInstanceNames", className("Test_Disk"), &_outlet);
    EXPECT_FALSE(_outlet.begun);
    EXPECT_THAT(reply.body, EndsWith("</CIM>\n"));
    EXPECT_LT(reply.body.size(), pieceBytes);
}

TEST_F(LargeAnswerTest, TellHowMuchMemoryTheyAreMadeOf) {
    ask("EnumerateInstances", className("Test_Disk"), &_outlet);
    EXPECT_GT(_outlet.held, 1000U * 100U);
    const std::size_t asInstances = _outlet.held;
    ask("OpenEnumerateInstances", className("Test_Disk") + number("MaxObjectCount", 500), &_outlet);
    EXPECT_GT(_outlet.held, asInstances + 1000U * 100U) << "with the text that waits to be pulled";
}

TEST_F(LargeAnswerTest, OfPullOperationsGoInPieces) {
    const HttpReply opened = ask("OpenEnumerateInstances", className("Test_Disk"), nullptr);
    const std::string context = contextOf(opened);
    const HttpReply pulled =
        ask("PullInstancesWithPath", text("EnumerationContext", context) + number("MaxObjectCount", 5000), &_outlet);
    ASSERT_TRUE(_outlet.begun);
    EXPECT_GT(_outlet.pieces.size(), 3U);
    EXPECT_GT(_outlet.held, 1000U * 100U);
    const HttpReply atOnce =
        ask("OpenEnumerateInstances", className("Test_Disk") + number("MaxObjectCount", 5000), nullptr);
    const auto objectsOf = [](const std::string& body) {
        const std::size_t start = body.find("<IRETURNVALUE>");
        return body.substr(start, body.find("</IRETURNVALUE>") - start);
    };
    EXPECT_EQ(objectsOf(_outlet.joined(pulled).body), objectsOf(atOnce.body));
}

/** Not even the first objects are sent before it is certain that the others can be kept. */
TEST_F(LargeAnswerTest, OfOpenOperationsAreErrorsWhereThereIsNoRoomForTheRest) {
    Service small = serviceWith({.enumerations = {.count = 4, .bytes = 100'000, .time = std::chrono::seconds(60)}});
    const auto headers = requestHeaders("OpenEnumerateInstances");
    const std::string body =
        requestBody("OpenEnumerateInstances", className("Test_Disk") + number("MaxObjectCount", 500));
    const HttpReply reply = small.answer({"POST", headers, body, &_outlet}, {"operator", true, true});
    EXPECT_FALSE(_outlet.begun);
    EXPECT_THAT(reply.body, HasSubstr("<ERROR CODE=\"27\""));
}

/** The provider of a descendant fails after the instances of its ancestor have been sent. */
TEST_F(LargeAnswerTest, AreBrokenOffWhereTheOperationFailsBehindTheFirstByte) {
    setenv("TEST_FAST_DISKS_FAIL", "1", 1);
    EXPECT_THAT(ask("EnumerateInstances", className("Test_Disk"), nullptr).body,
                AllOf(HasSubstr("<ERROR CODE=\"2\""), Not(HasSubstr("<INSTANCE "))));
    const HttpReply rest = ask("EnumerateInstances", className("Test_Disk"), &_outlet);
    ASSERT_TRUE(_outlet.begun);
    EXPECT_EQ(rest.problem, "Test_FastDisk: not for 50%\nof you");
    EXPECT_EQ(rest.body, "");
    EXPECT_THAT(_outlet.joined(rest).body, Not(HasSubstr("</CIM>")));
    EXPECT_EQ(headerOf(rest, "CIMStatusCode"), "2");
    EXPECT_EQ(headerOf(rest, "CIMStatusCodeDescription"), "Test_FastDisk: not for 50%25%0Aof you");
}

TEST_F(LargeAnswerTest, EndWhereTheClientHasGone) {
    _outlet.piecesUntilGone = 2;
    EXPECT_THROW(ask("EnumerateInstances", className("Test_Disk"), &_outlet), RecordingOutlet::Gone);
    EXPECT_THAT(_outlet.pieces, SizeIs(2));
}

} // namespace
} // namespace ObjectManager::CimXml

/* What is HTTP, and what two readers could understand differently. */
#include "server/HttpParser.h"

#include <gmock/gmock.h>

namespace ServerTest {
namespace {

using namespace ObjectManager;
using testing::HasSubstr;

std::string problemOf(const std::string& head) {
    try {
        Server::parseHead(head);
    } catch (const Server::HttpError& error) {
        return std::to_string(error.status()) + ": " + error.what();
    }
    return "";
}

TEST(HttpParserTest, ReadsAHead) {
    const std::string text = "POST /cimom HTTP/1.1\r\nHost:server.example:5988\r\nX:  two words \t\r\nEmpty:\r\n"
                             "Content-Length: 12\r\nExpect: 100-Continue\r\n\r\n";
    ASSERT_EQ(Server::sizeOfHead(text + "body"), text.size());
    const Server::RequestHead head = Server::parseHead(text);
    EXPECT_EQ(head.method, "POST");
    EXPECT_EQ(head.target, "/cimom");
    EXPECT_EQ(head.host, "server.example:5988");
    EXPECT_THAT(head.headers, testing::Contains(testing::Pair("X", "two words")));
    EXPECT_THAT(head.headers, testing::Contains(testing::Pair("Empty", "")));
    EXPECT_EQ(head.framing.length, 12U);
    EXPECT_TRUE(head.expectsContinue);
    EXPECT_TRUE(head.keepAlive);
}

TEST(HttpParserTest, KeepsAConnectionAsTheVersionHasIt) {
    EXPECT_FALSE(Server::parseHead("GET / HTTP/1.0\r\n\r\n").keepAlive);
    EXPECT_TRUE(Server::parseHead("GET / HTTP/1.0\r\nConnection: Keep-Alive\r\n\r\n").keepAlive);
    EXPECT_FALSE(Server::parseHead("GET / HTTP/1.1\r\nHost: x\r\nConnection: TE, Close\r\n\r\n").keepAlive);
}

TEST(HttpParserTest, RefusesWhatIsAmbiguous) {
    const std::string line = "POST / HTTP/1.1\r\n";
    const std::string begin = line + "Host: x\r\n";
    const std::pair<std::string, const char*> cases[] = {
        {line + "\r\n", "400: found no header Host"},
        {begin + "Host: x\r\n\r\n", "400: found several headers Host"},
        {begin + "Content-Length : 5\r\n\r\n", "400: found \"Content-Length \", expected the name of a header"},
        {begin + "Content-Length: 5\r\n 0\r\n\r\n", "400: found a header that goes on in the next line"},
        {begin + "X: a\r\n\tb\r\n\r\n", "400: found a header that goes on in the next line"},
        {line + " Host: x\r\n\r\n", "400: found a header that goes on in the next line"},
        {begin + "no colon\r\n\r\n", "400: found \"no colon\", expected the name of a header"},
        {begin + ": no name\r\n\r\n", "400: found \"\", expected the name of a header"},
        {begin + std::string("X: a\0b\r\n\r\n", 10), "400: found a control character in the header X"},
        {begin + "X: a\rb\r\n\r\n", "400: found a control character in the header X"},
        {begin + "X: a\n\r\n", "400: found the end of a line without a carriage return"},
        {begin + "\n", "400: found the end of a line without a carriage return"},
        {"POST /a b HTTP/1.1\r\nHost: x\r\n\r\n", "400: found a request line with blanks"},
        {"POST  HTTP/1.1\r\nHost: x\r\n\r\n", "400: found a request line with blanks"},
        {begin + "Content-Length: -1\r\n\r\n", "400: found the Content-Length \"-1\", expected a number"},
        {begin + "Content-Length: +1\r\n\r\n", "400: found the Content-Length"},
        {begin + "Content-Length: 1,1\r\n\r\n", "400: found the Content-Length"},
        {begin + "Content-Length:\r\n\r\n", "400: found the Content-Length"},
        {begin + "Content-Length: 1\r\nContent-Length: 01\r\n\r\n", "400: found several lengths of the body"},
        {begin + "Content-Length: 1\r\nTransfer-Encoding: chunked\r\n\r\n", "400: found several lengths of the body"},
        {begin + "Transfer-Encoding: chunked, chunked\r\n\r\n", "501: found the Transfer-Encoding"},
        {"POST / HTTP/1.0\r\nTransfer-Encoding: chunked\r\n\r\n",
         "400: found the header Transfer-Encoding in HTTP/1.0"},
        {"POST / HTTP/2.0\r\nHost: x\r\n\r\n", "505: "},
        {"POST / HTTP/1.10\r\nHost: x\r\n\r\n", "505: "},
    };
    for (const auto& [text, problem] : cases) {
        EXPECT_THAT(problemOf(text), testing::StartsWith(problem)) << text;
    }
}

TEST(HttpParserTest, TellsWhatCanBeARequestLine) {
    for (const char* text : {"", "P", "POST /", "POST / HTTP/1.1\r\n", "POST / HTTP/7.0\r\nHost"}) {
        EXPECT_TRUE(Server::mayBeRequestLine(text)) << text;
    }
    for (const char* text : {"\x16\x03\x01", "hello\r\n", "POST /\r\n", " POST / HTTP/1.1\r\n", "P\xc3\xa4"}) {
        EXPECT_FALSE(Server::mayBeRequestLine(text)) << text;
    }
}

TEST(HttpParserTest, TakesTheNameOffAHost) {
    const std::pair<const char*, const char*> cases[] = {
        {"Server.Example:5988", "server.example"},
        {"server.example.", "server.example"},
        {"[::1]:5988", "::1"},
        {"[::1]", "::1"},
        {"192.0.2.1", "192.0.2.1"},
        {"", ""},
        {"[", ""},
        {":", ""},
    };
    for (const auto& [host, name] : cases) {
        EXPECT_EQ(Server::hostNameOf(host), name) << host;
    }
}

/* Bodies in chunks. */

struct Chunked {
    std::string data;
    std::string rest;
    bool complete = false;
};

/** @param piece how many bytes come at a time. */
Chunked take(const std::string& text, std::size_t piece) {
    Server::ChunkedBody body(100);
    Chunked result;
    for (std::size_t at = 0; at < text.size(); at += piece) {
        result.rest += text.substr(at, piece);
        body.take(result.rest, result.data);
    }
    result.complete = body.isComplete();
    return result;
}

TEST(ChunkedBodyTest, IsTheSameHoweverItComes) {
    const std::string text = "3\r\nfir\r\nA;name=value\r\nst, second\r\n0\r\nTrailer: x\r\n\r\nPOST";
    for (std::size_t piece = 1; piece <= text.size(); ++piece) {
        const Chunked taken = take(text, piece);
        EXPECT_EQ(taken.data, "first, second") << piece;
        EXPECT_EQ(taken.rest, "POST") << piece;
        EXPECT_TRUE(taken.complete) << piece;
    }
}

TEST(ChunkedBodyTest, IsNotCompleteBeforeItsEnd) {
    EXPECT_FALSE(take("3\r\nfir\r\n0\r\n", 4).complete);
}

TEST(ChunkedBodyTest, RefusesWhatIsAmbiguous) {
    for (const std::string text :
         {"\r\n", "x\r\n", "-1\r\n", "0x3\r\n", "3\nabc", "3\r\nabcd\r\n", "3\r\nabc\n", "fffffffffffffffff\r\n"}) {
        EXPECT_THROW(take(text, text.size()), Server::HttpError) << text;
    }
    EXPECT_THROW(take(std::string(1000, '1'), 100), Server::HttpError);
    EXPECT_THROW(take("0\r\n" + std::string(1000, 'x'), 100), Server::HttpError);
}

} // namespace
} // namespace ServerTest

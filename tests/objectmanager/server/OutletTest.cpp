/* Answers that are sent while they are made. */
#include "Served.h"

#include <atomic>

namespace ServerTest {
namespace {

using Server::Caller;
using Server::HttpReply;
using Server::HttpRequest;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::StartsWith;

class OutletTest : public Served {
protected:
    ~OutletTest() override { _server.reset(); }

    static constexpr std::size_t pieceSize = Server::Outlet::pieceBytes;

    /** Sends "one", then "two", then "three" as the rest. */
    static HttpReply inThreePieces(const HttpRequest& request, const Caller& /*caller*/) {
        request.outlet->begin({200, {{"Content-Type", "text/plain"}}, "one"});
        request.outlet->send("two");
        return {200, {}, "three"};
    }

    /** Fails after the first piece was sent. */
    static HttpReply brokenOff(const HttpRequest& request, const Caller& /*caller*/) {
        request.outlet->begin({200, {}, "one"});
        return {200, {{"Reason", "no more"}}, "", "found no more"};
    }

    /** Sends pieces without end, and counts them. */
    HttpReply endless(const HttpRequest& request) {
        const std::string piece(pieceSize, 'x');
        request.outlet->begin({200, {}, piece});
        for (++_pieces; true; ++_pieces) {
            request.outlet->send(piece);
        }
    }

    static std::string http10(const std::string& body) {
        return "POST / HTTP/1.0\r\nConnection: Keep-Alive\r\nContent-Length: " + std::to_string(body.size()) +
               "\r\n\r\n" + body;
    }

    std::atomic<std::size_t> _pieces = 0;
};

TEST_F(OutletTest, SendsPiecesAsChunksAndKeepsTheConnection) {
    serve(inThreePieces);
    HttpClient asking = client();
    for (int i = 0; i < 2; ++i) {
        asking.send(post("x"));
        const Reply reply = asking.receive();
        EXPECT_EQ(reply.status, 200);
        EXPECT_EQ(reply.body, "onetwothree");
        EXPECT_EQ(reply.chunks, 3U);
        EXPECT_EQ(reply.headers.at("transfer-encoding"), "chunked");
        EXPECT_EQ(reply.headers.at("content-type"), "text/plain");
        EXPECT_FALSE(reply.headers.contains("content-length"));
    }
    EXPECT_THAT(logged(), IsEmpty());
}

TEST_F(OutletTest, SendsEachPieceBeforeTheNextIsMade) {
    Gate taken;
    serve([&](const HttpRequest& request, const Caller& /*caller*/) -> HttpReply {
        request.outlet->begin({200, {}, "first"});
        taken.wait();
        return {200, {}, "rest"};
    });
    HttpClient asking = client();
    asking.send(post("x"));
    std::string received;
    while (received.find("\r\n5\r\nfirst\r\n") == std::string::npos) {
        received += asking.receiveSome(1000);
    }
    taken.open();
    EXPECT_EQ(asking.receiveSome(1000), "4\r\nrest\r\n0\r\n\r\n");
}

TEST_F(OutletTest, EndsTheConnectionBehindPiecesForHttp10) {
    serve(inThreePieces);
    HttpClient asking = client();
    asking.send(http10("x"));
    const Reply reply = asking.receive();
    EXPECT_EQ(reply.body, "onetwothree");
    EXPECT_EQ(reply.headers.at("connection"), "close");
    EXPECT_FALSE(reply.headers.contains("transfer-encoding"));
    EXPECT_FALSE(asking.wasReset());
}

TEST_F(OutletTest, SendsNoPiecesToHead) {
    serve(inThreePieces);
    HttpClient asking = client();
    asking.send("HEAD / HTTP/1.1\r\nHost: localhost\r\nConnection: close\r\n\r\n");
    EXPECT_THAT(asking.receiveAll(), EndsWith("\r\n\r\n"));
}

TEST_F(OutletTest, LeavesOutTheLastChunkOfWhatIsBrokenOff) {
    serve(brokenOff);
    HttpClient asking = client();
    asking.send(post("x"));
    EXPECT_THAT(asking.receiveAll(), EndsWith("\r\n\r\n3\r\none\r\n"));
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: broke off the answer: found no more"));
}

TEST_F(OutletTest, SaysBehindTheLastChunkWhyItBrokeOffWhereTheClientTakesTrailers) {
    serve(brokenOff);
    HttpClient asking = client();
    asking.send(post("x", "TE: trailers\r\n"));
    const Reply reply = asking.receive();
    EXPECT_EQ(reply.body, "one");
    EXPECT_EQ(reply.trailers, (std::map<std::string, std::string>{{"reason", "no more"}}));
    EXPECT_EQ(asking.receiveAll(), "");
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: broke off the answer: found no more"));
}

TEST_F(OutletTest, ResetsTheConnectionToHttp10WhereItBreaksOff) {
    serve(brokenOff);
    HttpClient asking = client();
    asking.send(http10("x"));
    asking.receiveAll();
    EXPECT_TRUE(asking.wasReset());
}

TEST_F(OutletTest, MakesNoMoreThanTheClientTakes) {
    _settings.limits.idleTime = 200ms;
    serve([this](const HttpRequest& request, const Caller& /*caller*/) { return endless(request); });
    const HttpClient asking = client();
    asking.send(post("x"));
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: gone before the answer was sent"));
    // What the system keeps for a connection, and no more.
    EXPECT_LT(_pieces * pieceSize, 32'000'000U);
}

TEST_F(OutletTest, KeepsNobodyFromTheHandlerWhileAClientTakesPieces) {
    _settings.threads = 1;
    serve([this](const HttpRequest& request, const Caller& caller) {
        return request.body == "endless" ? endless(request) : echo(request, caller);
    });
    const HttpClient slow = client();
    slow.send(post("endless"));
    waitUntil([&] { return _pieces > 0; });
    EXPECT_EQ(ask(post("hello")).body, "hello");
}

TEST_F(OutletTest, LetsALargeAnswerWaitForTheMemoryOfAnother) {
    _settings.limits.allAnswersBytes = 1'000'000;
    Gate held;
    Gate release;
    std::atomic<bool> second = false;
    serve([&](const HttpRequest& request, const Caller& /*caller*/) -> HttpReply {
        if (request.body == "first") {
            request.outlet->hold(2'000'000);
            held.open();
            release.wait();
        } else if (request.body == "second") {
            request.outlet->hold(300'000);
            second = true;
        }
        return {200, {}, std::string(request.body)};
    });
    HttpClient one = client();
    one.send(post("first"));
    held.wait();
    HttpClient two = client();
    two.send(post("second"));
    EXPECT_EQ(ask(post("small")).body, "small");
    EXPECT_FALSE(second);
    release.open();
    EXPECT_EQ(one.receive().body, "first");
    EXPECT_EQ(two.receive().body, "second");
}

TEST_F(OutletTest, CutsOffAClientThatKeepsOthersWaitingForTheMemoryOfItsAnswer) {
    _settings.limits.allAnswersBytes = 1'000'000;
    _settings.hurryTime = 100ms;
    serve([this](const HttpRequest& request, const Caller& caller) {
        request.outlet->hold(2'000'000);
        return request.body == "endless" ? endless(request) : echo(request, caller);
    });
    HttpClient slow = client();
    slow.send(post("endless"));
    waitUntil([&] { return _pieces > 0; });
    EXPECT_EQ(ask(post("hello")).body, "hello");
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: cut off: others wait for the memory of an answer that is taken too "
                                       "slowly"));
}

TEST_F(OutletTest, LogsHowManyBytesOfABodyWereSent) {
    _settings.accessLog = true;
    serve([this](const HttpRequest& request, const Caller& caller) {
        return request.body == "broken" ? brokenOff(request, caller) : inThreePieces(request, caller);
    });
    ask(post("whole"));
    EXPECT_THAT(logged(1).back(), StartsWith("127.0.0.1: - \"POST /cimom\" 200 11 "));
    HttpClient asking = client();
    asking.send(post("broken"));
    asking.receiveAll();
    EXPECT_THAT(logged(3)[1], StartsWith("127.0.0.1: - \"POST /cimom\" 200 3 "));
}

TEST_F(OutletTest, StopsThoughAnAnswerWaitsForMemory) {
    _settings.limits.allAnswersBytes = 1'000'000;
    Gate held;
    serve([&](const HttpRequest& request, const Caller& caller) {
        request.outlet->hold(2'000'000);
        if (request.body == "endless") {
            held.open();
            return endless(request);
        }
        return echo(request, caller);
    });
    _settings.stopTime = 100ms;
    const HttpClient slow = client();
    slow.send(post("endless"));
    held.wait();
    const HttpClient waiting = client();
    waiting.send(post("x"));
    _server.reset();
}

} // namespace
} // namespace ServerTest

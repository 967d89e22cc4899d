/* What clients get from the server over real connections, and what it logs. */
#include "Served.h"

#include <atomic>

namespace ServerTest {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Pair;
using testing::StartsWith;

using HttpServerTest = Served;

TEST_F(HttpServerTest, HandsTheWholeRequestToTheHandler) {
    std::vector<std::pair<std::string, std::string>> headers;
    std::string method;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        headers = request.headers;
        method = request.method;
        EXPECT_EQ(caller.user, "");
        EXPECT_TRUE(caller.mayRead);
        EXPECT_TRUE(caller.mayChangePower);
        return echo(request, caller);
    });
    HttpClient asking = client();
    asking.send("M-POST /cimom HTTP/1.1\r\nHost: localhost\r\nMan: http://www.dmtf.org/cim/mapping/http/v1.0; ns=73\r\n"
                "73-CIMOperation: MethodCall\r\nContent-Length: 5\r\n\r\nhello");
    EXPECT_EQ(asking.receive().body, "hello");
    EXPECT_EQ(method, "M-POST");
    EXPECT_THAT(headers,
                ElementsAre(Pair("Host", "localhost"), Pair("Man", "http://www.dmtf.org/cim/mapping/http/v1.0; ns=73"),
                            Pair("73-CIMOperation", "MethodCall"), Pair("Content-Length", "5")));
}

TEST_F(HttpServerTest, SendsWhatTheHandlerGives) {
    serve([](const Server::HttpRequest&, const Server::Caller&) {
        return Server::HttpReply{501, {{"CIMError", "unsupported-operation"}, {"Ext", ""}}, "no", "not supported"};
    });
    const Reply reply = ask(post(""));
    EXPECT_EQ(reply.status, 501);
    EXPECT_EQ(reply.body, "no");
    EXPECT_EQ(reply.headers.at("cimerror"), "unsupported-operation");
    EXPECT_EQ(reply.headers.at("ext"), "");
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 501: not supported"));
}

TEST_F(HttpServerTest, KeepsAConnectionForTheNextRequest) {
    serve();
    HttpClient asking = client();
    for (const char* text : {"one", "two", ""}) {
        asking.send(post(text));
        EXPECT_EQ(asking.receive().body, text);
    }
    asking.send(post("four") + post("five"));
    EXPECT_EQ(asking.receive().body, "four");
    EXPECT_EQ(asking.receive().body, "five");
    EXPECT_THAT(logged(), IsEmpty());
}

TEST_F(HttpServerTest, TakesABodyInChunks) {
    serve();
    EXPECT_EQ(ask("POST / HTTP/1.1\r\nHost: localhost\r\nTransfer-Encoding: chunked\r\n\r\n"
                  "3\r\nfir\r\n4\r\nst, \r\n6\r\nsecond\r\n0\r\n\r\n")
                  .body,
              "first, second");
}

TEST_F(HttpServerTest, ServesOthersWhileAHandlerTakesItsTime) {
    Gate gate;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        if (request.body == "slow") {
            gate.wait();
        }
        return echo(request, caller);
    });
    HttpClient slow = client();
    slow.send(post("slow"));
    for (int i = 0; i < 20; ++i) {
        EXPECT_EQ(ask(post("quick")).body, "quick");
    }
    gate.open();
    EXPECT_EQ(slow.receive().body, "slow");
}

TEST_F(HttpServerTest, RunsNoMoreHandlersAtATimeThanItHasThreads) {
    constexpr int clientsAtOnce = 30;
    _settings.threads = 3;
    Gate gate;
    std::atomic<int> running = 0;
    std::atomic<int> most = 0;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        const int now = ++running;
        int before = most;
        while (before < now && !most.compare_exchange_weak(before, now)) {
        }
        gate.wait();
        --running;
        return echo(request, caller);
    });
    std::vector<HttpClient> clients;
    for (int i = 0; i < clientsAtOnce; ++i) {
        clients.push_back(client());
        clients.back().send(post("x"));
    }
    waitUntil([&] {
        return running == 3 && _server->health().find(std::to_string(clientsAtOnce) + " answered") != std::string::npos;
    });
    gate.open();
    for (HttpClient& each : clients) {
        EXPECT_EQ(each.receive().status, 200);
    }
    EXPECT_EQ(most, 3);
}

/* Bodies and headers. */

class SizeTest : public Served {
protected:
    SizeTest() {
        _settings.limits.bodyBytes = 1000;
        _settings.limits.headerBytes = 2000;
        serve();
    }
};

TEST_F(SizeTest, TakesABodyOfTheLargestSize) {
    EXPECT_EQ(ask(post(std::string(1000, 'x'))).body, std::string(1000, 'x'));
}

TEST_F(SizeTest, RefusesABodyThatIsLarger) {
    const Reply reply = ask(post(std::string(1001, 'x')));
    EXPECT_EQ(reply.status, 413);
    EXPECT_EQ(reply.body, "the body has 1001 bytes, expected 1000 at most\n");
    EXPECT_EQ(reply.headers.at("connection"), "close");
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 413: the body has 1001 bytes, expected 1000 at most"));
}

TEST_F(SizeTest, RefusesAHugeBodyBeforeItComes) {
    const Reply reply = ask("POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 1000000000000\r\n\r\n");
    EXPECT_EQ(reply.status, 413);
    EXPECT_EQ(reply.body, "the body has 1000000000000 bytes, expected 1000 at most\n");
}

TEST_F(SizeTest, RefusesABodyInChunksThatIsLarger) {
    std::string request = "POST / HTTP/1.1\r\nHost: localhost\r\nTransfer-Encoding: chunked\r\n\r\n";
    for (int i = 0; i < 20; ++i) {
        request += "64\r\n" + std::string(100, 'x') + "\r\n";
    }
    const Reply reply = ask(request + "0\r\n\r\n");
    EXPECT_EQ(reply.status, 413);
    EXPECT_EQ(reply.body, "the body has 2000 bytes, expected 1000 at most\n");
}

TEST_F(SizeTest, CutsOffAClientThatDoesNotStopSending) {
    HttpClient endless = client();
    endless.send("POST / HTTP/1.1\r\nHost: localhost\r\nTransfer-Encoding: chunked\r\n\r\n");
    const std::string chunk = "64\r\n" + std::string(100, 'x') + "\r\n";
    while (endless.send(chunk)) {
    }
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: cut off: the body has more than 4000 bytes"));
    EXPECT_EQ(ask(post("next")).body, "next");
}

TEST_F(SizeTest, TakesHeadersOfTheLargestSizeAndRefusesLarger) {
    const auto statusOf = [this](std::size_t headers) {
        const std::string without = post("", "X: \r\n");
        return ask(post("", "X: " + std::string(headers - without.size(), 'x') + "\r\n")).status;
    };
    EXPECT_EQ(statusOf(2000), 200);
    EXPECT_EQ(statusOf(2001), 431);
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 431: the headers have 2001 bytes, expected 2000 at most"));
    EXPECT_EQ(statusOf(200'000), 431);
    EXPECT_EQ(logged(2).back(), "127.0.0.1: answered 431: Request Header Fields Too Large");
}

/* Clients that are slow, gone, wrong or many. */

TEST_F(HttpServerTest, RefusesARequestThatDoesNotArriveInTime) {
    _settings.limits.requestTime = 500ms;
    serve();
    for (const char* begun :
         {"POST / HTTP/1.1\r\nHost:", "POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 5\r\n\r\nhal"}) {
        HttpClient slow = client();
        slow.send(begun);
        EXPECT_EQ(ask(post("quick")).body, "quick");
        EXPECT_EQ(slow.receive().status, 408) << begun;
        EXPECT_EQ(slow.receiveAll(), "");
    }
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 408: the request did not arrive within 0.5 s",
                                       "127.0.0.1: answered 408: the request did not arrive within 0.5 s"));
}

TEST_F(HttpServerTest, DoesNotCountTheTimeOfTheAnswerAsTheRequests) {
    _settings.limits.requestTime = 2s;
    _settings.limits.idleTime = 2s;
    Gate entered;
    Gate gate;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        entered.open();
        gate.wait();
        return echo(request, caller);
    });
    HttpClient asking = client();
    asking.send(post("patience"));
    entered.wait();
    // Both times are over for clients that come later.
    HttpClient slow = client();
    HttpClient idle = client();
    slow.send("POST / HTTP/1.1\r\nHost:");
    EXPECT_EQ(slow.receive().status, 408);
    EXPECT_EQ(idle.receiveAll(), "");
    gate.open();
    EXPECT_EQ(asking.receive().body, "patience");
}

TEST_F(HttpServerTest, ClosesAnIdleConnection) {
    _settings.limits.idleTime = 2s;
    serve();
    HttpClient idle = client();
    HttpClient served = client();
    served.send(post("x"));
    served.receive();
    EXPECT_EQ(idle.receiveAll(), "");
    EXPECT_EQ(served.receiveAll(), "");
    EXPECT_THAT(logged(), IsEmpty());
}

TEST_F(HttpServerTest, IsNotKeptWaitingByARequestLineThatComesInDrops) {
    _settings.limits.idleTime = 500ms;
    serve();
    const HttpClient slow = client();
    waitUntil([&] { return !slow.send("P"); });
}

TEST_F(HttpServerTest, SurvivesAClientThatGoesAwayMidAnswer) {
    serve([](const Server::HttpRequest& request, const Server::Caller& /*caller*/) {
        return Server::HttpReply{200, {}, std::string(request.body == "large" ? 50'000'000 : 5, 'x')};
    });
    HttpClient gone = client();
    gone.send(post("large"));
    EXPECT_NE(gone.receiveSome(1000), "");
    gone.reset();
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: gone before the answer was sent"));
    EXPECT_EQ(ask(post("")).body, "xxxxx");
}

TEST_F(HttpServerTest, SurvivesAClientThatGoesAwayWhileTheHandlerRuns) {
    Gate entered;
    Gate gate;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        if (request.body == "gone") {
            entered.open();
            gate.wait();
        }
        return echo(request, caller);
    });
    HttpClient gone = client();
    gone.send(post("gone"));
    entered.wait();
    gone.reset();
    EXPECT_EQ(ask(post("here")).body, "here");
    gate.open();
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: gone before the answer was sent"));
}

TEST_F(HttpServerTest, SurvivesAClientThatGoesAwayMidRequest) {
    serve();
    HttpClient gone = client();
    gone.send("POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 100\r\n\r\nhalf of it");
    EXPECT_EQ(ask(post("here")).body, "here");
    gone.reset();
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: gone before the request was here"));
}

TEST_F(HttpServerTest, RefusesWhatIsNotHttpAndLogsItOnce) {
    const std::string host = "POST / HTTP/1.1\r\nHost: localhost\r\n";
    const std::string several = "400: found several lengths of the body, expected one";
    const std::pair<std::string, std::string> requests[] = {
        {host + "Content-Length: much\r\n\r\n", "400: found the Content-Length \"much\", expected a number"},
        {host + "Content-Length: 99999999999999999999999\r\n\r\n", "413: Content Too Large"},
        {host + "Transfer-Encoding: chunked\r\n\r\nno size\r\n",
         "400: found the size \"no size\" of a chunk, expected hexadecimal digits"},
        {host + "Content-Length: 1\r\nContent-Length: 2\r\n\r\nx", several},
        {host + "Content-Length: 5\r\nTransfer-Encoding: chunked\r\n\r\n0\r\n\r\n", several},
        {host + "Transfer-Encoding: gzip\r\n\r\n", "501: found the Transfer-Encoding \"gzip\", expected chunked"},
        {"POST / HTTP/7.0\r\nHost: localhost\r\n\r\n", "505: HTTP Version Not Supported"},
        {"POST /" + std::string(50'000, 'a') + " HTTP/1.1\r\nHost: localhost\r\n\r\n", "414: URI Too Long"},
        {host + "X: " + std::string(100'000, 'x') + "\r\n\r\n", "431: Request Header Fields Too Large"},
    };
    serve();
    std::size_t lines = 0;
    for (const auto& [wrong, refusal] : requests) {
        HttpClient asking = client();
        asking.send(wrong);
        EXPECT_THAT(asking.receiveAll(), StartsWith("HTTP/1.1 " + refusal.substr(0, 3))) << refusal;
        EXPECT_EQ(logged(++lines).back(), "127.0.0.1: answered " + refusal);
        EXPECT_EQ(logged().size(), lines) << refusal;
    }
    for (const char* text : {"hello\r\n\r\n", "\x16\x03\x01\r\n\r\n"}) {
        HttpClient asking = client();
        asking.send(text);
        EXPECT_EQ(asking.receiveAll(), "");
        EXPECT_EQ(logged(++lines).back(), "127.0.0.1: closed: not an HTTP request");
    }
    client();
    EXPECT_EQ(ask(post("right")).body, "right");
    EXPECT_EQ(logged().size(), lines);
}

TEST_F(HttpServerTest, RefusesPagesInBrowsersAndNamesThatAreNotItsOwn) {
    _settings.hosts = {"switch.example"};
    serve();
    const auto statusFor = [this](const std::string& host, const std::string& headers = "") {
        return ask("POST / HTTP/1.1\r\nHost: " + host + "\r\n" + headers + "Content-Length: 0\r\n\r\n").status;
    };
    const std::string port = ":" + std::to_string(_server->port());
    for (const std::string& host :
         std::vector<std::string>{"localhost", "127.0.0.1", "[::1]", "switch.example", "SWITCH.example"}) {
        EXPECT_EQ(statusFor(host + port), 200) << host;
    }
    for (const std::string& host : std::vector<std::string>{"attacker.example", "localhost.attacker.example",
                                                            "switch.example.attacker.example"}) {
        EXPECT_EQ(statusFor(host + port), 400) << host;
    }
    EXPECT_EQ(statusFor("localhost", "Origin: http://localhost\r\n"), 403);
    EXPECT_EQ(statusFor("localhost", "origin: null\r\n"), 403);
}

TEST_F(HttpServerTest, TakesALengthThatIsToldTwice) {
    serve();
    EXPECT_EQ(ask("POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 4\r\nContent-Length: 4\r\n\r\ntwin").body,
              "twin");
}

TEST_F(HttpServerTest, ClosesTheOldestIdleConnectionForANewOne) {
    _settings.limits.connections = 10;
    serve();
    std::vector<HttpClient> clients;
    for (int i = 0; i < 11; ++i) {
        clients.push_back(client());
        if (i != 0) {
            clients.back().send(post("x"));
            EXPECT_EQ(clients.back().receive().status, 200) << i;
        }
    }
    EXPECT_EQ(clients.front().receiveAll(), "");
    for (std::size_t i = 1; i < clients.size(); ++i) {
        clients[i].send(post("again"));
        EXPECT_EQ(clients[i].receive().body, "again") << i;
    }
    EXPECT_THAT(logged(), ElementsAre("more than 10 connections: idle ones are closed, others are refused"));
}

TEST_F(HttpServerTest, RefusesANewConnectionWhereNoneIsIdle) {
    _settings.limits.connections = 3;
    Gate gate;
    std::atomic<int> entered = 0;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        ++entered;
        gate.wait();
        return echo(request, caller);
    });
    std::vector<HttpClient> clients;
    for (int i = 1; i <= 3; ++i) {
        clients.push_back(client());
        clients.back().send(post("x"));
        waitUntil([&] { return entered == i; });
    }
    const Reply refused = ask(post("x"));
    EXPECT_EQ(refused.status, 503);
    EXPECT_EQ(refused.body, "too many connections\n");
    gate.open();
    for (HttpClient& each : clients) {
        EXPECT_EQ(each.receive().status, 200);
    }
    // An answer can be here before the server has noted that it is sent.
    waitUntil([this] { return ask(post("later")).status == 200; });
}

TEST_F(HttpServerTest, BoundsTheConnectionsOfOneClient) {
    _settings.limits.connectionsPerAddress = 2;
    _settings.address = "::";
    serve();
    HttpClient other(_server->port(), "::1");
    HttpClient first(_server->port(), "127.0.0.1", "127.0.0.2");
    HttpClient second(_server->port(), "127.0.0.1", "127.0.0.3");
    HttpClient third(_server->port(), "127.0.0.1", "127.1.2.3");
    EXPECT_EQ(first.receiveAll(), "");
    for (HttpClient* each : {&other, &second, &third}) {
        each->send(post("x"));
        EXPECT_EQ(each->receive().status, 200);
    }
    EXPECT_THAT(logged(),
                ElementsAre("127.0.0.0/8: more than 2 connections: idle ones are closed, others are refused"));
}

TEST_F(HttpServerTest, IsAsQuickBesideThousandsOfIdleConnections) {
    constexpr unsigned int many = 2000;
    _settings.limits.connections = many + 100;
    _settings.limits.connectionsPerAddress = many + 100;
    serve();
    std::vector<HttpClient> idle;
    for (unsigned int i = 0; i < many; ++i) {
        idle.push_back(client());
    }
    for (int i = 0; i < 100; ++i) {
        EXPECT_EQ(ask(post("x")).status, 200);
    }
    for (HttpClient& each : idle) {
        each.send(post("still here"));
        EXPECT_EQ(each.receive().body, "still here");
    }
    EXPECT_THAT(logged(), IsEmpty());
}

/* Where it listens, and how it ends. */

TEST_F(HttpServerTest, ListensOnIpv6) {
    _settings.address = "::1";
    serve();
    HttpClient asking(_server->port(), "::1");
    asking.send(post("six"));
    EXPECT_EQ(asking.receive().body, "six");
    asking.send("POST / HTTP/1.1\r\nHost: [::1]:5988\r\nContent-Length: x\r\n\r\n");
    asking.receiveAll();
    EXPECT_THAT(logged(1), ElementsAre("::1: answered 400: found the Content-Length \"x\", expected a number"));
}

std::string problemOf(const Server::Settings& settings) {
    try {
        const Server::HttpServer server(settings, nullptr, nullptr, [](const std::string&) {});
    } catch (const Server::ServerError& error) {
        return error.what();
    }
    return "";
}

TEST_F(HttpServerTest, SaysWhereItCannotListen) {
    serve();
    const std::string port = std::to_string(_server->port());
    Server::Settings taken;
    taken.port = _server->port();
    EXPECT_EQ(problemOf(taken), "cannot listen on 127.0.0.1:" + port + ": Address already in use");
    Server::Settings foreign;
    foreign.address = "192.0.2.1";
    EXPECT_EQ(problemOf(foreign), "cannot listen on 192.0.2.1:0: Cannot assign requested address");
    Server::Settings name;
    name.address = "localhost";
    EXPECT_EQ(problemOf(name), "found the address \"localhost\", expected an IPv4 or IPv6 address in numbers");
}

TEST_F(HttpServerTest, SendsTheAnswersThatAreUnderWayBeforeItEnds) {
    Gate entered;
    Gate gate;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        entered.open();
        gate.wait();
        return echo(request, caller);
    });
    const std::uint16_t port = _server->port();
    HttpClient asking = client();
    asking.send(post("before the end"));
    entered.wait();
    std::thread ending([this] { _server.reset(); });
    const auto refusesConnections = [port] {
        try {
            const HttpClient late(port);
        } catch (const std::system_error&) {
            return true;
        }
        return false;
    };
    waitUntil(refusesConnections);
    gate.open();
    EXPECT_EQ(asking.receive().body, "before the end");
    EXPECT_EQ(asking.receiveAll(), "");
    ending.join();
    EXPECT_THAT(logged(), IsEmpty());
}

TEST_F(HttpServerTest, EndsThoughAClientDoesNotTakeItsAnswer) {
    _settings.stopTime = 100ms;
    serve([](const Server::HttpRequest&, const Server::Caller&) {
        return Server::HttpReply{200, {}, std::string(50'000'000, 'x')};
    });
    const HttpClient asking = client();
    asking.send(post("x"));
    asking.receiveSome(1);
    _server.reset();
    EXPECT_THAT(logged(), ElementsAre("stopped before all answers were sent"));
}

} // namespace
} // namespace ServerTest

/* Who is let in, and how little the others cost. */
#include "Served.h"

#include <atomic>
#include <functional>
#include <new>
#include <set>

namespace ServerTest {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/** Lets in whoever has the password "right". */
class Doorkeeper : public Server::Authenticator {
public:
    Server::LogIn logIn(const std::string& user, const std::string& password, const std::string& address) override {
        ++asked;
        EXPECT_TRUE(addresses.count(address) == 1) << address;
        if (before) {
            before(user);
        }
        return password == "right" ? Server::LogIn{Server::Caller{user, true, user == "admin"}, ""}
                                   : Server::LogIn{std::nullopt, "no such luck"};
    }

    std::atomic<int> asked = 0;
    /** Of clients, one of which it is told. */
    std::set<std::string> addresses = {"127.0.0.1"};
    std::function<void(const std::string& user)> before;
};

class LogInTest : public Served {
protected:
    LogInTest() {
        _settings.failedLogInDelay = 1ms;
        serve(
            [this](const Server::HttpRequest& request, const Server::Caller& caller) {
                const std::lock_guard lock(_callerMutex);
                _caller = caller;
                return echo(request, caller);
            },
            &_doorkeeper);
    }

    ~LogInTest() override { _server.reset(); }

    void serveWithDelay(std::chrono::milliseconds delay) {
        _settings.failedLogInDelay = delay;
        _server.reset();
        serve(echo, &_doorkeeper);
    }

    Doorkeeper _doorkeeper;
    std::mutex _callerMutex;
    Server::Caller _caller{"", false, false};
};

TEST_F(LogInTest, IsAskedOfAClientThatDoesNotTry) {
    for (const char* header : {"", "Authorization: Negotiate abc\r\n", "Authorization: Basic ?!\r\n"}) {
        const Reply reply = ask(post("x", header));
        EXPECT_EQ(reply.status, 401) << header;
        EXPECT_EQ(reply.headers.at("www-authenticate"), "Basic realm=\"orvcim\", charset=\"UTF-8\"");
    }
    EXPECT_EQ(_doorkeeper.asked, 0);
    EXPECT_THAT(logged(), IsEmpty());
}

TEST_F(LogInTest, TellsTheHandlerWhoAsks) {
    EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
    EXPECT_EQ(_caller.user, "admin");
    EXPECT_TRUE(_caller.mayChangePower);
    EXPECT_EQ(ask(post("x", logInAs("guest", "right"))).status, 200);
    EXPECT_EQ(_caller.user, "guest");
    EXPECT_FALSE(_caller.mayChangePower);
}

TEST_F(LogInTest, FailsInOneLineThatNobodyCanForge) {
    EXPECT_EQ(ask(post("x", logInAs("eve\norvcim all is well", "wrong"))).status, 401);
    EXPECT_THAT(logged(), ElementsAre("127.0.0.1: log-in as \"eve\\x0aorvcim all is well\" failed: no such luck"));
    EXPECT_EQ(_caller.user, "");
}

TEST_F(LogInTest, IsNotCheckedAgainForTheSamePassword) {
    HttpClient asking = client();
    for (int i = 0; i < 3; ++i) {
        asking.send(post("x", logInAs("admin", "right")));
        EXPECT_EQ(asking.receive().status, 200);
        EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
    }
    EXPECT_EQ(_doorkeeper.asked, 1);
    EXPECT_EQ(ask(post("x", logInAs("admin", "wrong"))).status, 401);
    EXPECT_EQ(ask(post("x", logInAs("guest", "right"))).status, 200);
    EXPECT_EQ(_doorkeeper.asked, 3);
}

TEST_F(LogInTest, IsCheckedAgainAfterItFailed) {
    EXPECT_EQ(ask(post("x", logInAs("admin", "wrong"))).status, 401);
    EXPECT_EQ(ask(post("x", logInAs("admin", "wrong"))).status, 401);
    EXPECT_EQ(_doorkeeper.asked, 2);
}

TEST_F(LogInTest, ComesBeforeTheBody) {
    HttpClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 1000\r\n" + logInAs("admin", "wrong") + "\r\n");
    EXPECT_EQ(asking.receive().status, 401);
    HttpClient right = client();
    right.send("POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 4\r\n" + logInAs("admin", "right") + "\r\n");
    waitUntil([this] { return _doorkeeper.asked == 2; });
    right.send("body");
    EXPECT_EQ(right.receive().body, "body");
}

TEST_F(LogInTest, IsAnsweredLateWhereItFailedAndHoldsNobodyUp) {
    serveWithDelay(1h);
    std::vector<HttpClient> failing;
    for (int i = 0; i < 40; ++i) {
        failing.push_back(client());
        failing.back().send(post("x", logInAs("eve", std::to_string(i))));
    }
    // All of them have failed, and wait for their answer.
    logged(failing.size());
    EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
}

TEST_F(LogInTest, TakesAsLongForAUserWhoDoesNotExistAsForAWrongPassword) {
    serveWithDelay(500ms);
    _doorkeeper.before = [](const std::string& user) { std::this_thread::sleep_for(user == "exists" ? 300ms : 0ms); };
    for (const char* user : {"exists", "does-not"}) {
        const auto begin = std::chrono::steady_clock::now();
        EXPECT_EQ(ask(post("x", logInAs(user, "wrong"))).status, 401);
        EXPECT_GE(std::chrono::steady_clock::now() - begin, 500ms) << user;
    }
}

TEST_F(LogInTest, IsCheckedForOtherNetworksWhileOneHasManyWaiting) {
    _settings.address = "::";
    _doorkeeper.addresses = {"127.0.0.1", "::1"};
    serveWithDelay(1ms);
    // Users who were good before, and are to be checked again.
    const auto askFromElsewhere = [this](const std::string& user) {
        HttpClient elsewhere(_server->port(), "::1");
        elsewhere.send(post("x", logInAs(user, "right")));
        return elsewhere.receive().status;
    };
    EXPECT_EQ(askFromElsewhere("admin"), 200);
    Gate gate;
    _doorkeeper.before = [&](const std::string& user) {
        if (user == "guest") {
            gate.wait();
        }
    };
    std::vector<HttpClient> waiting;
    const auto send = [&](std::size_t number) {
        for (std::size_t i = 0; i < number; ++i) {
            waiting.push_back(client());
            waiting.back().send(post("x", logInAs("guest", std::to_string(waiting.size()))));
        }
    };
    constexpr int checkedOfOneNetwork = 2;
    constexpr std::size_t mayWait = 32;
    send(checkedOfOneNetwork + mayWait + 1);
    // The one that there is no room for is refused when all are there.
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 503: too much to do"));
    EXPECT_EQ(_doorkeeper.asked, 1 + checkedOfOneNetwork);
    EXPECT_EQ(askFromElsewhere("admin"), 200);
    EXPECT_EQ(askFromElsewhere("another"), 200);
    gate.open();
    int refusals = 0;
    for (HttpClient& each : waiting) {
        refusals += each.receive().status == 503 ? 1 : 0;
    }
    EXPECT_EQ(refusals, 1);
}

TEST_F(LogInTest, CostsOneRequestWhereTheAuthenticatorFails) {
    _doorkeeper.before = [](const std::string& user) {
        if (user == "unlucky") {
            throw std::bad_alloc();
        }
    };
    HttpClient unlucky = client();
    unlucky.send(post("x", logInAs("unlucky", "right")));
    EXPECT_EQ(unlucky.receive().status, 503);
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 503: std::bad_alloc"));
    EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
}

TEST_F(LogInTest, IsAnsweredAtOnceWhereTheServerEnds) {
    serveWithDelay(1h);
    HttpClient failing = client();
    failing.send(post("x", logInAs("eve", "wrong")));
    logged(1);
    _server.reset();
    EXPECT_EQ(failing.receive().status, 401);
}

/* What clients send. */

struct Sent {
    const char* header;
    std::optional<Server::Credentials> credentials;
};

TEST(CredentialsTest, AreReadAsHttpSaysThem) {
    // "dXNlcjpwYXNz" is "user:pass".
    const Sent cases[] = {
        {"Basic dXNlcjpwYXNz", Server::Credentials{"user", "pass"}},
        {"basic dXNlcjpwYXNz", Server::Credentials{"user", "pass"}},
        {"BASIC   dXNlcjpwYXNz ", Server::Credentials{"user", "pass"}},
        {"Basic dTpwOnE=", Server::Credentials{"u", "p:q"}},
        {"Basic Og==", Server::Credentials{"", ""}},
        {"Basic dXNlcg==", std::nullopt},         // "user"
        {"Basic dXNlcjpwYQBzcw==", std::nullopt}, // "user:pa\0ss"
        {"Basic !", std::nullopt},
        {"Basic ", std::nullopt},
        {"Basic", std::nullopt},
        {"Bearer dXNlcjpwYXNz", std::nullopt},
        {"", std::nullopt},
    };
    for (const Sent& sent : cases) {
        const auto credentials = Server::credentialsOf(sent.header);
        ASSERT_EQ(credentials.has_value(), sent.credentials.has_value()) << sent.header;
        if (credentials) {
            EXPECT_EQ(credentials->user, sent.credentials->user) << sent.header;
            EXPECT_EQ(credentials->password, sent.credentials->password) << sent.header;
        }
    }
}

/* What is remembered. */

using Clock = Server::RecentLogIns::Clock;

const Server::Credentials right{"admin", "right"};

TEST(RecentLogInsTest, AreGoodForTheirTimeAfterEachUse) {
    Server::RecentLogIns recent;
    const Clock::time_point start = Clock::now();
    constexpr auto lifetime = Server::RecentLogIns::lifetime;
    recent.remember(right, {"admin", true, true}, start);
    Clock::time_point now = start;
    for (int i = 0; i < 3; ++i) {
        now += lifetime - 1ms;
        const auto found = recent.find(right, now);
        ASSERT_TRUE(found);
        EXPECT_EQ(found->user, "admin");
        EXPECT_TRUE(found->mayChangePower);
    }
    EXPECT_FALSE(recent.find(right, now + lifetime));
}

TEST(RecentLogInsTest, AreCheckedAgainHoweverOftenTheyAreUsed) {
    Server::RecentLogIns recent;
    const Clock::time_point start = Clock::now();
    recent.remember(right, {"admin", true, true}, start);
    Clock::time_point now = start;
    while (now - start < Server::RecentLogIns::longestLifetime) {
        EXPECT_TRUE(recent.find(right, now));
        now += 20s;
    }
    EXPECT_FALSE(recent.find(right, now));
    EXPECT_TRUE(recent.isKnown(right, now));
    EXPECT_FALSE(recent.isKnown(right, start + Server::RecentLogIns::memory));
}

TEST(RecentLogInsTest, AreForgottenWhereTheyTurnOutWrong) {
    Server::RecentLogIns recent;
    recent.remember(right, {"admin", true, true});
    recent.forget(right);
    EXPECT_FALSE(recent.find(right));
    EXPECT_FALSE(recent.isKnown(right));
}

TEST(RecentLogInsTest, KnowTheWholePassword) {
    Server::RecentLogIns recent;
    recent.remember(right, {"admin", true, true});
    for (const char* password : {"", "righ", "right ", "Right"}) {
        EXPECT_FALSE(recent.find({"admin", password})) << password;
        EXPECT_FALSE(recent.isKnown({"admin", password})) << password;
    }
    EXPECT_FALSE(recent.find({"Admin", "right"}));
    EXPECT_FALSE(recent.find({"adminright", ""}));
}

TEST(RecentLogInsTest, AreBounded) {
    Server::RecentLogIns recent;
    const Clock::time_point start = Clock::now();
    const auto user = [](std::size_t i) { return Server::Credentials{"user" + std::to_string(i), "x"}; };
    for (std::size_t i = 0; i <= Server::RecentLogIns::capacity; ++i) {
        recent.remember(user(i), {user(i).user, true, false}, start + std::chrono::microseconds(i));
    }
    // The one that was used longest ago made room.
    EXPECT_FALSE(recent.isKnown(user(0), start));
    EXPECT_TRUE(recent.isKnown(user(1), start));
    EXPECT_TRUE(recent.isKnown(user(Server::RecentLogIns::capacity), start));
}

} // namespace
} // namespace ServerTest

/* Who is let in, and how little the others cost. */
#include "Served.h"

#include <atomic>
#include <functional>

namespace ServerTest {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/** Lets in whoever has the password "right". */
class Doorkeeper : public Server::Authenticator {
public:
    Server::LogIn logIn(const std::string& user, const std::string& password, const std::string& address) override {
        ++asked;
        EXPECT_EQ(address, "127.0.0.1");
        if (before) {
            before(user);
        }
        return password == "right" ? Server::LogIn{Server::Caller{user, true, user == "admin"}, ""}
                                   : Server::LogIn{std::nullopt, "no such luck"};
    }

    std::atomic<int> asked = 0;
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

TEST_F(LogInTest, isAskedOfAClientThatDoesNotTry) {
    for (const char* header : {"", "Authorization: Negotiate abc\r\n", "Authorization: Basic ?!\r\n"}) {
        const Reply reply = ask(post("x", header));
        EXPECT_EQ(reply.status, 401) << header;
        EXPECT_EQ(reply.headers.at("www-authenticate"), "Basic realm=\"orvcim\", charset=\"UTF-8\"");
    }
    EXPECT_EQ(_doorkeeper.asked, 0);
    EXPECT_THAT(logged(), IsEmpty());
}

TEST_F(LogInTest, tellsTheHandlerWhoAsks) {
    EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
    EXPECT_EQ(_caller.user, "admin");
    EXPECT_TRUE(_caller.mayChangePower);
    EXPECT_EQ(ask(post("x", logInAs("guest", "right"))).status, 200);
    EXPECT_EQ(_caller.user, "guest");
    EXPECT_FALSE(_caller.mayChangePower);
}

TEST_F(LogInTest, failsInOneLineThatNobodyCanForge) {
    EXPECT_EQ(ask(post("x", logInAs("eve\norvcim all is well", "wrong"))).status, 401);
    EXPECT_THAT(logged(), ElementsAre("127.0.0.1: log-in as \"eve\\x0aorvcim all is well\" failed: no such luck"));
    EXPECT_EQ(_caller.user, "");
}

TEST_F(LogInTest, isNotCheckedAgainForTheSamePassword) {
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

TEST_F(LogInTest, isCheckedAgainAfterItFailed) {
    EXPECT_EQ(ask(post("x", logInAs("admin", "wrong"))).status, 401);
    EXPECT_EQ(ask(post("x", logInAs("admin", "wrong"))).status, 401);
    EXPECT_EQ(_doorkeeper.asked, 2);
}

TEST_F(LogInTest, comesBeforeTheBody) {
    HttpClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 1000\r\n" + logInAs("admin", "wrong") + "\r\n");
    EXPECT_EQ(asking.receive().status, 401);
    HttpClient right = client();
    right.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 4\r\n" + logInAs("admin", "right") + "\r\n");
    while (_doorkeeper.asked < 2) {
        std::this_thread::sleep_for(1ms);
    }
    right.send("body");
    EXPECT_EQ(right.receive().body, "body");
}

TEST_F(LogInTest, isAnsweredLateWhereItFailedAndHoldsNobodyUp) {
    serveWithDelay(1s);
    const auto begin = std::chrono::steady_clock::now();
    std::vector<HttpClient> failing;
    for (int i = 0; i < 40; ++i) {
        failing.push_back(client());
        failing.back().send(post("x", logInAs("eve", std::to_string(i))));
    }
    EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
    EXPECT_LT(std::chrono::steady_clock::now() - begin, 1s);
    for (HttpClient& each : failing) {
        EXPECT_EQ(each.receive().status, 401);
    }
    // One after the other would be 40 s, and 10 s with four at a time.
    EXPECT_GE(std::chrono::steady_clock::now() - begin, 1s);
    EXPECT_LT(std::chrono::steady_clock::now() - begin, 9s);
}

TEST_F(LogInTest, doesNotHoldUpThoseWhoAreInWhileItIsChecked) {
    EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
    Gate gate;
    _doorkeeper.before = [&](const std::string&) { gate.wait(); };
    std::vector<HttpClient> waiting;
    const auto sendLogIns = [&](std::size_t number) {
        for (std::size_t i = 0; i < number; ++i) {
            waiting.push_back(client());
            waiting.back().send(post("x", logInAs("guest" + std::to_string(waiting.size()), "right")));
        }
    };
    constexpr int checked = 4;
    sendLogIns(checked);
    while (_doorkeeper.asked < 1 + checked) {
        std::this_thread::sleep_for(1ms);
    }
    constexpr std::size_t mayWait = 64;
    sendLogIns(mayWait + 1);
    // Whether all of them are there yet cannot be seen; one is refused when they are.
    std::atomic<bool> done = false;
    std::thread opener([&] {
        while (logged().empty() && !done) {
            std::this_thread::sleep_for(1ms);
        }
        EXPECT_THAT(logged(), ElementsAre("127.0.0.1: answered 503: too much to do"));
        EXPECT_EQ(ask(post("x", logInAs("admin", "right"))).status, 200);
        gate.open();
    });
    int refusals = 0;
    for (HttpClient& each : waiting) {
        refusals += each.receive().status == 503 ? 1 : 0;
    }
    done = true;
    opener.join();
    EXPECT_EQ(refusals, 1);
}

TEST_F(LogInTest, isAnsweredAtOnceWhereTheServerEnds) {
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

TEST(CredentialsTest, areReadAsHttpSaysThem) {
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

TEST(RecentLogInsTest, forgetAfterTheirTime) {
    Server::RecentLogIns recent;
    const Clock::time_point start = Clock::now();
    recent.remember("admin", "right", {"admin", true, true}, start);
    const auto found = recent.find("admin", "right", start + Server::RecentLogIns::lifetime - 1ms);
    ASSERT_TRUE(found);
    EXPECT_EQ(found->user, "admin");
    EXPECT_TRUE(found->mayChangePower);
    EXPECT_FALSE(recent.find("admin", "right", start + Server::RecentLogIns::lifetime));
}

TEST(RecentLogInsTest, knowTheWholePassword) {
    Server::RecentLogIns recent;
    recent.remember("admin", "right", {"admin", true, true});
    for (const char* password : {"", "righ", "right ", "Right"}) {
        EXPECT_FALSE(recent.find("admin", password)) << password;
    }
    EXPECT_FALSE(recent.find("Admin", "right"));
    EXPECT_FALSE(recent.find("adminright", ""));
}

TEST(RecentLogInsTest, areBounded) {
    Server::RecentLogIns recent;
    const Clock::time_point start = Clock::now();
    const auto user = [](std::size_t i) { return "user" + std::to_string(i); };
    for (std::size_t i = 0; i <= Server::RecentLogIns::capacity; ++i) {
        recent.remember(user(i), "x", {user(i), true, false}, start);
    }
    EXPECT_TRUE(recent.find(user(0), "x", start));
    EXPECT_FALSE(recent.find(user(Server::RecentLogIns::capacity), "x", start));
    const Clock::time_point later = start + Server::RecentLogIns::lifetime;
    recent.remember("late", "x", {"late", true, false}, later);
    EXPECT_TRUE(recent.find("late", "x", later));
}

} // namespace
} // namespace ServerTest

/*
 * Attacks on the server from 127.0.0.0/8, which counts as one network, while a well-behaved client asks from ::1: it is
 * always answered, and soon.
 */
#include "objectmanager/server/Served.h"

#include "agent/TestSupport.h"

#include <gnutls/gnutls.h>

#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <deque>
#include <fstream>
#include <functional>
#include <sstream>

namespace {

/** By how many seconds the wall clock of this process is wrong. */
std::atomic<std::time_t> clockIsOffBy = 0;

void setClockOff(std::chrono::seconds by) {
    clockIsOffBy = static_cast<std::time_t>(by.count());
}

} // namespace

// Libraries take their clock_gettime from the program.
extern "C" int clock_gettime(clockid_t clock, timespec* time) noexcept {
    const int status = static_cast<int>(syscall(SYS_clock_gettime, clock, time));
    if (status == 0 && clock == CLOCK_REALTIME) {
        time->tv_sec += clockIsOffBy;
    }
    return status;
}

namespace ServerTest {
namespace {

/** How long each attack goes on. */
std::chrono::milliseconds attackTime() {
    const char* const seconds = std::getenv("ORV_ATTACK_SECONDS");
    return seconds == nullptr ? 1500ms : std::chrono::seconds{std::atoi(seconds)};
}

/** The longest wait that a test lets pass, on a machine that has much else to do. */
constexpr auto patience = 10s;
/** Half of the waits must be shorter: what is promised to users, and what a busy machine does not easily exceed. */
constexpr auto usualPatience = 1s;

/** Takes its time for a password, as PAM does, and lets in who has the right one. */
class SlowDoorkeeper : public Server::Authenticator {
public:
    Server::LogIn logIn(const std::string& user, const std::string& password, const std::string&) override {
        std::this_thread::sleep_for(20ms);
        return password == "right" ? Server::LogIn{Server::Caller{user, true, true}, ""}
                                   : Server::LogIn{std::nullopt, "wrong password"};
    }
};

/** Asks again and again, on a new connection each time, and measures. */
class GoodClient {
public:
    explicit GoodClient(std::function<void()> ask) : _ask(std::move(ask)), _thread([this] { run(); }) {}
    ~GoodClient() { stop(); }

    void stop() {
        _stopping = true;
        if (_thread.joinable()) {
            _thread.join();
        }
    }

    std::atomic<int> answers = 0;
    std::vector<std::string> errors;
    /** Of each answer, or failure. */
    std::vector<std::chrono::steady_clock::duration> waits;

    /** The wait that half of all waits exceed. */
    std::chrono::steady_clock::duration usualWait() {
        const auto middle = waits.begin() + static_cast<std::ptrdiff_t>(waits.size() / 2);
        std::ranges::nth_element(waits, middle);
        return *middle;
    }

private:
    void run() {
        while (!_stopping) {
            const auto begin = std::chrono::steady_clock::now();
            try {
                _ask();
                ++answers;
            } catch (const std::exception& error) {
                errors.emplace_back(error.what());
            }
            waits.push_back(std::chrono::steady_clock::now() - begin);
            std::this_thread::sleep_for(10ms);
        }
    }

    const std::function<void()> _ask;
    std::atomic<bool> _stopping = false;
    std::thread _thread;
};

class AttackTest : public Served {
protected:
    AttackTest() {
        _settings.address = "::";
        _settings.limits.connections = 300;
        _settings.limits.connectionsPerAddress = 150;
    }

    ~AttackTest() override { _server.reset(); }

    void serveWithLogIns() { serve(echo, &_doorkeeper); }

    /** What the well-behaved client does. */
    virtual void ask() {
        HttpClient asking(_server->port(), "::1");
        asking.send(post("hello", logInAs("admin", "right")));
        const Reply reply = asking.receive();
        if (reply.status != 200) {
            throw std::runtime_error("answered " + std::to_string(reply.status));
        }
    }

    /** Runs a step of an attack again and again. */
    void attack(const std::function<void()>& step) {
        ask();
        GoodClient good([this] { ask(); });
        const auto end = std::chrono::steady_clock::now() + attackTime();
        while (std::chrono::steady_clock::now() < end || good.answers == 0) {
            step();
        }
        good.stop();
        EXPECT_THAT(good.errors, testing::IsEmpty());
        const auto longest = *std::ranges::max_element(good.waits);
        EXPECT_LT(longest, patience);
        EXPECT_LT(good.usualWait(), usualPatience);
        RecordProperty("longest_ms", static_cast<int>(longest / 1ms));
        RecordProperty("usual_ms", static_cast<int>(good.usualWait() / 1ms));
    }

    /** A client of the attacker's, from anywhere in 127.0.0.0/8; nothing where it is not let in. */
    std::optional<HttpClient> attacker() {
        const std::string from = "127.0." + std::to_string(_attackers++ % 200) + ".7";
        try {
            return HttpClient(_server->port(), "127.0.0.1", from);
        } catch (const std::system_error&) {
            return std::nullopt;
        }
    }

    /** Connections that each begin with the text and are then kept: the oldest of many goes for a new one. */
    void hold(const std::string& text) {
        constexpr std::size_t many = 400;
        if (auto one = attacker()) {
            one->send(text);
            _held.push_back(std::move(*one));
        }
        if (_held.size() > many) {
            _held.pop_front();
        }
    }

    SlowDoorkeeper _doorkeeper;
    std::deque<HttpClient> _held;
    unsigned int _attackers = 0;
};

TEST_F(AttackTest, idleConnections) {
    serveWithLogIns();
    attack([this] { hold(""); });
}

TEST_F(AttackTest, requestsThatAreNeverFinished) {
    serveWithLogIns();
    attack([this] { hold("POST / HTTP/1.1\r\nHost: localhost\r\nX:"); });
}

TEST_F(AttackTest, wrongPasswords) {
    serveWithLogIns();
    attack([this] { hold(post("x", logInAs("eve" + std::to_string(_attackers), "wrong"))); });
}

TEST_F(AttackTest, bodiesThatAreNeverFinished) {
    _settings.limits.allBodiesBytes = std::size_t{8} * 1024 * 1024;
    serve();
    const std::string most(900'000, 'x');
    attack([&] { hold("POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 1000000\r\n\r\n" + most); });
    std::ifstream status("/proc/self/status");
    std::stringstream text;
    text << status.rdbuf();
    RecordProperty("memory", text.str().substr(text.str().find("VmHWM:"), 24));
}

TEST_F(AttackTest, connectionsThatAreResetAtOnce) {
    serveWithLogIns();
    attack([this] {
        if (auto one = attacker()) {
            one->send("POST /");
            one->reset();
        }
    });
}

TEST_F(AttackTest, answersThatAreNeverRead) {
    serve([](const Server::HttpRequest& request, const Server::Caller& caller) {
        return request.body == "much" ? Server::HttpReply{200, {}, std::string(3'000'000, 'x')} : echo(request, caller);
    });
    attack([this] {
        hold(post("much") + post("much"));
        // Enough to fill the table: what more would cost is processor time of this program.
        std::this_thread::sleep_for(5ms);
    });
}

/** The well-behaved client's answer needs as much of the memory for answers as each of the attackers'. */
TEST_F(AttackTest, largeAnswersThatAreNeverRead) {
    _settings.stopTime = 100ms;
    _settings.limits.allAnswersBytes = std::size_t{8} * 1024 * 1024;
    serve([](const Server::HttpRequest& request, const Server::Caller& caller) {
        request.outlet->hold(1'000'000);
        if (request.body == "much") {
            const std::string piece(Server::Outlet::pieceBytes, 'x');
            request.outlet->begin({200, {}, piece});
            for (int i = 0; i < 1000; ++i) {
                request.outlet->send(piece);
            }
        }
        return echo(request, caller);
    });
    attack([this] {
        if (_held.size() < 100) {
            hold(post("much"));
        }
        std::this_thread::sleep_for(1ms);
    });
    _server.reset();
}

TEST_F(AttackTest, answersThatAreDripped) {
    serve([](const Server::HttpRequest& request, const Server::Caller& caller) {
        return request.body == "much" ? Server::HttpReply{200, {}, std::string(1'000'000, 'x')} : echo(request, caller);
    });
    attack([this] {
        hold(post("much"));
        const std::size_t several = std::min<std::size_t>(_held.size(), 50);
        for (std::size_t number = 0; number < several; ++number) {
            try {
                _held[number].receiveSome(1);
            } catch (const std::exception&) {
                // The server has closed the connection for another one.
            }
        }
    });
}

TEST_F(AttackTest, slowConnections) {
    serveWithLogIns();
    std::size_t next = 0;
    attack([&] {
        hold("POST / HTTP/1.1\r\nHost: localhost\r\nX: ");
        for (int count = 0; count < 20 && !_held.empty(); ++count) {
            _held[next++ % _held.size()].send("x");
        }
    });
}

TEST_F(AttackTest, stormsOfConnects) {
    serveWithLogIns();
    attack([this] {
        std::deque<HttpClient> storm;
        for (int count = 0; count < 100; ++count) {
            if (auto one = attacker()) {
                storm.push_back(std::move(*one));
            }
        }
    });
    EXPECT_GT(_attackers, 100U);
}

TEST_F(AttackTest, clocksThatJumpByYears) {
    serveWithLogIns();
    attack([this] {
        using std::chrono::years;
        setClockOff(std::chrono::seconds(_attackers % 2 == 0 ? years(10) : -years(10)));
        hold("POST / HTTP/1.1\r\nHost: localhost\r\nX:");
    });
    setClockOff({});
}

TEST_F(AttackTest, handlersThatHang) {
    Gate gate;
    serve([&](const Server::HttpRequest& request, const Server::Caller& caller) {
        if (request.body == "hang") {
            gate.wait();
        }
        return echo(request, caller);
    });
    attack([this] {
        if (_held.size() < 100) {
            hold(post("hang"));
        }
        std::this_thread::sleep_for(1ms);
    });
    gate.open();
    _server.reset();
}

TEST_F(AttackTest, badRequestsThatFillTheLog) {
    serveWithLogIns();
    attack([this] {
        if (auto one = attacker()) {
            one->send("POST / HTTP/1.1\r\nHost: " + std::string(10'000, 'x') + "\r\n\r\n");
            one->receiveAll();
        }
    });
    const std::vector<std::string> lines = logged();
    EXPECT_LE(lines.size(), Server::EventLog::linesOfNetwork * (2 + attackTime() / 1min) + 10);
    for (const std::string& line : lines) {
        EXPECT_LE(line.size(), Server::EventLog::longestLine + 30);
    }
}

/* TLS, before any log-in. */

/** What a client of these priorities says first. */
std::string helloOf(const char* priorities) {
    gnutls_session_t session = nullptr;
    gnutls_certificate_credentials_t credentials = nullptr;
    gnutls_init(&session, GNUTLS_CLIENT | GNUTLS_NONBLOCK);
    gnutls_certificate_allocate_credentials(&credentials);
    EXPECT_EQ(gnutls_priority_set_direct(session, priorities, nullptr), GNUTLS_E_SUCCESS) << priorities;
    gnutls_credentials_set(session, GNUTLS_CRD_CERTIFICATE, credentials);
    std::string hello;
    gnutls_transport_set_ptr(session, &hello);
    gnutls_transport_set_push_function(session, [](gnutls_transport_ptr_t to, const void* data, std::size_t size) {
        static_cast<std::string*>(to)->append(static_cast<const char*>(data), size);
        return static_cast<ssize_t>(size);
    });
    gnutls_transport_set_pull_function(session, [](gnutls_transport_ptr_t, void*, std::size_t) {
        errno = EAGAIN;
        return static_cast<ssize_t>(-1);
    });
    gnutls_handshake(session);
    gnutls_deinit(session);
    gnutls_certificate_free_credentials(credentials);
    return hello;
}

class TlsAttackTest : public AttackTest {
protected:
    TlsAttackTest() {
        const std::string base = (_folder / "server").string();
        AgentTest::linesOf("openssl req -x509 -newkey rsa:2048 -noenc -days 2 -subj /CN=localhost -keyout " + base +
                           ".key -out " + base + ".pem 2>&1");
        _settings.tls = Server::Tls{base + ".pem", base + ".key"};
        serveWithLogIns();
    }

    void ask() override {
        const std::vector<std::string> lines = AgentTest::linesOf(
            "curl --silent --show-error --insecure --max-time 30 --user admin:right --data hello https://[::1]:" +
            std::to_string(_server->port()) + "/ 2>&1 || true");
        if (lines != std::vector<std::string>{"hello"}) {
            throw std::runtime_error(lines.empty() ? "no answer" : lines.front());
        }
    }

    AgentTest::TemporaryFolder _folder;
};

TEST_F(TlsAttackTest, hellosForAGroupThatIsDear) {
    const std::string hello = helloOf("NORMAL:-GROUP-ALL:+GROUP-FFDHE8192");
    ASSERT_FALSE(hello.empty());
    attack([&] { hold(hello); });
}

TEST_F(TlsAttackTest, hellosThatAreNotGoneOnWith) {
    const std::string hello = helloOf("NORMAL");
    ASSERT_FALSE(hello.empty());
    attack([&] { hold(hello); });
}

} // namespace
} // namespace ServerTest

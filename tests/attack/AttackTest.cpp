/* Attacks on the server while users read the power state and switch the machine off: they are answered, and soon. */
#include "Attack.h"

#include "server/EventLog.h"

#include <gnutls/gnutls.h>

#include <gmock/gmock.h>

#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdint>
#include <optional>
#include <random>
#include <sstream>
#include <stdexcept>
#include <system_error>
#include <utility>

namespace AttackTest {
namespace {

/** A user who has a password, but attacks. */
const std::string insider = "bin:evil";

std::string asInsider() {
    return logInAs("bin", "evil");
}

/** More than one network may have, where so many are quickly made. */
constexpr unsigned int many = isSanitized ? 100 : 600;

TEST_F(AttackTest, IdleConnections) {
    serveWithLogIns();
    attack([this] { hold(attacker()); }, many);
}

TEST_F(AttackTest, IdleConnectionsWithTls) {
    serveWithLogIns();
    attack([this] { hold(attackerWithTls()); }, many);
}

TEST_F(AttackTest, RequestsThatAreNeverFinished) {
    serveWithLogIns();
    attack([this] { hold(begunRequest); }, many);
}

TEST_F(AttackTest, ConnectionsThatAreHalfClosed) {
    serveWithLogIns();
    attack(
        [this] {
            hold(begunRequest);
            if (!_held.empty()) {
                _held.back().endSending();
            }
        },
        many);
}

TEST_F(AttackTest, WrongPasswords) {
    serveWithLogIns();
    attack([this] { hold(post("x", logInAs("eve" + std::to_string(_attackers), "wrong"))); }, many);
}

TEST_F(AttackTest, BodiesThatAreNeverFinished) {
    // As much as two networks could have.
    serveWithLogIns({"--max-bodies=134217728"});
    const std::string most(900'000, 'x');
    attack([&] {
        hold("POST / HTTP/1.1\r\nHost: localhost\r\n" + asInsider() + "Content-Length: 1000000\r\n\r\n" + most);
    });
}

/** The body of a request that was answered takes no more memory, however long its connection stays. */
TEST_F(AttackTest, LargeRequestsOnConnectionsThatStay) {
    serveWithLogIns();
    const std::string request = post(std::string(900'000, 'x'), asInsider());
    attack(
        [&] {
            std::optional<HttpClient> connection = attackerWithTls();
            try {
                if (connection) {
                    connection->send(request);
                    connection->receive();
                }
            } catch (const std::runtime_error&) {
                // The connection was closed for another one.
            }
            hold(std::move(connection));
        },
        many);
}

TEST_F(AttackTest, ConnectionsThatAreResetAtOnce) {
    serveWithLogIns();
    attack([this] {
        if (auto one = attacker()) {
            one->send("POST /");
            one->reset();
        }
    });
}

TEST_F(AttackTest, ConnectionsThatAreResetAfterARequest) {
    serveWithLogIns();
    attack([this] {
        if (auto one = attackerWithTls()) {
            one->send(enumerate("Test_Disk", "root/test", insider));
            one->reset();
        }
    });
}

/** The user's answer needs as much memory as each of the attackers'. */
TEST_F(AttackTest, LargeAnswersThatAreNeverRead) {
    serveWithLogIns({"--max-answers=4000000"}, {{"TEST_MORE_DISKS", "1000"}});
    _ask = [this] { readMuch(); };
    // To make such an answer takes the processor's time, which a busy machine has little of.
    _usualPatience = _patience;
    attack([this] { holdSometimes(enumerate("Test_Disk", "root/test", insider)); });
}

/** The largest answer that the shipped providers have: each of 255 services with each of as many capabilities. */
TEST_F(AttackTest, ReadsOfObjectsByTheThousand) {
    constexpr int mostNodes = 255;
    std::string nodes = "shutdown-time = 0\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n";
    for (int number = 2; number <= mostNodes; ++number) {
        nodes += "[[instrumentation.simulated.node]]\npath = \"chassis/blade" + std::to_string(number) + "\"\n";
    }
    configure(nodes);
    serveWithLogIns();
    attack([this] { holdSometimes(enumerate("TALVO_PowerManagementElementCapabilities", "root/cimv2", insider)); });
}

TEST_F(AttackTest, PipelinesWhoseAnswersAreNeverRead) {
    serveWithLogIns({}, {{"TEST_MORE_DISKS", "5000"}});
    const std::string request = enumerate("Test_Disk", "root/test", insider);
    attack([&] { hold(request + request + request); });
}

/** Each is refused, but so many connections always have another one that keep the processors busy. */
TEST_F(AttackTest, PipelinesWithoutALogIn) {
    serveWithLogIns();
    std::string requests;
    for (int count = 0; count < 20; ++count) {
        requests += "POST / HTTP/1.1\r\nHost: localhost\r\nContent-Length: 0\r\n\r\n";
    }
    attack([&] {
        hold(requests);
        for (const HttpClient& each : _held) {
            const bool isAnswered = each.isReadable();
            while (each.isReadable() && !each.receiveSome(100'000).empty()) {
            }
            if (isAnswered) {
                each.send(requests);
            }
        }
    });
}

TEST_F(AttackTest, AnswersThatAreDripped) {
    serveWithLogIns({}, {{"TEST_MORE_DISKS", "5000"}});
    attack([this] {
        hold(enumerate("Test_Disk", "root/test", insider));
        for (const HttpClient& each : _held) {
            if (each.isReadable()) {
                each.receiveSome(1);
            }
        }
    });
}

TEST_F(AttackTest, SlowConnections) {
    serveWithLogIns();
    attack([this] { holdSlow(); }, many);
}

TEST_F(AttackTest, SlowConnectionsByTheThousand) {
    constexpr unsigned int atATime = 2000;
    _mostHeld = atATime;
    serveWithLogIns();
    attack([this] { holdSlow(); }, 2 * atATime);
}

TEST_F(AttackTest, StormsOfConnects) {
    serveWithLogIns();
    attack([this] { storm(); });
}

TEST_F(AttackTest, ConnectsByTheThousand) {
    serveWithLogIns();
    attack([this] { storm(); }, 100);
    EXPECT_GE(_attackers, 10'000U);
}

/** By how many seconds the server's clock is wrong. */
class WrongClock {
public:
    explicit WrongClock(const std::string& file) : _file(open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600)) {
        if (ftruncate(_file, sizeof(Seconds)) != 0) {
            throw std::system_error(errno, std::generic_category(), file);
        }
        _seconds = static_cast<Seconds*>(mmap(nullptr, sizeof(Seconds), PROT_READ | PROT_WRITE, MAP_SHARED, _file, 0));
    }
    WrongClock(const WrongClock&) = delete;
    WrongClock& operator=(const WrongClock&) = delete;
    ~WrongClock() {
        munmap(_seconds, sizeof(Seconds));
        close(_file);
    }

    void set(std::chrono::seconds by) { *_seconds = static_cast<std::int32_t>(by.count()); }

private:
    using Seconds = std::atomic<std::int32_t>;

    const int _file;
    Seconds* _seconds;
};

TEST_F(AttackTest, ClocksThatJumpByYears) {
    const std::string file = (_folder / "clock").string();
    WrongClock clock(file);
    serveWithLogIns({}, {{"LD_PRELOAD", TEST_CLOCK_LIBRARY}, {"TEST_CLOCK", file}});
    attack([&] {
        using std::chrono::years;
        clock.set(std::chrono::seconds(_attackers % 2 == 0 ? years(10) : -years(10)));
        hold(begunRequest);
    });
}

TEST_F(AttackTest, ProvidersThatHang) {
    serveWithLogIns();
    const std::string request = get("Test_Disk", "hangs", "root/test", insider);
    attack([&] { holdSometimes(request); });
}

TEST_F(AttackTest, BadRequestsThatFillTheLog) {
    using ObjectManager::Server::EventLog;
    serveWithLogIns();
    attack([this] {
        if (auto one = attackerWithTls()) {
            one->send("POST / HTTP/1.1\r\nHost: " + std::string(10'000, 'x') + "\r\n\r\n");
            one->receiveAll();
        }
    });
    std::istringstream log(_server->err());
    unsigned int lines = 0;
    for (std::string line; std::getline(log, line);) {
        lines += line.find("127.0.") != std::string::npos ? 1 : 0;
        EXPECT_LE(line.size(), EventLog::longestLine + 40);
    }
    EXPECT_GT(_attackers, 0U);
    EXPECT_LE(lines, EventLog::linesOfNetwork * (3 + attackTime() / 1min));
}

/* Before any log-in. */

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
    EXPECT_FALSE(hello.empty());
    return hello;
}

TEST_F(AttackTest, HellosForAGroupThatIsDear) {
    serveWithLogIns();
    const std::string hello = helloOf("NORMAL:-GROUP-ALL:+GROUP-FFDHE8192");
    attack([&] { holdInTheClear(hello); }, many);
}

TEST_F(AttackTest, HellosThatAreNotGoneOnWith) {
    serveWithLogIns();
    const std::string hello = helloOf("NORMAL");
    attack([&] { holdInTheClear(hello); }, many);
}

TEST_F(AttackTest, HalvesOfHellos) {
    serveWithLogIns();
    const std::string hello = helloOf("NORMAL");
    attack([&] { holdInTheClear(hello.substr(0, _attackers % hello.size())); }, many);
}

TEST_F(AttackTest, JunkInsteadOfAHello) {
    serveWithLogIns();
    std::minstd_rand random; // NOLINT(cert-msc32-c,cert-msc51-cpp): the same in each run
    attack(
        [&] {
            std::string junk(1 + random() % 2000, '\0');
            std::generate(junk.begin(), junk.end(), [&] { return static_cast<char>(random()); });
            // Half of it looks like a record of a handshake at first.
            holdInTheClear((_attackers % 2 == 0 ? std::string("\x16\x03\x01\x02\x00\x01", 6) : "") + junk);
        },
        many);
}

} // namespace
} // namespace AttackTest

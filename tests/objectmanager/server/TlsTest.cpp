/* The server with TLS, as a stock client sees it. */
#include "Served.h"

#include "agent/TestSupport.h"

#include <algorithm>
#include <atomic>
#include <iterator>
#include <random>
#include <system_error>

namespace ServerTest {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

class TlsTest : public Served {
protected:
    TlsTest() {
        makeKey("server");
        _settings.tls = Server::Tls{_folder / "server.pem", _folder / "server.key"};
    }

    void makeKey(const std::string& name) const {
        const std::string base = (_folder / name).string();
        AgentTest::linesOf("openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -noenc -days 2 -subj /CN=test"
                           " -addext subjectAltName=IP:127.0.0.1 -keyout " +
                           base + ".key -out " + base + ".pem 2>&1");
    }

    /** What curl prints, its own complaints included. */
    std::vector<std::string> curl(const std::string& options) const {
        return AgentTest::linesOf("curl --silent --show-error --max-time 30 " + options +
                                  " https://127.0.0.1:" + std::to_string(_server->port()) + "/cimom 2>&1 || true");
    }

    std::string trusted() const { return "--cacert " + (_folder / "server.pem").string(); }

    std::string problem() {
        try {
            serve();
        } catch (const Server::ServerError& error) {
            return error.what();
        }
        return "";
    }

    AgentTest::TemporaryFolder _folder;
};

TEST_F(TlsTest, ServesWithItsCertificate) {
    serve();
    EXPECT_THAT(curl(trusted() + " --data hello"), ElementsAre("hello"));
    EXPECT_THAT(curl("--tls-max 1.2 --data hello").front(), HasSubstr("self-signed certificate"));
    EXPECT_THAT(logged(1),
                ElementsAre("127.0.0.1: closed: the TLS handshake failed: the client refused: CA is unknown"));
}

TEST_F(TlsTest, AnswersALargeRequest) {
    serve();
    AgentTest::writeFile(_folder / "body", std::string(1'000'000, 'x'));
    EXPECT_THAT(curl(trusted() + " --data-binary @" + (_folder / "body").string()),
                ElementsAre(std::string(1'000'000, 'x')));
}

TEST_F(TlsTest, SurvivesClientsThatSpeakNoTls) {
    serve();
    HttpClient plain = client();
    plain.send(post("in the clear"));
    EXPECT_THAT(plain.receiveAll(), testing::Not(HasSubstr("HTTP")));
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: closed: the TLS handshake failed: An unexpected TLS packet was "
                                       "received."));
    EXPECT_THAT(curl(trusted() + " --data hello"), ElementsAre("hello"));
}

TEST_F(TlsTest, SurvivesAnAlertThatNobodyKnows) {
    serve();
    HttpClient refusing = client();
    // A record with the beginning of a hello, and one with the alert.
    refusing.send(std::string("\x16\x03\x01\x00\x06\x01\x00\x01\xfc\x03\x03", 11));
    refusing.send(std::string("\x15\x03\x01\x00\x02\x02\xee", 7));
    refusing.receiveAll();
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: closed: the TLS handshake failed: the client refused: alert 238"));
    EXPECT_THAT(curl(trusted() + " --data hello"), ElementsAre("hello"));
}

TEST_F(TlsTest, TakesABodyInChunksWhereverTheyAreCut) {
    serve();
    HttpClient asking = client();
    asking.encrypt();
    const std::string large(50'000, 'x');
    // Each piece is a record of its own, and the large one is several.
    for (const std::string& piece :
         {std::string("POST / HTTP/1.1\r\nHost: localhost\r\nTransfer-Enc"), std::string("oding: chunked\r\n\r\n3"),
          std::string("\r\nfir\r"), std::string("\n4\r\nst, \r\nc3"), "50\r\n" + large + "\r\n", std::string("0\r\n"),
          std::string("\r\n")}) {
        asking.send(piece);
    }
    EXPECT_EQ(asking.receive().body, "first, " + large);
    asking.send("POST / HTTP/1.1\r\nHost: localhost\r\nTransfer-Encoding: chunked\r\n\r\nno size\r\n");
    EXPECT_EQ(asking.receive().status, 400);
    EXPECT_EQ(asking.receiveAll(), "");
}

/** What clients send who never agree on keys. @param number of the client, on which it depends */
std::string junk(unsigned int number) {
    // A record of a handshake with the beginning of a hello, and of an alert.
    const std::string beginnings[] = {
        {"\x16\x03\x01\x02\x00\x01\x00\x01\xfc\x03\x03", 11}, {"\x15\x03\x03\x00\x02\x02", 6}, ""};
    std::minstd_rand random(number);
    std::string bytes(random() % 700, '\0');
    std::generate(bytes.begin(), bytes.end(), [&] { return static_cast<char>(random()); });
    return beginnings[number % std::size(beginnings)] + bytes;
}

TEST_F(TlsTest, ServesWhileOthersSendJunkFromItsStartOn) {
    // Nobody else has this address, so that the port stays free.
    _settings.address = "127.0.0.77";
    serve();
    _settings.port = _server->port();
    _server.reset();
    std::atomic<bool> isDone = false;
    std::atomic<unsigned int> sent = 0;
    std::vector<std::thread> attackers;
    for (unsigned int i = 0; i < 3; ++i) {
        attackers.emplace_back([&, i] {
            for (unsigned int number = i; !isDone; number += 3) {
                try {
                    HttpClient attacker(_settings.port, _settings.address, "127.0.0.78");
                    attacker.send(junk(number));
                    ++sent;
                    if (number % 2 == 0) {
                        attacker.endSending();
                        attacker.receiveAll();
                    }
                } catch (const std::system_error&) {
                    // The server is not there yet.
                    std::this_thread::yield();
                }
            }
        });
    }
    serve();
    for (int i = 0; i < 20 || sent < 100; ++i) {
        _server->renewKeys();
        HttpClient asking(_settings.port, _settings.address);
        asking.encrypt();
        asking.send(post("hello"));
        EXPECT_EQ(asking.receive().body, "hello");
    }
    isDone = true;
    for (std::thread& attacker : attackers) {
        attacker.join();
    }
}

TEST_F(TlsTest, ClosesAConnectionOnWhichNothingComes) {
    _settings.limits.idleTime = 500ms;
    serve();
    HttpClient silent = client();
    EXPECT_EQ(silent.receiveAll(), "");
}

TEST_F(TlsTest, ClosesAConnectionWhoseRequestDoesNotArriveInTime) {
    _settings.limits.requestTime = 500ms;
    serve();
    curl(trusted() + " --data x --header 'Content-Length: 50'");
    EXPECT_THAT(logged(1), ElementsAre("127.0.0.1: answered 408: the request did not arrive within 0.5 s"));
}

TEST_F(TlsTest, DoesNotStartWithoutAFile) {
    _settings.tls->key = "/nowhere/key";
    EXPECT_EQ(problem(), "/nowhere/key: No such file or directory");
    _settings.tls->certificate = "/dev/null";
    EXPECT_EQ(problem(), "/dev/null: found nothing in it, expected PEM");
}

TEST_F(TlsTest, DoesNotStartWithAKeyOfAnotherCertificate) {
    makeKey("other");
    _settings.tls->key = _folder / "other.key";
    EXPECT_THAT(problem(), StartsWith("cannot serve with the certificate " + (_folder / "server.pem").string() +
                                      " and the key " + (_folder / "other.key").string() + ": "));
}

} // namespace
} // namespace ServerTest

/* The server as a program: addresses, clients and rights, its start and its end. */
#include "Orvcim.h"
#include "Serving.h"
#include "objectmanager/server/HttpClient.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <ostream>
#include <sstream>
#include <system_error>
#include <thread>

namespace OrvcimTest {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::StartsWith;

class ServeTest : public ServingTest {
protected:
    Outcome refused(std::vector<std::string> options) const {
        options.emplace_back("--port=0");
        return start(options)->wait();
    }

    /** Of the certificate that the server shows to a new client. */
    std::string fingerprint() const {
        return runProcess({"sh", "-c",
                           "openssl s_client -connect localhost:" + _port +
                               " </dev/null 2>/dev/null | openssl x509 -noout -fingerprint -sha256"},
                          {})
            .out;
    }

    ServerTest::HttpClient client() const {
        return ServerTest::HttpClient(static_cast<std::uint16_t>(std::stoi(_port)));
    }

    std::string ask(const std::string& options) const {
        return runProcess({"sh", "-c", "curl --silent --show-error --max-time 30 " + options}, {}).out;
    }
};

TEST_F(ServeTest, SaysWhereItListensAndEndsOnASignal) {
    for (const int signal : {SIGTERM, SIGINT}) {
        serve();
        _server->send(signal);
        const Outcome outcome = _server->wait();
        EXPECT_EQ(outcome.status, 0);
        EXPECT_THAT(outcome.out, MatchesRegex("Listening on http://127.0.0.1:[1-9][0-9]*\n"));
        EXPECT_EQ(outcome.err, "");
    }
}

/** The socket of a service manager, which receives messages of sd_notify(3). */
class NotifySocket {
public:
    /** @param name a file, or a name outside of the file system behind an at sign. */
    explicit NotifySocket(const std::string& name) : _socket(socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0)) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        std::memcpy(&address.sun_path, name.data(), name.size());
        if (name.front() == '@') {
            address.sun_path[0] = '\0';
        }
        const auto size = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + name.size());
        const timeval patience{60, 0};
        if (bind(_socket, reinterpret_cast<const sockaddr*>(&address), size) != 0 ||
            setsockopt(_socket, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience) != 0) {
            throw std::system_error(errno, std::generic_category(), name);
        }
    }
    ~NotifySocket() { close(_socket); }
    NotifySocket(const NotifySocket&) = delete;
    NotifySocket& operator=(const NotifySocket&) = delete;

    /** Waits for the next message. */
    std::string next() const {
        std::array<char, 1024> message{};
        const ssize_t size = recv(_socket, message.data(), message.size(), 0);
        return size < 0 ? "nothing within a minute" : std::string(message.data(), static_cast<std::size_t>(size));
    }

private:
    const int _socket;
};

TEST_F(ServeTest, TellsTheServiceManagerWhenItListensAndWhenItEnds) {
    for (const std::string& name : {(_folder / "notify").string(), "@orv-test-" + std::to_string(getpid())}) {
        const NotifySocket manager(name);
        const RunningProcess server({ORVCIM_PROGRAM, "serve", "--port=0"},
                                    {{"ORV_AGENT_CONFIG", (_folder / "agent.toml").string()}, {"NOTIFY_SOCKET", name}});
        EXPECT_EQ(manager.next(), "READY=1\nSTATUS=" + server.firstLine() + "\n");
        server.send(SIGTERM);
        EXPECT_EQ(manager.next(), "STOPPING=1");
    }
}

TEST_F(ServeTest, TellsTheServiceManagerAgainAndAgainThatItServes) {
    const std::string certificate = makeCertificate();
    for (const std::vector<std::string>& options :
         {std::vector<std::string>{}, {"--listen=::1"}, {"--tls-cert=" + certificate, "--tls-key=" + certificate}}) {
        const NotifySocket manager((_folder / "notify").string());
        std::vector<std::string> arguments = {ORVCIM_PROGRAM, "serve", "--port=0"};
        arguments.insert(arguments.end(), options.begin(), options.end());
        RunningProcess server(arguments, {{"ORV_AGENT_CONFIG", (_folder / "agent.toml").string()},
                                          {"NOTIFY_SOCKET", (_folder / "notify").string()},
                                          {"WATCHDOG_USEC", "400000"}});
        EXPECT_THAT(manager.next(), StartsWith("READY=1\n"));
        EXPECT_EQ(manager.next(), "WATCHDOG=1");
        EXPECT_EQ(manager.next(), "WATCHDOG=1");
        server.send(SIGTERM);
        EXPECT_EQ(server.wait().err, "") << "it looks at itself in silence";
        std::filesystem::remove(_folder / "notify");
    }
}

TEST_F(ServeTest, ListensOnIpv6) {
    serve({"--listen", "::1"});
    EXPECT_THAT(_server->firstLine(), StartsWith("Listening on http://[::1]:"));
}

TEST_F(ServeTest, IsNotReachedByOtherMachinesWithoutTlsAndLogIns) {
    const std::vector<std::string> tls = {"--tls-cert=/dev/null", "--tls-key=/dev/null"};
    for (const std::string address : {"0.0.0.0", "::", "192.0.2.1", "2001:db8::1", "::ffff:127.0.0.1"}) {
        for (std::vector<std::string> options :
             {std::vector<std::string>{}, std::vector<std::string>{"--authenticate"}, tls}) {
            options.push_back("--listen=" + address);
            const Outcome outcome = refused(options);
            EXPECT_EQ(outcome.err, "orvcim: other machines can reach " + address +
                                       ": expected --tls-cert, --tls-key and --authenticate, or a loopback address\n");
            EXPECT_EQ(outcome.out, "");
            EXPECT_EQ(outcome.status, 2);
        }
    }
    const Outcome both = refused({"--listen=0.0.0.0", "--authenticate", "--tls-cert=/dev/null", "--tls-key=/dev/null"});
    EXPECT_EQ(both.err, "orvcim: group orv-power does not exist: only root may change the power state, and root "
                        "may not log in (see --allow-root)\n"
                        "orvcim: /dev/null: found nothing in it, expected PEM\n");
    EXPECT_EQ(both.status, 1);
}

TEST_F(ServeTest, DoesNotServeAMachineThatMayBeRealWithoutLogIns) {
    for (const char* machine : {"real", "silent"}) {
        const Outcome outcome = OrvcimTest::orvcim({"serve", "--port=0"}, {{"ORVCIM_TEST_MACHINE", machine}});
        EXPECT_EQ(outcome.err, "orvcim: the machine is not known to be a simulated one: expected --authenticate, so "
                               "that not everybody on it can switch it off\n");
        EXPECT_EQ(outcome.out, "");
        EXPECT_EQ(outcome.status, 1);
    }
    RunningProcess server({ORVCIM_PROGRAM, "--schema", ORVCIM_TEST_SCHEMA, "--provider-path", ORVCIM_TEST_LIBRARIES,
                           "serve", "--port=0", "--authenticate", "--power-group=daemon"},
                          {{"ORVCIM_TEST_MACHINE", "real"}});
    EXPECT_THAT(server.firstLine(), StartsWith("Listening on http://127.0.0.1:"));
}

TEST_F(ServeTest, SaysOfABrokenConfigurationInOneLineWhatToMend) {
    std::ofstream(_folder / "agent.toml") << "[instrumentation]\nbackend = \"guess\"\n";
    const std::string problem = (_folder / "agent.toml").string() +
                                ":2: instrumentation.backend: \"guess\": expected \"simulated\" or \"logind\" "
                                "('orvcim check' says more)\n";
    const Outcome outcome = refused({});
    EXPECT_EQ(outcome.err, "orvcim: the machine is not known: " + problem);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.status, 1);
    serve({"--authenticate", "--power-group=daemon"});
    EXPECT_EQ(_server->errWith("\n"), "orvcim: no power-management node is offered: " + problem);
}

struct Usage {
    std::vector<std::string> options;
    std::string message;
};

TEST_F(ServeTest, SaysWhatIsWrongWithTheCommandLine) {
    const Usage cases[] = {
        {{"--tls-cert=/dev/null"}, "orvcim: found one of --tls-cert and --tls-key, expected both or none\n"},
        {{"--tls-key=/dev/null"}, "orvcim: found one of --tls-cert and --tls-key, expected both or none\n"},
        {{"--max-body=0"}, "orvcim: --max-body: "},
        {{"--idle-time=0"}, "orvcim: --idle-time: found 0, expected seconds from 0.1 to 86400"},
        {{"--request-time=nan"}, "orvcim: --request-time: found nan, expected seconds from 0.1 to 86400"},
        {{"--port=70000"}, "orvcim: "},
        {{"--max-connections=1000000000"}, "orvcim: found a limit of "},
        {{"--threads=1001"}, "orvcim: --threads: "},
        {{"--listen=localhost"},
         "orvcim: --listen: found the address \"localhost\", expected an IPv4 or IPv6 address in numbers"},
        {{"--pam-service=orvcim"}, "orvcim: --pam-service requires --authenticate"},
        {{"--pam-folder=/etc/pam.d"}, "orvcim: --pam-folder requires --authenticate"},
        {{"--read-group=daemon"}, "orvcim: --read-group requires --authenticate"},
        {{"--power-group=daemon"}, "orvcim: --power-group requires --authenticate"},
    };
    for (const Usage& usage : cases) {
        const Outcome outcome = refused(usage.options);
        EXPECT_THAT(outcome.err, StartsWith(usage.message)) << usage.options.front();
        EXPECT_EQ(outcome.status, 2) << usage.options.front();
    }
}

TEST_F(ServeTest, SaysThatTheSystemGivesTooLittle) {
    const auto limitedTo = [](const std::string& limit, const std::string& options) {
        return runProcess({"sh", "-c",
                           "ulimit " + limit +
                               " && exec " ORVCIM_PROGRAM " --schema " ORVCIM_TEST_SCHEMA
                               " --provider-path " ORVCIM_TEST_LIBRARIES " serve --port=0 " +
                               options},
                          {});
    };
    const Outcome files = limitedTo("-n 100", "");
    EXPECT_EQ(files.err,
              "orvcim: found a limit of 100 open files, expected 1200 for 1000 connections: raise it, or lower "
              "--max-connections\n");
    EXPECT_EQ(files.status, 2);
}

TEST_F(ServeTest, SaysWhereItCannotListen) {
    serve();
    const Outcome outcome = start({"--port", _port})->wait();
    EXPECT_EQ(outcome.err, "orvcim: cannot listen on 127.0.0.1:" + _port + ": Address already in use\n");
    EXPECT_EQ(outcome.status, 1);
}

TEST_F(ServeTest, LogsABadRequestInOneLine) {
    serve();
    EXPECT_EQ(ask("--output /dev/null --write-out '%{http_code}' " + url("")), "405");
    EXPECT_EQ(
        ask("--data '<CIM' --header 'Content-Type: application/xml' --header 'CIMOperation: MethodCall' --output /dev/null --write-out "
            "'%{http_code} %header{CIMError}' " +
            url("")),
        "400 request-not-well-formed");
    _server->send(SIGTERM);
    const std::string err = _server->wait().err;
    EXPECT_EQ(err, "orvcim: 127.0.0.1: answered 405: found the HTTP method GET, expected POST or M-POST\n"
                   "orvcim: 127.0.0.1: answered 400: request-not-well-formed\n");
}

TEST_F(ServeTest, TakesLimitsFromTheCommandLine) {
    serve({"--max-body=100", "--max-headers=1000", "--request-time=2"});
    const auto statusOf = [this](const std::string& options) {
        return ask(options + " --output /dev/null --write-out '%{http_code}' " + url(""));
    };
    EXPECT_EQ(statusOf("--data " + std::string(101, 'x')), "413");
    EXPECT_EQ(statusOf("--data x --header 'X: " + std::string(1000, 'x') + "'"), "431");
    // The request announces a body and does not send it.
    EXPECT_EQ(statusOf("--data x --header 'Content-Length: 50'"), "408");
    serve({"--idle-time=0.3"});
    EXPECT_EQ(client().receiveAll(), "") << "nothing but the end, since nothing was asked";
}

/* Who may do what. */

TEST_F(ServeTest, LetsUsersDoWhatTheirGroupsMay) {
    serve({"--authenticate", "--pam-folder", makeUsers(), "--power-group", "daemon", "--allow-root",
           "--allow-without-shell"});
    const std::string request = "RequestPowerStateChange.PowerState=5,ManagedElement=" + _system;
    const std::string className = "root/cimv2:TALVO_ComputerSystem";

    const Outcome nobody = wbemcli({"ein", url(className, "nobody:small")});
    EXPECT_THAT(nobody.out, HasSubstr("machine.example"));
    EXPECT_EQ(nobody.status, 0);
    const Outcome denied = wbemcli({"cm", url(_service, "nobody:small"), request});
    EXPECT_THAT(denied.err + denied.out, HasSubstr("CIM_ERR_ACCESS_DENIED"));
    EXPECT_NE(denied.status, 0);
    const Outcome done = wbemcli({"cm", url(_service, "root:top"), request});
    EXPECT_THAT(done.out, EndsWith("RequestPowerStateChange: 0\n"));

    EXPECT_THAT(wbemcli({"ein", url(className)}).err, HasSubstr("Username/password required"));
    for (const char* user : {"nobody:large", "stranger:small"}) {
        EXPECT_THAT(wbemcli({"ein", url(className, user)}).err, HasSubstr("Invalid username/password")) << user;
    }
    EXPECT_THAT(_server->errWith("log-in as \"stranger\" failed: Authentication failure\n"),
                EndsWith("orvcim: 127.0.0.1: log-in as \"nobody\" failed: Authentication failure\n"
                         "orvcim: 127.0.0.1: log-in as \"stranger\" failed: Authentication failure\n"));
}

TEST_F(ServeTest, LetsOnlyAGroupReadWhereItIsToldTo) {
    serve({"--authenticate", "--pam-folder", makeUsers(), "--power-group", "daemon", "--read-group", "bin",
           "--allow-root", "--allow-without-shell"});
    const Outcome denied = wbemcli({"ein", url("root/cimv2:TALVO_ComputerSystem", "nobody:small")});
    EXPECT_THAT(denied.err + denied.out, HasSubstr("CIM_ERR_ACCESS_DENIED"));
    EXPECT_EQ(wbemcli({"ein", url("root/cimv2:TALVO_ComputerSystem", "root:top")}).status, 0);
}

TEST_F(ServeTest, ServesWithTls) {
    const std::string certificate = makeCertificate();
    serve({"--tls-cert", certificate, "--tls-key", certificate, "--authenticate", "--pam-folder", makeUsers(),
           "--power-group=daemon", "--listen=0.0.0.0", "--allow-root", "--allow-without-shell"});
    EXPECT_THAT(_server->firstLine(), StartsWith("Listening on https://0.0.0.0:"));
    const std::string system = url("root/cimv2:TALVO_ComputerSystem", "nobody:small", "https");
    EXPECT_THAT(wbemcli({"ein", "-cacert", certificate, system}).out, HasSubstr("machine.example"));
    EXPECT_NE(wbemcli({"ein", system}).status, 0);
}

TEST_F(ServeTest, TakesANewCertificateOnASignalAndKeepsTheOldOneIfTheNewOneIsWrong) {
    const std::string file = makeCertificate();
    serve({"--tls-cert", file, "--tls-key", file});
    const std::string first = fingerprint();
    EXPECT_THAT(first, HasSubstr("Fingerprint="));
    makeCertificate();
    _server->send(SIGHUP);
    const std::string renewed = "orvcim: read the certificate and its key again\n";
    EXPECT_THAT(_server->errWith(renewed), HasSubstr(renewed));
    const std::string second = fingerprint();
    EXPECT_NE(second, first);
    std::ofstream(file) << "no certificate\n";
    _server->send(SIGHUP);
    EXPECT_THAT(_server->errWith("stay as they were: "),
                HasSubstr("orvcim: the certificate and its key stay as they were: "));
    EXPECT_EQ(fingerprint(), second);
}

TEST_F(ServeTest, DropsNobodyForANewCertificate) {
    const std::string file = makeCertificate();
    serve({"--tls-cert", file, "--tls-key", file});
    const auto connect = [this] {
        ServerTest::HttpClient connected = client();
        connected.encrypt();
        return connected;
    };
    // One that was answered, one that has sent half of its request, and one that has only connected.
    ServerTest::HttpClient answered = connect();
    ServerTest::HttpClient asking = connect();
    ServerTest::HttpClient silent = connect();
    constexpr int unsupported = 415;
    const std::string request = ServerTest::post("no CIM");
    answered.send(request);
    EXPECT_EQ(answered.receive().status, unsupported);
    asking.send(request.substr(0, request.size() / 2));

    makeCertificate();
    _server->send(SIGHUP);
    _server->errWith("read the certificate and its key again\n");
    asking.send(request.substr(request.size() / 2));
    answered.send(request);
    silent.send(request);
    for (ServerTest::HttpClient* each : {&answered, &asking, &silent}) {
        EXPECT_EQ(each->receive().status, unsupported);
        EXPECT_NE(each->certificate(), connect().certificate());
    }
    EXPECT_EQ(connect().certificate(), connect().certificate());
}

TEST_F(ServeTest, RefusesCertificatesThatAreOverOrWeakAndWarnsOfAKeyThatOthersCanRead) {
    const std::string file = makeCertificate();
    std::filesystem::permissions(file, std::filesystem::perms::others_read, std::filesystem::perm_options::add);
    serve({"--tls-cert", file, "--tls-key", file});
    EXPECT_EQ(_server->errWith("0640\n"),
              "orvcim: " + file +
                  ": everybody on this machine can read the key (mode 0604), expected mode 0600 or "
                  "0640\n");

    const std::string made = (_folder / "made").string();
    const auto errorWith = [&](const std::string& commands) {
        const Outcome making =
            runProcess({"sh", "-ec", "umask 77; mkdir " + made + "; cd " + made + "; " + commands}, {});
        EXPECT_EQ(making.status, 0) << making.err;
        const Outcome outcome = refused({"--tls-cert", made + "/certificate", "--tls-key", made + "/key"});
        EXPECT_EQ(outcome.status, 1);
        std::filesystem::remove_all(made);
        return outcome.err;
    };
    EXPECT_EQ(errorWith("openssl req -x509 -newkey rsa:1024 -noenc -days 2 -subj /CN=localhost -keyout key -out "
                        "certificate"),
              "orvcim: " + made + "/certificate: the key has 1024 bits, expected 2048 or more\n");
    EXPECT_EQ(
        errorWith("printf '%s\\n' '[ca]' default_ca=c '[c]' database=index new_certs_dir=. serial=serial policy=p "
                  "default_md=sha256 '[p]' commonName=supplied >configuration; : >index; echo 01 >serial; "
                  "openssl req -new -newkey ec -pkeyopt ec_paramgen_curve:P-256 -noenc -subj /CN=localhost -keyout "
                  "key -out request; openssl ca -batch -notext -config configuration -selfsign -keyfile key -in "
                  "request -startdate 20200101000000Z -enddate 20210101000000Z -out certificate"),
        "orvcim: " + made + "/certificate: the certificate was valid until 2021-01-01, expected one that still is\n");
}

/* What hangs. */

class HangingTest : public ServeTest {
protected:
    /** A client that gets no answer. @param operation and the path, as the stock client takes them. */
    void ask(const std::string& operation, const std::string& path, const std::string& user = "") {
        _waiting.push_back(
            std::make_unique<RunningProcess>(std::vector<std::string>{"wbemcli", operation, url(path, user)},
                                             std::map<std::string, std::string>{{"LC_ALL", "C"}}));
    }

    /** Waits until so many things hang. */
    void waitForHanging(std::uintmax_t count) const {
        std::error_code isMissing;
        const auto end = std::chrono::steady_clock::now() + std::chrono::minutes{1};
        while (std::filesystem::file_size(_hanging, isMissing) != count || isMissing) {
            ASSERT_LT(std::chrono::steady_clock::now(), end) << _server->err();
            std::this_thread::sleep_for(std::chrono::milliseconds{2});
        }
    }

    /** Asks the server to end: it takes less than ten seconds, and no more than the answers under way may have. */
    void expectToEnd() const {
        const auto begin = std::chrono::steady_clock::now();
        _server->send(SIGTERM);
        const Outcome outcome = _server->wait();
        // What a busy machine adds is less than what waits here.
        EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds{20});
        EXPECT_EQ(outcome.status, 0);
        EXPECT_THAT(outcome.err, EndsWith("orvcim: stopped before all answers were sent\n"
                                          "orvcim: ended although a provider or PAM did not return\n"));
    }

    const std::string _system = "root/cimv2:TALVO_ComputerSystem";
    const std::string _disk = "root/test:Test_Disk.Name=\"hangs\"";
    const std::string _hanging = (_folder / "hanging").string();
    std::vector<std::unique_ptr<RunningProcess>> _waiting;
};

TEST_F(HangingTest, PamHoldsUpNeitherUsersWhoWereLetInNorTheEnd) {
    serve({"--authenticate", "--pam-folder", makeUsers("auth optional " TEST_PAM " hangs=" + _hanging + "\n"),
           "--power-group=daemon", "--allow-root", "--allow-without-shell"});
    EXPECT_EQ(wbemcli({"ein", url(_system, "root:top")}).status, 0);
    constexpr int atATime = 2;
    constexpr int queued = 8;
    for (int i = 0; i < atATime + queued; ++i) {
        ask("ein", _system, "nobody:small");
    }
    waitForHanging(atATime);
    EXPECT_EQ(wbemcli({"ein", url(_system, "root:top")}).status, 0);
    expectToEnd();
}

TEST_F(HangingTest, AProviderHoldsUpNeitherOthersNorTheEnd) {
    serve({"--schema", TEST_DISKS_SCHEMA, "--provider-path", TEST_PROVIDERS}, {{"TEST_HANGS", _hanging}});
    // As many as are answered at a time, of one network and of all.
    constexpr int atATime = 6;
    for (int i = 1; i < atATime; ++i) {
        ask("gi", _disk);
    }
    waitForHanging(atATime - 1);
    EXPECT_EQ(wbemcli({"ein", url(_system)}).status, 0);
    constexpr int queued = 10;
    for (int i = 0; i < queued; ++i) {
        ask("gi", _disk);
    }
    waitForHanging(atATime);
    expectToEnd();
}

TEST_F(ServeTest, GoesOnIfTheDiskOfItsLogIsFullAndWritesItsLinesOnceThereIsRoom) {
    const std::filesystem::path full = _folder / "full";
    std::filesystem::create_directory(full);
    const std::string log = (full / "log").string();
    Environment variables = environment();
    variables.insert({{"LD_PRELOAD", TEST_FULL_DISK}, {"TEST_FULL_FOLDER", full.string()}});
    serveAs(std::make_unique<RunningProcess>(
        std::vector<std::string>{"sh", "-c", "exec \"$0\" serve --port=0 2>" + log, ORVCIM_PROGRAM}, variables));
    EXPECT_EQ(ask("--output /dev/null --write-out '%{http_code}' " + url("")), "405");
    EXPECT_EQ(wbemcli({"cm", url(_service), "RequestPowerStateChange.PowerState=5,ManagedElement=" + _system}).status,
              0);
    EXPECT_EQ(std::filesystem::file_size(log), 0U);

    std::ofstream(full / "room");
    std::string text;
    const auto end = std::chrono::steady_clock::now() + std::chrono::minutes{1};
    while (text.find(": accepted: ") == std::string::npos && std::chrono::steady_clock::now() < end) {
        std::this_thread::sleep_for(std::chrono::milliseconds{2});
        text = (std::ostringstream() << std::ifstream(log).rdbuf()).str();
    }
    EXPECT_THAT(text,
                MatchesRegex("orvcim: 127.0.0.1: answered 405: .*\norvcim: .* 127.0.0.1 somebody without a log-in: "
                             "TALVO_PowerManagementService.RequestPowerStateChange.*: accepted: .*\n"));
    EXPECT_EQ(ask("--output /dev/null --write-out '%{http_code}' " + url("")), "405");
}

TEST_F(ServeTest, EndsThoughTheDiskOfItsLogIsFull) {
    serveAs(std::make_unique<RunningProcess>(
        std::vector<std::string>{"sh", "-c", "exec \"$0\" serve --port=0 2>/dev/full", ORVCIM_PROGRAM}, environment()));
    EXPECT_EQ(ask("--output /dev/null --write-out '%{http_code}' " + url("")), "405");
    _server->send(SIGTERM);
    EXPECT_EQ(_server->wait().status, 0);
}

TEST_F(ServeTest, TellsOnASignalHowItIs) {
    serve();
    ask(url("[1-3]"));
    _server->send(SIGUSR1);
    EXPECT_THAT(
        _server->errWith(" of memory\n"),
        MatchesRegex("(orvcim: 127.0.0.1: answered 405.*\n)*orvcim: [0-9]+ connections idle, 0 sending requests, "
                     "0 logging in, 0 answered, [0-9]+ taking answers; since the start 3 requests, 0 connections "
                     "refused, 0 log-ins good, 0 wrong, [0-9]+ kB of memory\n"));
}

TEST_F(ServeTest, LogsEachRequestIfItIsToldTo) {
    serve({"--access-log"});
    ask(url("path"));
    EXPECT_THAT(_server->errWith(" ms\n"), MatchesRegex("(orvcim: .*\n)?orvcim: 127.0.0.1: - \"GET /path\" 405 [0-9]+ "
                                                        "[0-9]+\\.[0-9] ms\n(orvcim: .*\n)?"));
}

TEST_F(ServeTest, BoundsWhatOneRequestMayHave) {
    configure("[[instrumentation.simulated.node]]\npath = \"a\"\n[[instrumentation.simulated.node]]\npath = \"b\"\n");
    serve({"--max-objects=1"});
    const Outcome outcome = wbemcli({"ein", url("root/cimv2:TALVO_PowerManagementService")});
    EXPECT_THAT(outcome.err + outcome.out,
                HasSubstr("returned more than 1 objects, which one request may have at most"));
    EXPECT_EQ(wbemcli({"ein", url("root/cimv2:TALVO_ComputerSystem")}).status, 0);
}

TEST_F(ServeTest, LosesNoLineAboutTheSwitchIfNobodyReadsTheLog) {
    const std::string pipe = (_folder / "log-pipe").string();
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    const int reader = open(pipe.c_str(), O_RDWR | O_NONBLOCK | O_CLOEXEC);
    ASSERT_GE(reader, 0);
    RunningProcess server({"sh", "-c", "exec \"$0\" serve --port=0 --access-log 2>" + pipe, ORVCIM_PROGRAM},
                          environment());
    const std::string line = server.firstLine();
    _port = line.substr(line.rfind(':') + 1);
    // More lines than the pipe and the queue hold.
    ask("--output /dev/null " + url("[1-5500]"));
    const Outcome denied =
        wbemcli({"cm", url(_service), "RequestPowerStateChange.PowerState=2,ManagedElement=" + _system});
    EXPECT_NE(denied.status, 0);
    EXPECT_EQ(wbemcli({"cm", url(_service), "RequestPowerStateChange.PowerState=5,ManagedElement=" + _system}).status,
              0);
    std::string log;
    pollfd waiting{reader, POLLIN, 0};
    while (log.find("more lines are left out: the log's reader is too slow") == std::string::npos &&
           poll(&waiting, 1, 60'000) > 0) {
        std::array<char, 65536> part{};
        const ssize_t size = read(reader, part.data(), part.size());
        log.append(part.data(), size > 0 ? static_cast<std::size_t>(size) : 0);
    }
    close(reader);
    EXPECT_THAT(log, HasSubstr("more lines are left out"));
    EXPECT_THAT(log, HasSubstr(": refused: "));
    EXPECT_THAT(log, HasSubstr(": accepted"));
}

} // namespace
} // namespace OrvcimTest

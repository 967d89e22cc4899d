#include "Attack.h"

#include <gmock/gmock.h>

#include <sys/resource.h>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <future>
#include <stdexcept>
#include <system_error>
#include <thread>

namespace AttackTest {

namespace {

using Clock = std::chrono::steady_clock;
using testing::ContainsRegex;
using testing::IsEmpty;

/** What the server's memory may be at most. */
constexpr std::size_t mostMemory = 256'000'000;

constexpr const char* reader = "nobody:small";
constexpr const char* operatorOfMachine = "root:top";

/** A request. @param call the element that asks. */
std::string request(const std::string& user, const std::string& method, const std::string& object,
                    const std::string& call) {
    const std::size_t colon = user.find(':');
    return post("<?xml version=\"1.0\" encoding=\"utf-8\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">"
                "<MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ>" +
                    call + "</SIMPLEREQ></MESSAGE></CIM>",
                logInAs(user.substr(0, colon), user.substr(colon + 1)) +
                    "Content-Type: application/xml; charset=\"utf-8\"\r\nCIMOperation: MethodCall\r\nCIMMethod: " +
                    method + "\r\nCIMObject: " + object + "\r\n");
}

std::string nameSpacePath(const std::string& nameSpace) {
    const std::size_t slash = nameSpace.find('/');
    return "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"" + nameSpace.substr(0, slash) + "\"/><NAMESPACE NAME=\"" +
           nameSpace.substr(slash + 1) + "\"/></LOCALNAMESPACEPATH>";
}

std::string key(const std::string& name, const std::string& value) {
    return "<KEYBINDING NAME=\"" + name + "\"><KEYVALUE VALUETYPE=\"string\">" + value + "</KEYVALUE></KEYBINDING>";
}

/** Where an instance in root/cimv2 is. */
std::string instancePath(const std::string& className, const std::string& keys) {
    return "<LOCALINSTANCEPATH>" + nameSpacePath("root/cimv2") + "<INSTANCENAME CLASSNAME=\"" + className + "\">" +
           keys + "</INSTANCENAME></LOCALINSTANCEPATH>";
}

/** Asks again and again, and measures. */
class User {
public:
    explicit User(std::function<void()> ask) : _ask(std::move(ask)), _thread([this] { run(); }) {}
    User(const User&) = delete;
    User& operator=(const User&) = delete;
    ~User() { stop(); }

    void stop() {
        _stopping = true;
        if (_thread.joinable()) {
            _thread.join();
        }
    }

    /** How often it has asked. */
    std::atomic<int> asked = 0;
    std::vector<std::string> errors;
    /** Of each answer, or failure. */
    std::vector<Clock::duration> waits;

    /** The wait that half of all waits exceed. */
    Clock::duration usualWait() {
        const auto middle = waits.begin() + static_cast<std::ptrdiff_t>(waits.size() / 2);
        std::ranges::nth_element(waits, middle);
        return *middle;
    }

private:
    void run() {
        while (!_stopping) {
            const auto begin = Clock::now();
            try {
                _ask();
            } catch (const std::exception& error) {
                errors.emplace_back(error.what());
            }
            waits.push_back(Clock::now() - begin);
            ++asked;
            // Users ask at a rate; the processors are the attack's.
            std::this_thread::sleep_for(10ms);
        }
    }

    const std::function<void()> _ask;
    std::atomic<bool> _stopping = false;
    std::thread _thread;
};

} // namespace

std::chrono::milliseconds attackTime() {
    const char* const seconds = std::getenv("ORV_ATTACK_SECONDS");
    return seconds == nullptr ? 1500ms : std::chrono::seconds{std::atoi(seconds)};
}

AttackTest::AttackTest() {
    rlimit files{};
    getrlimit(RLIMIT_NOFILE, &files);
    files.rlim_cur = files.rlim_max;
    setrlimit(RLIMIT_NOFILE, &files);
    configure("shutdown-time = 0\n[[instrumentation.simulated.node]]\npath = \"chassis/blade1\"\n");
}

void AttackTest::serveWithLogIns(std::vector<std::string> options, Environment variables) {
    const std::string certificate = makeCertificate();
    options.insert(options.begin(), {"--listen=::", "--tls-cert", certificate, "--tls-key", certificate,
                                     "--authenticate", "--pam-folder", makeUsers("auth optional " TEST_PAM " slow\n"),
                                     "--power-group=daemon", "--allow-root", "--allow-without-shell", "--schema",
                                     TEST_SCHEMA, "--provider-path", TEST_PROVIDERS});
    serve(options, variables);
}

void AttackTest::attack(const std::function<void()>& step, unsigned int least) {
    // So that half of them say something.
    constexpr int leastAsked = 10;
    User user(_ask);
    const auto end = Clock::now() + attackTime();
    for (unsigned int count = 0; count < least || Clock::now() < end || user.asked < leastAsked; ++count) {
        step();
    }
    std::future<Clock::duration> switching = std::async(std::launch::async, [&] {
        user.stop();
        const auto begin = Clock::now();
        switchOff();
        return Clock::now() - begin;
    });
    while (switching.wait_for(0s) != std::future_status::ready) {
        step();
    }
    EXPECT_LT(switching.get(), _patience);
    EXPECT_THAT(user.errors, IsEmpty());
    const auto longest = *std::ranges::max_element(user.waits);
    EXPECT_LT(longest, _patience);
    EXPECT_LT(user.usualWait(), _usualPatience);
    EXPECT_THAT(_server->errWith(": accepted: "),
                ContainsRegex("Z ::1 root: TALVO_PowerManagementService.RequestPowerStateChange\\(PowerState=8, .*"
                              ": accepted: "));
    RecordProperty("longest_ms", static_cast<int>(longest / 1ms));
    RecordProperty("usual_ms", static_cast<int>(user.usualWait() / 1ms));
    RecordProperty("attackers", static_cast<int>(_attackers));
    RecordProperty("memory_kB", static_cast<int>(_server->peakMemory() / 1024));
    if (!isSanitized) {
        EXPECT_LT(_server->peakMemory(), mostMemory);
    }
}

std::optional<HttpClient> AttackTest::attacker() {
    const std::string from = "127.0." + std::to_string(_attackers++ % 200) + ".7";
    try {
        return HttpClient(port(), "127.0.0.1", from);
    } catch (const std::system_error&) {
        return std::nullopt;
    }
}

std::optional<HttpClient> AttackTest::attackerWithTls() {
    std::optional<HttpClient> client = attacker();
    try {
        if (client) {
            client->encrypt();
        }
        return client;
    } catch (const std::runtime_error&) {
        return std::nullopt;
    }
}

void AttackTest::hold(std::optional<HttpClient> connection) {
    if (connection) {
        _held.push_back(*std::move(connection));
    }
    if (_held.size() > _mostHeld) {
        _held.pop_front();
    }
}

void AttackTest::hold(const std::string& text) {
    std::optional<HttpClient> connection = attackerWithTls();
    if (connection) {
        connection->send(text);
    }
    hold(std::move(connection));
}

void AttackTest::holdSometimes(const std::string& text) {
    constexpr unsigned int times = 6;
    if (_attackers % times == 0) {
        hold(text);
    } else {
        hold(attacker());
    }
}

void AttackTest::holdSlow() {
    hold(begunRequest);
    for (int count = 0; count < 20 && !_held.empty(); ++count) {
        _held[_next++ % _held.size()].send("x");
    }
}

void AttackTest::storm() {
    std::deque<HttpClient> clients;
    for (int count = 0; count < 100; ++count) {
        if (auto one = attacker()) {
            clients.push_back(*std::move(one));
        }
    }
}

void AttackTest::holdInTheClear(const std::string& text) {
    std::optional<HttpClient> connection = attacker();
    if (connection) {
        connection->send(text);
    }
    hold(std::move(connection));
}

std::string AttackTest::enumerate(const std::string& className, const std::string& nameSpace, const std::string& user) {
    return request(user, "EnumerateInstances", nameSpace,
                   "<IMETHODCALL NAME=\"EnumerateInstances\">" + nameSpacePath(nameSpace) +
                       "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"" + className +
                       "\"/></IPARAMVALUE></IMETHODCALL>");
}

std::string AttackTest::get(const std::string& className, const std::string& name, const std::string& nameSpace,
                            const std::string& user) {
    return request(user, "GetInstance", nameSpace,
                   "<IMETHODCALL NAME=\"GetInstance\">" + nameSpacePath(nameSpace) +
                       "<IPARAMVALUE NAME=\"InstanceName\"><INSTANCENAME CLASSNAME=\"" + className + "\">" +
                       key("Name", name) + "</INSTANCENAME></IPARAMVALUE></IMETHODCALL>");
}

std::string AttackTest::answerTo(const std::string& request) const {
    HttpClient client(port(), "::1");
    client.encrypt();
    client.send(request);
    const ServerTest::Reply reply = client.receive();
    return reply.status == 200 ? reply.body : "status " + std::to_string(reply.status);
}

void AttackTest::readPowerState() const {
    const std::string answer = answerTo(enumerate("TALVO_AssociatedPowerManagementService", "root/cimv2", reader));
    if (answer.find("<PROPERTY NAME=\"PowerState\" TYPE=\"uint16\"><VALUE>2</VALUE>") == std::string::npos) {
        throw std::runtime_error("no power state: " + answer);
    }
}

void AttackTest::readMuch() const {
    const std::string answer = answerTo(enumerate("Test_Disk", "root/test", reader));
    if (!answer.ends_with("</CIM>\n")) {
        throw std::runtime_error("no whole answer: " + answer.substr(0, 1000));
    }
}

void AttackTest::switchOff() const {
    const std::string answer = answerTo(request(
        operatorOfMachine, "RequestPowerStateChange", "root/cimv2%3ATALVO_PowerManagementService",
        "<METHODCALL NAME=\"RequestPowerStateChange\">" +
            instancePath("TALVO_PowerManagementService", key("CreationClassName", "TALVO_PowerManagementService") +
                                                             key("Name", "PowerStateManagement_chassis/blade1") +
                                                             key("SystemCreationClassName", "TALVO_ComputerSystem") +
                                                             key("SystemName", "machine.example")) +
            "<PARAMVALUE NAME=\"PowerState\" PARAMTYPE=\"uint16\"><VALUE>8</VALUE></PARAMVALUE>"
            "<PARAMVALUE NAME=\"ManagedElement\" PARAMTYPE=\"reference\"><VALUE.REFERENCE>" +
            instancePath("TALVO_ComputerSystem",
                         key("CreationClassName", "TALVO_ComputerSystem") + key("Name", "machine.example")) +
            "</VALUE.REFERENCE></PARAMVALUE></METHODCALL>"));
    EXPECT_THAT(answer, testing::HasSubstr("<RETURNVALUE PARAMTYPE=\"uint32\"><VALUE>0</VALUE></RETURNVALUE>"));
    EXPECT_TRUE(std::filesystem::exists(_folder / "state.json")) << "the machine does not know of it";
}

} // namespace AttackTest

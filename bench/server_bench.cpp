/**
 * The object manager as its clients on the network find it: requests per second
 * and latency, over loopback and with connections kept alive, the memory of the
 * server, and how long programs take to start. Runs "orvcim serve" on simulated
 * machines of several sizes; the load comes from one thread of this program,
 * which does not sleep while it waits for a quick answer. Beside it stands the
 * limit: the same HTTP server, which hands out the same bytes from memory.
 *
 * Prints a figure a line: table, row, column and value, with tabs between them.
 *
 * Takes of the options that the other benchmarks have
 * --benchmark_min_time=SECONDS, for each measurement, and
 * --benchmark_filter=REGEX, of names as the table shows them. With
 * --instructions=FOLDER, it lets callgrind count the server's instructions
 * instead, and leaves its dumps in that folder; bench/count-instructions makes
 * figures of them.
 */
#include "Client.h"
#include "Requests.h"
#include "ServerProcess.h"
#include "System.h"

#include "server/HttpServer.h"

#include <pthread.h>
#include <sys/epoll.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <regex>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

namespace {

using namespace Bench;

void print(const char* table, const std::string& row, const char* column, double value) {
    std::printf("%s\t%s\t%s\t%.4g\n", table, row.c_str(), column, value);
    std::fflush(stdout);
}

/** A request, the server that answers it, and the size of the body of every reply. */
struct Load {
    const ServerProcess& server;
    std::string request;
    std::size_t size;
    Transport transport = Transport::plain;
};

struct Measurement {
    double requestsPerSecond = 0;
    /** The server's processor time for one request. */
    double microseconds = 0;
    /** The latencies in milliseconds, sorted. */
    std::vector<double> latencies;
    std::vector<double> firstBytes;
};

/**
 * Waits without sleeping as long as a quick answer may take: how long the core
 * of a virtual machine takes to wake up for this program is not the server's.
 * The server goes first on it, though. After that this program sleeps.
 */
int waitForEvents(int poll, std::array<epoll_event, 64>& events) {
    constexpr std::chrono::microseconds quickAnswer{500};
    constexpr int asLongAsItTakes = -1;
    const int size = static_cast<int>(events.size());
    const auto end = Clock::now() + quickAnswer;
    while (Clock::now() < end) {
        if (const int ready = epoll_wait(poll, events.data(), size, 0); ready != 0) {
            return ready;
        }
        std::this_thread::yield();
    }
    return epoll_wait(poll, events.data(), size, asLongAsItTakes);
}

Measurement measure(const Load& load, unsigned int connections, double seconds) {
    const int poll = epoll_create1(EPOLL_CLOEXEC);
    require(poll >= 0, "epoll_create1");
    std::vector<std::unique_ptr<Client>> clients;
    for (unsigned int i = 0; i < connections; ++i) {
        clients.push_back(std::make_unique<Client>(load.server.port(), load.transport));
        epoll_event event{};
        event.events = EPOLLIN;
        event.data.ptr = clients.back().get();
        require(epoll_ctl(poll, EPOLL_CTL_ADD, clients.back()->socketNumber(), &event) == 0, "epoll_ctl");
    }
    Measurement result;
    const double processorTime = load.server.processorTime();
    const auto begin = Clock::now();
    const auto end = begin + std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(seconds));
    for (const auto& client : clients) {
        client->ask(load.request);
    }
    std::array<epoll_event, 64> events{};
    for (std::size_t asked = connections; asked > 0;) {
        const int ready = waitForEvents(poll, events);
        for (int i = 0; i < ready; ++i) {
            Client& client = *static_cast<Client*>(events[static_cast<std::size_t>(i)].data.ptr);
            if (!client.take()) {
                continue;
            }
            if (client.bodySize() != load.size || !client.reply().starts_with("HTTP/1.1 200 ")) {
                throw std::runtime_error("wrong reply: " + client.reply());
            }
            result.latencies.push_back(client.latency());
            result.firstBytes.push_back(client.firstByte());
            if (Clock::now() < end) {
                client.ask(load.request);
            } else {
                --asked;
            }
        }
    }
    result.requestsPerSecond =
        static_cast<double>(result.latencies.size()) / std::chrono::duration<double>(Clock::now() - begin).count();
    constexpr double microsecondsPerSecond = 1e6;
    result.microseconds = (load.server.processorTime() - processorTime) * microsecondsPerSecond /
                          static_cast<double>(result.latencies.size());
    close(poll);
    std::sort(result.latencies.begin(), result.latencies.end());
    std::sort(result.firstBytes.begin(), result.firstBytes.end());
    return result;
}

double percentile(const std::vector<double>& sorted, double part) {
    return sorted[static_cast<std::size_t>(part * static_cast<double>(sorted.size() - 1))];
}

double median(const std::vector<double>& sorted) {
    return percentile(sorted, 0.5);
}

struct Options {
    double seconds = 2;
    std::string filter;
    std::filesystem::path instructions;
    std::filesystem::path constant;
};

Options optionsOf(const std::vector<std::string_view>& arguments) {
    constexpr std::string_view time = "--benchmark_min_time=";
    constexpr std::string_view filter = "--benchmark_filter=";
    constexpr std::string_view instructions = "--instructions=";
    constexpr std::string_view constant = "--constant=";
    Options options;
    for (const std::string_view argument : arguments) {
        if (argument.starts_with(time)) {
            options.seconds = std::stod(std::string(argument.substr(time.size())));
        } else if (argument.starts_with(filter)) {
            options.filter = argument.substr(filter.size());
        } else if (argument.starts_with(instructions)) {
            options.instructions = argument.substr(instructions.size());
        } else if (argument.starts_with(constant)) {
            options.constant = argument.substr(constant.size());
        } else {
            throw std::runtime_error("found " + std::string(argument) + ", expected " + std::string(time) +
                                     "SECONDS, " + std::string(filter) + "REGEX or " + std::string(instructions) +
                                     "FOLDER");
        }
    }
    return options;
}

/** Of a pair of a request and a number of nodes, whether it is measured: pairs
 * of associations are many. */
bool isMeasured(const Request& request, unsigned int nodes) {
    constexpr unsigned int mostNodesOfAssociations = 100;
    return nodes <= mostNodesOfAssociations || request.objectsPerNode == 0 || request.objects == 0;
}

const std::vector<std::string> serve = {ORV_PROGRAM, "serve", "--port=0"};

std::vector<std::string> operator+(std::vector<std::string> command, const std::vector<std::string>& more) {
    command.insert(command.end(), more.begin(), more.end());
    return command;
}

/** Checks a reply, to which all later replies are compared by size. @return its body. */
std::string checkedBody(const ServerProcess& server, const Request& request, const std::string& text,
                        unsigned int nodes, Transport transport = Transport::plain) {
    Client client(server.port(), transport);
    client.answerTo(text);
    std::string body = client.body();
    request.check(body, nodes);
    return body;
}

std::string rowOf(const std::string& name, unsigned int connections, unsigned int nodes) {
    return name + '/' + std::to_string(connections) + '/' + std::to_string(nodes);
}

/** Measures each kind of request, and the limit for it. */
void measureRequests(const ServerProcess& server, unsigned int nodes, double seconds, const std::regex& filter) {
    const Folder folder;
    const std::string reply = folder / "reply";
    for (const Request& request : requests()) {
        if (!isMeasured(request, nodes)) {
            continue;
        }
        const std::string body = checkedBody(server, request, request.text(), nodes);
        std::ofstream(reply) << body;
        const ServerProcess constant({"/proc/" + std::to_string(getpid()) + "/exe", "--constant=" + reply});
        for (const unsigned int connections : {1U, 8U, 64U}) {
            const std::string row = rowOf(request.name, connections, nodes);
            if (!std::regex_search(row, filter)) {
                continue;
            }
            const Measurement limit = measure({constant, request.text(), body.size()}, connections, seconds);
            const Measurement found = measure({server, request.text(), body.size()}, connections, seconds);
            print("server", row, "requests/s", found.requestsPerSecond);
            print("server", row, "limit requests/s", limit.requestsPerSecond);
            print("server", row, "median ms", median(found.latencies));
            print("server", row, "limit median ms", median(limit.latencies));
            print("server", row, "90 % ms", percentile(found.latencies, 0.9));
            print("server", row, "99 % ms", percentile(found.latencies, 0.99));
            print("server", row, "longest ms", found.latencies.back());
            print("server", row, "first byte ms", median(found.firstBytes));
            print("server", row, "server \u00b5s", found.microseconds);
            print("server", row, "limit server \u00b5s", limit.microseconds);
        }
    }
}

/** A user whom servers let in, and no module of the system's PAM. */
class User {
public:
    User() {
        const std::string users = _folder / "users";
        const std::string module = std::string(ORV_PAM_MATRIX) + " passdb=" + users;
        std::ofstream(users) << "root:bench:orvcim\n";
        std::ofstream(_folder / "orvcim") << "auth required " << module << "\naccount required " << module << '\n';
    }

    /** The options of a server to which only users who log in may send requests. */
    std::vector<std::string> options() const {
        return {"--authenticate", "--pam-folder=" + (_folder / "."), "--allow-root", "--allow-without-shell"};
    }

    /** The header with which the user logs in: root:bench. */
    static constexpr std::string_view header = "Authorization: Basic cm9vdDpiZW5jaA==\r\n";

private:
    Folder _folder;
};

/** A certificate of this machine. */
class Certificate {
public:
    Certificate() {
        runCommand({"openssl", "req", "-x509", "-newkey", "ec", "-pkeyopt", "ec_paramgen_curve:prime256v1", "-nodes",
                    "-days", "1", "-subj", "/CN=localhost", "-keyout", _key, "-out", _certificate});
    }

    /** The options of a server that uses TLS. */
    std::vector<std::string> options() const { return {"--tls-cert=" + _certificate, "--tls-key=" + _key}; }

private:
    Folder _folder;
    std::string _key = _folder / "key.pem";
    std::string _certificate = _folder / "certificate.pem";
};

/** Measures what log-ins and TLS cost, with three servers of one node. */
void measureProtection(double seconds, const std::regex& filter) {
    const Machine machine(1);
    const User user;
    const Certificate certificate;

    const ServerProcess plain(serve);
    const ServerProcess authenticating(serve + user.options());
    const ServerProcess encrypting(serve + certificate.options());
    for (const Request& request : requests()) {
        const std::string text = request.text();
        const std::string textWithLogIn = request.text(User::header);
        const Load loads[] = {
            {plain, text, checkedBody(plain, request, text, 1).size()},
            {authenticating, textWithLogIn, checkedBody(authenticating, request, textWithLogIn, 1).size()},
            {encrypting, text, checkedBody(encrypting, request, text, 1, Transport::tls).size(), Transport::tls},
        };
        constexpr const char* columns[] = {"plain requests/s", "with log-ins requests/s", "with TLS requests/s"};
        for (const unsigned int connections : {1U, 8U}) {
            const std::string row = rowOf(request.name, connections, 1);
            if (!std::regex_search(row, filter)) {
                continue;
            }
            // What they cost is less than the speed of a machine changes from second to second.
            constexpr unsigned int rounds = 9;
            std::vector<double> found[std::size(loads)];
            for (unsigned int round = 0; round < rounds; ++round) {
                for (std::size_t i = 0; i < std::size(loads); ++i) {
                    found[i].push_back(measure(loads[i], connections, seconds / rounds).requestsPerSecond);
                }
            }
            for (std::size_t i = 0; i < std::size(loads); ++i) {
                std::sort(found[i].begin(), found[i].end());
                print("protection", row, columns[i], median(found[i]));
            }
        }
    }
}

/** The median of the time that something takes, in milliseconds. */
template <typename Run>
double timeOf(Run run) {
    constexpr unsigned int runs = 21;
    std::vector<double> times;
    for (unsigned int i = 0; i < runs; ++i) {
        const auto begin = Clock::now();
        run();
        times.push_back(std::chrono::duration<double, std::milli>(Clock::now() - begin).count());
    }
    std::sort(times.begin(), times.end());
    return median(times);
}

void measureStart(const std::regex& filter) {
    const Machine machine(1);
    if (std::regex_search("orvcim power status/1", filter)) {
        print("start", "orvcim power status", "ms", timeOf([] { runCommand({ORV_PROGRAM, "power", "status"}); }));
    }
    if (std::regex_search("orvcim serve/1", filter)) {
        // The program's end is not measured.
        std::vector<std::unique_ptr<ServerProcess>> servers;
        print("start", "orvcim serve, until it listens", "ms",
              timeOf([&] { servers.push_back(std::make_unique<ServerProcess>(serve)); }));
    }
}

void measureAll(double seconds, const std::regex& filter) {
    measureStart(filter);
    for (const unsigned int nodes : {1U, 100U, 10'000U}) {
        const Machine machine(nodes);
        const ServerProcess server(serve);
        checkedBody(server, requests().front(), requests().front().text(), nodes);
        const std::string row = std::to_string(nodes);
        print("memory", row, "MB at rest", server.memory("status", "VmRSS:"));
        print("memory", row, "of that private", server.memory("smaps_rollup", "Private_Dirty:"));
        measureRequests(server, nodes, seconds, filter);
        std::this_thread::sleep_for(std::chrono::seconds{1});
        print("memory", row, "MB at the peak", server.memory("status", "VmHWM:"));
        print("memory", row, "MB afterwards", server.memory("status", "VmRSS:"));
    }
    measureProtection(seconds, filter);
}

/** Answers every request with the content of a file, until a signal ends the program. */
void serveConstant(const std::filesystem::path& file) {
    std::ifstream stream(file);
    const std::string body{std::istreambuf_iterator<char>(stream), {}};
    sigset_t end;
    sigemptyset(&end);
    sigaddset(&end, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &end, nullptr);
    const ObjectManager::Server::HttpServer server(
        {},
        [&](const auto& /*request*/, const auto& /*caller*/) {
            return ObjectManager::Server::HttpReply{200,
                                                    {{"Content-Type", "application/xml; charset=\"utf-8\""},
                                                     {"CIMOperation", "MethodResponse"},
                                                     {"WBEMServerResponseTime", "0"}},
                                                    body};
        },
        nullptr, [](const std::string& /*line*/) {});
    std::printf("Listening on http://127.0.0.1:%u\n", server.port());
    std::fflush(stdout);
    int signal = 0;
    sigwait(&end, &signal);
}

/** A server whose instructions are counted, and how its client asks. */
struct Counted {
    /** Stands before the names of the requests. */
    std::string label;
    unsigned int nodes = 1;
    std::vector<std::string> options{};
    /** More headers of each request. */
    std::string_view headers{};
    Transport transport = Transport::plain;
};

/**
 * Leaves a dump of callgrind's for each kind of request: instructions of so many requests as its name says.
 */
void countRequests(const std::filesystem::path& folder, const Counted& counted, const std::regex& filter) {
    constexpr unsigned int warmUp = 5;
    constexpr unsigned int requestsOfADump = 20;
    const Machine machine(counted.nodes);
    const std::string dumps = counted.label + '.' + std::to_string(counted.nodes);
    const ServerProcess server(
        std::vector<std::string>{"valgrind", "--tool=callgrind", "--callgrind-out-file=" + (folder / dumps).string()} +
        serve + counted.options);
    const auto tell = [process = "--pid=" + std::to_string(server.process())](std::vector<std::string> command) {
        command.insert(command.begin(), {"vgdb", process});
        runCommand(command);
    };
    Client client(server.port(), counted.transport);
    for (const Request& request : requests()) {
        const std::string name = counted.label + '/' + request.name + '/' + std::to_string(counted.nodes);
        if (!std::regex_search(name, filter)) {
            continue;
        }
        const std::string text = request.text(counted.headers);
        for (unsigned int i = 0; i < warmUp; ++i) {
            client.answerTo(text);
            request.check(client.body(), counted.nodes);
        }
        tell({"zero"});
        for (unsigned int i = 0; i < requestsOfADump; ++i) {
            client.answerTo(text);
        }
        tell({"dump", std::to_string(requestsOfADump) + '*' + name});
    }
}

void countInstructions(const std::filesystem::path& folder, const std::regex& filter) {
    for (const unsigned int nodes : {1U, 100U}) {
        countRequests(folder, {.label = "server", .nodes = nodes}, filter);
    }
    const User user;
    countRequests(folder, {.label = "log-ins", .options = user.options(), .headers = User::header}, filter);
    const Certificate certificate;
    countRequests(folder, {.label = "TLS", .options = certificate.options(), .transport = Transport::tls}, filter);
}

} // namespace

int main(int argc, char** argv) {
    try {
        const Options options = optionsOf({argv + 1, argv + argc});
        const std::regex filter(options.filter);
        if (!options.constant.empty()) {
            serveConstant(options.constant);
        } else if (!options.instructions.empty()) {
            countInstructions(options.instructions, filter);
        } else {
            measureAll(options.seconds, filter);
        }
    } catch (const std::exception& error) {
        std::fprintf(stderr, "server_bench: %s\n", error.what());
        return 1;
    }
}

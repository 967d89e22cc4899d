/**
 * The object manager as its clients on the network find it: requests per second and latency, over loopback and with
 * connections kept alive, and the memory of the server. Runs "orvcim serve" on simulated machines of several sizes;
 * the load comes from one thread of this program, which does not sleep while it waits for a quick answer.
 *
 * Takes of the options that the other benchmarks have --benchmark_min_time=SECONDS, for each measurement, and
 * --benchmark_filter=REGEX, of names as the table shows them.
 */
#include <fcntl.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <spawn.h>
#include <sys/epoll.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <regex>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <thread>
#include <vector>

namespace {

using Clock = std::chrono::steady_clock;
using Milliseconds = std::chrono::duration<double, std::milli>;

void require(bool done, const char* what) {
    if (!done) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

/** A server of its own, on a machine with so many nodes. */
class ServerProcess {
public:
    explicit ServerProcess(unsigned int nodes) {
        std::string name = (std::filesystem::temp_directory_path() / "orv-bench-XXXXXX").string();
        require(mkdtemp(name.data()) != nullptr, "mkdtemp");
        _folder = name;
        std::ofstream file(_folder / "agent.toml");
        file << "[system]\nname = \"bench.example\"\n[instrumentation.simulated]\nstate-file = \""
             << (_folder / "machine.json").string() << "\"\n";
        for (unsigned int i = 0; i < nodes; ++i) {
            file << "[[instrumentation.simulated.node]]\npath = \"node" << i << "\"\n";
        }
        file.close();
        setenv("ORV_AGENT_CONFIG", (_folder / "agent.toml").c_str(), 1);
        start();
    }
    ServerProcess(const ServerProcess&) = delete;
    ServerProcess& operator=(const ServerProcess&) = delete;
    ~ServerProcess() {
        kill(_process, SIGTERM);
        waitpid(_process, nullptr, 0);
        std::filesystem::remove_all(_folder);
    }

    std::uint16_t port() const { return _port; }

    /** Seconds of processor time so far. */
    double processorTime() const {
        clockid_t clock{};
        timespec time{};
        require(clock_getcpuclockid(_process, &clock) == 0 && clock_gettime(clock, &time) == 0, "processor time");
        constexpr double nanosecondsPerSecond = 1e9;
        return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) / nanosecondsPerSecond;
    }

    /** A line of the kernel's on the process, in megabytes. */
    double memory(std::string_view line) const {
        std::ifstream status("/proc/" + std::to_string(_process) + "/status");
        constexpr double kilobytesPerMegabyte = 1024;
        for (std::string text; std::getline(status, text);) {
            if (text.starts_with(line)) {
                return std::stod(text.substr(line.size() + 1)) / kilobytesPerMegabyte;
            }
        }
        throw std::runtime_error("no " + std::string(line) + " of the server");
    }

private:
    void start() {
        int ends[2];
        require(pipe2(ends, O_CLOEXEC) == 0, "pipe");
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
        posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
        std::string program = ORV_PROGRAM;
        std::string command = "serve";
        std::string port = "--port=0";
        std::array<char*, 4> arguments = {program.data(), command.data(), port.data(), nullptr};
        const int error = posix_spawn(&_process, program.c_str(), &actions, nullptr, arguments.data(), environ);
        posix_spawn_file_actions_destroy(&actions);
        close(ends[1]);
        if (error != 0) {
            throw std::system_error(error, std::generic_category(), program);
        }
        std::FILE* const output = fdopen(ends[0], "r");
        unsigned int number = 0;
        const bool listening = std::fscanf(output, "Listening on http://127.0.0.1:%u", &number) == 1;
        std::fclose(output);
        if (!listening) {
            throw std::runtime_error(program + " serve did not start");
        }
        _port = static_cast<std::uint16_t>(number);
    }

    std::filesystem::path _folder;
    pid_t _process = -1;
    std::uint16_t _port = 0;
};

/* Requests. */

std::string call(const std::string& method, const std::string& parameters) {
    const std::string body =
        "<?xml version=\"1.0\" encoding=\"utf-8\"?>"
        "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\"><SIMPLEREQ>"
        "<IMETHODCALL NAME=\"" +
        method + "\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/></LOCALNAMESPACEPATH>" +
        parameters + "</IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
    return "POST /cimom HTTP/1.1\r\nHost: localhost\r\nContent-Type: application/xml; charset=\"utf-8\"\r\n"
           "CIMOperation: MethodCall\r\nCIMMethod: " +
           method + "\r\nCIMObject: root/cimv2\r\nContent-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
}

std::string key(const std::string& name, const std::string& value) {
    return "<KEYBINDING NAME=\"" + name + "\"><KEYVALUE VALUETYPE=\"string\">" + value + "</KEYVALUE></KEYBINDING>";
}

std::string servicePath() {
    return "<INSTANCENAME CLASSNAME=\"TALVO_PowerManagementService\">" +
           key("CreationClassName", "TALVO_PowerManagementService") + key("Name", "PowerStateManagement_node0") +
           key("SystemCreationClassName", "TALVO_ComputerSystem") + key("SystemName", "bench.example") +
           "</INSTANCENAME>";
}

std::string getInstance() {
    return call("GetInstance", "<IPARAMVALUE NAME=\"InstanceName\">" + servicePath() + "</IPARAMVALUE>");
}

std::string enumerateInstances() {
    return call("EnumerateInstances",
                "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"TALVO_PowerManagementService\"/>"
                "</IPARAMVALUE>");
}

std::string associators() {
    return call("Associators", "<IPARAMVALUE NAME=\"ObjectName\">" + servicePath() + "</IPARAMVALUE>");
}

/* Load. */

struct Measurement {
    std::string name;
    double requestsPerSecond = 0;
    /** What a request costs the server in processor time. */
    double microseconds = 0;
    /** In milliseconds, sorted. */
    std::vector<double> latencies;
    std::vector<double> firstBytes;
};

/** A connection that sends the same request again and again. */
class Client {
public:
    explicit Client(std::uint16_t port) : _socket(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        require(_socket >= 0, "socket");
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(port);
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        require(connect(_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0, "connect");
        constexpr int yes = 1;
        setsockopt(_socket, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
    }
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;
    ~Client() { close(_socket); }

    int socketNumber() const { return _socket; }

    void ask(const std::string& request) {
        _received.clear();
        _size = 0;
        _begin = Clock::now();
        require(send(_socket, request.data(), request.size(), MSG_NOSIGNAL) == static_cast<ssize_t>(request.size()),
                "send");
    }

    /** Takes what came. @return whether the reply is whole. */
    bool take() {
        static std::array<char, 256 * 1024> buffer;
        const ssize_t size = recv(_socket, buffer.data(), buffer.size(), MSG_DONTWAIT);
        if (size < 0 && errno == EAGAIN) {
            return false;
        }
        require(size > 0, "recv");
        if (_received.empty()) {
            _firstByte = Clock::now();
        }
        _received.append(buffer.data(), static_cast<std::size_t>(size));
        if (_size == 0) {
            findSize();
        }
        _end = Clock::now();
        return _size != 0 && _received.size() >= _size;
    }

    const std::string& reply() const { return _received; }
    /** Without the headers, of which one tells how long the server took. */
    std::size_t bodySize() const { return _bodySize; }
    double latency() const { return Milliseconds(_end - _begin).count(); }
    double firstByte() const { return Milliseconds(_firstByte - _begin).count(); }

private:
    void findSize() {
        constexpr std::string_view end = "\r\n\r\n";
        constexpr std::string_view length = "Content-Length: ";
        const std::size_t headers = _received.find(end);
        if (headers != std::string::npos) {
            _bodySize = std::stoul(_received.substr(_received.find(length) + length.size()));
            _size = headers + end.size() + _bodySize;
        }
    }

    int _socket;
    std::string _received;
    /** Of the reply; 0 while it is not known. */
    std::size_t _size = 0;
    std::size_t _bodySize = 0;
    Clock::time_point _begin;
    Clock::time_point _firstByte;
    Clock::time_point _end;
};

/** How many bytes the body of every reply must have, as one has that was looked at. */
std::size_t expectedSize(std::uint16_t port, const std::string& request, std::size_t objects) {
    Client client(port);
    client.ask(request);
    while (!client.take()) {
        std::this_thread::yield();
    }
    std::size_t found = 0;
    constexpr std::string_view instance = "<INSTANCE ";
    for (std::size_t at = 0; (at = client.reply().find(instance, at)) != std::string::npos; ++at) {
        ++found;
    }
    if (found != objects) {
        throw std::runtime_error("expected " + std::to_string(objects) + " instances: " + client.reply());
    }
    return client.bodySize();
}

/**
 * Waits without sleeping as long as a quick answer may take: how long the core of a virtual machine takes to wake up
 * for this program is not the server's. The server goes first on it, though. After that this program sleeps.
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

Measurement measure(std::string name, const ServerProcess& server, const std::string& request, std::size_t objects,
                    unsigned int connections, double seconds) {
    const std::size_t size = expectedSize(server.port(), request, objects);
    const int poll = epoll_create1(EPOLL_CLOEXEC);
    require(poll >= 0, "epoll_create1");
    std::vector<std::unique_ptr<Client>> clients;
    for (unsigned int i = 0; i < connections; ++i) {
        clients.push_back(std::make_unique<Client>(server.port()));
        epoll_event event{};
        event.events = EPOLLIN;
        event.data.ptr = clients.back().get();
        require(epoll_ctl(poll, EPOLL_CTL_ADD, clients.back()->socketNumber(), &event) == 0, "epoll_ctl");
    }
    Measurement result{std::move(name), 0, 0, {}, {}};
    const double processorTime = server.processorTime();
    const auto begin = Clock::now();
    const auto end = begin + std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(seconds));
    for (const auto& client : clients) {
        client->ask(request);
    }
    std::array<epoll_event, 64> events{};
    for (std::size_t asked = connections; asked > 0;) {
        const int ready = waitForEvents(poll, events);
        for (int i = 0; i < ready; ++i) {
            Client& client = *static_cast<Client*>(events[static_cast<std::size_t>(i)].data.ptr);
            if (!client.take()) {
                continue;
            }
            if (client.bodySize() != size || !client.reply().starts_with("HTTP/1.1 200 ")) {
                throw std::runtime_error("wrong reply: " + client.reply());
            }
            result.latencies.push_back(client.latency());
            result.firstBytes.push_back(client.firstByte());
            if (Clock::now() < end) {
                client.ask(request);
            } else {
                --asked;
            }
        }
    }
    result.requestsPerSecond =
        static_cast<double>(result.latencies.size()) / std::chrono::duration<double>(Clock::now() - begin).count();
    constexpr double microsecondsPerSecond = 1e6;
    result.microseconds =
        (server.processorTime() - processorTime) * microsecondsPerSecond / static_cast<double>(result.latencies.size());
    close(poll);
    std::sort(result.latencies.begin(), result.latencies.end());
    std::sort(result.firstBytes.begin(), result.firstBytes.end());
    return result;
}

double percentile(const std::vector<double>& sorted, double part) {
    return sorted[static_cast<std::size_t>(part * static_cast<double>(sorted.size() - 1))];
}

void print(const Measurement& result) {
    std::printf("| %s | %.0f | %.3f | %.3f | %.3f | %.3f | %.3f | %.0f |\n", result.name.c_str(),
                result.requestsPerSecond, percentile(result.latencies, 0.5), percentile(result.latencies, 0.9),
                percentile(result.latencies, 0.99), result.latencies.back(), percentile(result.firstBytes, 0.5),
                result.microseconds);
    std::fflush(stdout);
}

struct Options {
    double seconds = 2;
    std::string filter;
};

Options optionsOf(const std::vector<std::string_view>& arguments) {
    constexpr std::string_view time = "--benchmark_min_time=";
    constexpr std::string_view filter = "--benchmark_filter=";
    Options options;
    for (const std::string_view argument : arguments) {
        if (argument.starts_with(time)) {
            options.seconds = std::stod(std::string(argument.substr(time.size())));
        } else if (argument.starts_with(filter)) {
            options.filter = argument.substr(filter.size());
        } else {
            throw std::runtime_error("found " + std::string(argument) + ", expected " + std::string(time) +
                                     "SECONDS or " + std::string(filter) + "REGEX");
        }
    }
    return options;
}

void run(double seconds, const std::regex& filter) {
    struct Operation {
        const char* name;
        std::string request;
        /** Of each node, and besides. */
        std::size_t objectsPerNode;
        std::size_t objects;
        unsigned int mostNodes;
    };
    const Operation operations[] = {
        {"GetInstance", getInstance(), 0, 1, 10'000},
        {"EnumerateInstances", enumerateInstances(), 1, 0, 10'000},
        {"Associators", associators(), 1, 2, 100},
    };
    std::printf(
        "| operation/connections/nodes | requests/s | median ms | 90 %% | 99 %% | longest | first byte | server "
        "\u00b5s |\n|---|---|---|---|---|---|---|---|\n");
    std::string memory;
    for (const unsigned int nodes : {1U, 100U, 10'000U}) {
        const ServerProcess server(nodes);
        expectedSize(server.port(), getInstance(), 1);
        const double atRest = server.memory("VmRSS:");
        for (const Operation& operation : operations) {
            for (const unsigned int connections : {1U, 8U, 64U}) {
                const std::string name =
                    std::string(operation.name) + '/' + std::to_string(connections) + '/' + std::to_string(nodes);
                if (nodes <= operation.mostNodes && std::regex_search(name, filter)) {
                    print(measure(name, server, operation.request, operation.objectsPerNode * nodes + operation.objects,
                                  connections, seconds));
                }
            }
        }
        std::this_thread::sleep_for(std::chrono::seconds{1});
        std::array<char, 100> line{};
        std::snprintf(line.data(), line.size(), "| %u | %.1f | %.1f | %.1f |\n", nodes, atRest, server.memory("VmHWM:"),
                      server.memory("VmRSS:"));
        memory += line.data();
    }
    std::printf("\n| nodes | MB at rest | MB at the peak | MB afterwards |\n|---|---|---|---|\n%s", memory.c_str());
}

} // namespace

int main(int argc, char** argv) {
    try {
        const Options options = optionsOf({argv + 1, argv + argc});
        run(options.seconds, std::regex(options.filter));
    } catch (const std::exception& error) {
        std::fprintf(stderr, "server_bench: %s\n", error.what());
        return 1;
    }
}

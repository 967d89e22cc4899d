#include "cimxml/Operations.h"
#include "cimxml/Service.h"
#include "orvcim/Commands.h"
#include "orvcim/ServiceManager.h"
#include "server/HttpServer.h"
#include "server/ListenSocket.h"
#include "server/PamAuthenticator.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <pthread.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <optional>

namespace ObjectManager::Orvcim {

namespace {

constexpr std::uint16_t httpPort = 5988;
constexpr std::uint16_t httpsPort = 5989;

/** Files that are open beside the connections, at most. */
constexpr rlim_t otherFiles = 200;

Server::Settings settingsOf(const ServeOptions& options) {
    Server::Settings settings = options.server;
    if (options.certificate.empty() != options.key.empty()) {
        throw UsageError("found one of --tls-cert and --tls-key, expected both or none");
    }
    if (!options.certificate.empty()) {
        settings.tls = Server::Tls{options.certificate, options.key};
    }
    settings.port = options.port.value_or(settings.tls ? httpsPort : httpPort);
    if (!options.authenticate) {
        // The machine is a simulated one then, which never waits for anybody else.
        settings.promptMethods = CimXml::readingMethods();
    }
    return settings;
}

/** Nobody is to reach the server who should not, by oversight. */
void requireProtection(Session& session, const Server::Settings& settings) {
    const bool authenticated = session.options().serve.authenticate;
    if (!Server::Address(settings.address).isLoopback() && !(settings.tls && authenticated)) {
        throw UsageError(fmt::format("other machines can reach {}: expected --tls-cert, --tls-key and --authenticate, "
                                     "or a loopback address",
                                     settings.address));
    }
    if (!authenticated && !session.isSimulated()) {
        const std::vector<std::string> reasons = session.log().failuresSince(0);
        throw Failure(fmt::format("the machine is not known to be a simulated one{}{}: expected --authenticate, so "
                                  "that not everybody on it can switch it off",
                                  reasons.empty() ? "" : "; the agent logged: ", fmt::join(reasons, "; ")));
    }
}

/** The system's default is made for programs that cannot have many files. */
void allowFiles(unsigned int connections) {
    rlimit limit{};
    getrlimit(RLIMIT_NOFILE, &limit);
    limit.rlim_cur = limit.rlim_max;
    setrlimit(RLIMIT_NOFILE, &limit);
    if (limit.rlim_cur < connections + otherFiles) {
        throw UsageError(fmt::format("found a limit of {} open files, expected {} for {} connections: raise it, or "
                                     "lower --max-connections",
                                     limit.rlim_cur, connections + otherFiles, connections));
    }
}

Server::Log logOf(const ServeOptions& options) {
    if (options.syslog) {
        openlog("orvcim", LOG_PID, LOG_DAEMON);
        return [](const std::string& line) { ::syslog(LOG_WARNING, "%s", line.c_str()); };
    }
    return [](const std::string& line) {
        // In one piece, since several threads log.
        const std::string text = "orvcim: " + line + '\n';
        [[maybe_unused]] const ssize_t written = write(STDERR_FILENO, text.data(), text.size());
    };
}

timespec timespecOf(std::chrono::microseconds time) {
    const auto seconds = std::chrono::floor<std::chrono::seconds>(time);
    return {static_cast<time_t>(seconds.count()), static_cast<long>(std::chrono::nanoseconds(time - seconds).count())};
}

/** Whether the server takes a connection and, since that asks for nothing, closes it again. */
bool isServing(const Server::Address& address, std::chrono::microseconds time) {
    const int client = socket(address.get()->sa_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (client < 0) {
        // Too many open files, for example: that says nothing against the server.
        return true;
    }
    const timespec limit = timespecOf(time);
    const timeval timeout{limit.tv_sec, limit.tv_nsec / 1000};
    setsockopt(client, SOL_SOCKET, SO_SNDTIMEO, &timeout, sizeof timeout);
    setsockopt(client, SOL_SOCKET, SO_RCVTIMEO, &timeout, sizeof timeout);
    bool closed = false;
    if (connect(client, address.get(), address.size()) == 0 && shutdown(client, SHUT_WR) == 0) {
        char answer = 0;
        closed = recv(client, &answer, sizeof answer, 0) >= 0 || errno == ECONNRESET;
    }
    close(client);
    return closed;
}

/** The signals that end the program. Only one thread takes them. */
class EndSignals {
public:
    /** Before any other thread is made, since the others inherit what is blocked here. */
    EndSignals() {
        sigemptyset(&_signals);
        sigaddset(&_signals, SIGINT);
        sigaddset(&_signals, SIGTERM);
        pthread_sigmask(SIG_BLOCK, &_signals, nullptr);
        // A client that goes away is noticed otherwise.
        std::signal(SIGPIPE, SIG_IGN);
    }

    /**
     * Waits for one.
     *
     * @param time without it, there is no end to that.
     * @return true when one has come, after which the next one ends the program at once.
     */
    bool waitFor(std::optional<std::chrono::microseconds> time) const {
        const timespec limit = timespecOf(time.value_or(std::chrono::microseconds{0}));
        const int signal = time ? sigtimedwait(&_signals, nullptr, &limit) : sigwaitinfo(&_signals, nullptr);
        if (signal < 0) {
            return false;
        }
        pthread_sigmask(SIG_UNBLOCK, &_signals, nullptr);
        return true;
    }

private:
    sigset_t _signals{};
};

} // namespace

void serve(Session& session) {
    const ServeOptions& options = session.options().serve;
    const Server::Settings settings = settingsOf(options);
    requireProtection(session, settings);
    allowFiles(settings.limits.connections);
    const Server::Log log = logOf(options);

    std::optional<Server::PamAuthenticator> authenticator;
    if (options.authenticate) {
        authenticator.emplace(options.pam);
        for (const std::string& group : {options.pam.readGroup, options.pam.powerGroup}) {
            if (!group.empty() && !Server::groupExists(group)) {
                log(fmt::format("there is no group {}, so nobody is in it", group));
            }
        }
    }

    const ServiceManager manager;
    const EndSignals signals;
    CimXml::Service service(session.dispatcher(), session.catalogue(), {.enumerations = options.enumerations});
    const auto answer = [&](const Server::HttpRequest& request, const Server::Caller& caller) {
        Server::HttpReply reply = service.answer(request, caller);
        // What the agent logged meanwhile was of interest to this request only.
        session.log().forget();
        return reply;
    };
    const Server::HttpServer server(settings, answer, authenticator ? &*authenticator : nullptr, log);
    const std::string listening = fmt::format("Listening on {}://{}\n", settings.tls ? "https" : "http",
                                              Server::hostAndPort(settings.address, server.port()));
    session.out() << listening << std::flush;
    manager.tell("READY=1\nSTATUS=" + listening);

    const Server::Address self(settings.address, server.port());
    const auto interval = manager.watchdogInterval();
    while (!signals.waitFor(interval)) {
        if (interval && isServing(self, *interval / 2)) {
            manager.tell("WATCHDOG=1");
        }
    }
    manager.tell("STOPPING=1");
}

} // namespace ObjectManager::Orvcim

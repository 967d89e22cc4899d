#include "audit/CallRecord.h"
#include "cimxml/Service.h"
#include "orvcim/AgentExamination.h"
#include "orvcim/Commands.h"
#include "orvcim/ServeLog.h"
#include "orvcim/ServiceManager.h"
#include "server/HttpServer.h"
#include "server/ListenSocket.h"
#include "server/PamAuthenticator.h"
#include "text/StatusText.h"

#include <fmt/format.h>

#include <pthread.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager::Orvcim {

namespace {

constexpr std::uint16_t httpPort = 5988;
constexpr std::uint16_t httpsPort = 5989;

/** The largest number of file descriptors that are in use beside those of the connections. */
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
    return settings;
}

/** What is wrong with the agent's configuration, and which command says more, in one line; empty if nothing is. */
std::string configurationProblem() {
    const std::string problem = problemOfConfiguration();
    return problem.empty() ? problem : problem + " ('orvcim check' says more)";
}

/**
 * Refuses settings that would let others in unprotected: another address than loopback needs TLS and log-ins, and a
 * machine that is not simulated needs log-ins.
 */
void requireProtection(Session& session, const Server::Settings& settings) {
    const bool authenticated = session.options().serve.authenticate;
    if (!Server::Address(settings.address).isLoopback() && !(settings.tls && authenticated)) {
        throw UsageError(fmt::format("other machines can reach {}: expected --tls-cert, --tls-key and --authenticate, "
                                     "or a loopback address",
                                     settings.address));
    }
    if (authenticated) {
        return;
    }
    // Providers would say the same in many words each.
    if (const std::string problem = configurationProblem(); !problem.empty()) {
        throw Failure("the machine is not known: " + problem);
    }
    const std::string problem = session.loadAgent();
    if (!session.log().isSimulated()) {
        const std::string logged = reasonsText(session.log().failuresSince(0), "; the agent logged: ");
        throw Failure(fmt::format("the machine is not known to be a simulated one{}: expected --authenticate, so that "
                                  "not everybody on it can switch it off",
                                  logged.empty() && !problem.empty() ? "; " + problem : logged));
    }
}

/**
 * Raises the soft limit on file descriptors to the hard limit: the default of most systems is too low for many
 * connections.
 */
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

/** Logs which configured groups do not exist, and what follows from that. */
void reportMissingGroups(const Server::PamSettings& pam, const Server::Log& log) {
    const auto report = [&](const std::string& group, const std::string& what) {
        if (!group.empty() && !Server::groupExists(group)) {
            log(fmt::format("group {} does not exist: {}", group, what));
        }
    };
    report(pam.readGroup, "only those who may change the power state may read");
    report(pam.powerGroup, pam.allowRoot ? "only root may change the power state"
                                         : "only root may change the power state, and root may not log in (see "
                                           "--allow-root)");
}

timespec timespecOf(std::chrono::microseconds time) {
    const auto seconds = std::chrono::floor<std::chrono::seconds>(time);
    return {static_cast<time_t>(seconds.count()), static_cast<long>(std::chrono::nanoseconds(time - seconds).count())};
}

/** Whether the server accepts a connection and closes it when the client ends it without a request. */
bool isServing(const Server::Address& address, std::chrono::microseconds time) {
    const int client = socket(address.get()->sa_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (client < 0) {
        // The socket failed here, for example for lack of file descriptors: that does not mean that the server is
        // stuck.
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

/** The signals that control the program. They are blocked in all threads; one thread waits for them. */
class Signals {
public:
    /** Must be constructed before any other thread starts, since threads inherit the signals that are blocked. */
    Signals() {
        sigemptyset(&_signals);
        for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGUSR1}) {
            sigaddset(&_signals, signal);
        }
        pthread_sigmask(SIG_BLOCK, &_signals, nullptr);
        // A write to a connection that the client has closed fails with EPIPE instead.
        std::signal(SIGPIPE, SIG_IGN);
    }

    /**
     * Waits for a signal.
     *
     * @param time how long to wait; without a value, for ever.
     * @return the signal; no value when the time is over.
     */
    std::optional<int> waitFor(std::optional<std::chrono::microseconds> time) const {
        const timespec limit = timespecOf(time.value_or(std::chrono::microseconds{0}));
        const int signal = time ? sigtimedwait(&_signals, nullptr, &limit) : sigwaitinfo(&_signals, nullptr);
        return signal < 0 ? std::nullopt : std::optional(signal);
    }

    /** Unblocks the signals: from now on each of them ends the program at once. */
    void release() const { pthread_sigmask(SIG_UNBLOCK, &_signals, nullptr); }

private:
    sigset_t _signals{};
};

/** The program's resident memory, for people. */
std::string memoryText() {
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);) {
        constexpr std::string_view resident = "VmRSS:";
        if (line.starts_with(resident)) {
            return line.substr(line.find_first_not_of(" \t", resident.size()));
        }
    }
    return "unknown";
}

} // namespace

void serve(Session& session) {
    const ServeOptions& options = session.options().serve;
    const Server::Settings settings = settingsOf(options);
    requireProtection(session, settings);
    allowFiles(settings.limits.connections);
    const Signals signals;
    ServeLog serveLog(options.syslog);
    const Server::Log log = [&serveLog](const std::string& line) { serveLog.write(line); };

    if (const std::string problem = configurationProblem(); !problem.empty()) {
        log("no power-management node is offered: " + problem);
    }

    std::optional<Server::PamAuthenticator> authenticator;
    if (options.authenticate) {
        authenticator.emplace(options.pam);
        reportMissingGroups(options.pam, log);
    }

    session.dispatcher().broker().setLimits(options.request);
    const ServiceManager manager;
    CimXml::Service service(
        session.dispatcher(), session.catalogue(),
        {.enumerations = options.enumerations,
         .recorder = Audit::makeRecorder([&serveLog](const std::string& line) { serveLog.keep(line); })});
    const auto answer = [&](const Server::HttpRequest& request, const Server::Caller& caller) {
        Server::HttpReply reply = service.answer(request, caller);
        // The records of the agent's log concern this request only.
        session.log().forget();
        return reply;
    };
    Server::HttpServer server(settings, answer, authenticator ? &*authenticator : nullptr, log);
    const std::string url =
        fmt::format("{}://{}", settings.tls ? "https" : "http", Server::hostAndPort(settings.address, server.port()));
    session.ownProviders().answerOn({url, options.authenticate});
    const std::string listening = fmt::format("Listening on {}\n", url);
    session.out() << listening << std::flush;
    manager.tell("READY=1\nSTATUS=" + listening);

    const Server::Address self(settings.address, server.port());
    const auto interval = manager.watchdogInterval();
    for (std::optional<int> signal; signal != SIGINT && signal != SIGTERM;) {
        signal = signals.waitFor(interval);
        if (signal == SIGHUP) {
            server.renewKeys();
        } else if (signal == SIGUSR1) {
            log(fmt::format("{}, {} of memory", server.health(), memoryText()));
        } else if (!signal && interval && isServing(self, *interval / 2)) {
            manager.tell("WATCHDOG=1");
        }
    }
    signals.release();
    manager.tell("STOPPING=1");
    if (!server.stop()) {
        // The server's threads still use objects that a regular end would destroy.
        log("ended although a provider or PAM did not return");
        serveLog.flush(std::chrono::seconds{1});
        _exit(EXIT_SUCCESS);
    }
}

} // namespace ObjectManager::Orvcim

#include "server/HttpServer.h"

#include "server/Exchange.h"
#include "server/ListenSocket.h"

#include <fmt/format.h>

#include <netinet/tcp.h>
#include <poll.h>
#include <pthread.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <condition_variable>
#include <csignal>
#include <list>
#include <mutex>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace ObjectManager::Server {

namespace {

/** The stack of each thread, on which providers and PAM modules run. Only the part that they use takes memory. */
constexpr std::size_t stackSize = std::size_t{1024} * 1024;

/** How often ended threads are joined, and the numbers of lines left out of the log are logged. */
constexpr int lookInterval = 250;

/** The pause after an error in accepting a connection, such as too many open files. */
constexpr std::chrono::milliseconds errorPause{50};

/** How long, beyond stopTime, stop() waits for the threads of connections that were shut down. */
constexpr std::chrono::seconds endTime{1};

constexpr std::string_view busy = "HTTP/1.1 503 Service Unavailable\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";

std::string textOf(int error) {
    return std::generic_category().message(error);
}

/** A file descriptor, closed when the object is destroyed. */
class Descriptor {
public:
    explicit Descriptor(int descriptor) : _descriptor(descriptor) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() { reset(); }

    int get() const { return _descriptor; }
    void reset() {
        if (_descriptor >= 0) {
            close(std::exchange(_descriptor, -1));
        }
    }

private:
    int _descriptor;
};

} // namespace

class HttpServer::Implementation {
public:
    Implementation(const Settings& settings, Handler handler, Authenticator* authenticator, Log log);
    Implementation(const Implementation&) = delete;
    Implementation& operator=(const Implementation&) = delete;
    ~Implementation();

    std::uint16_t port() const { return _port; }
    bool stop();
    void renewKeys();
    std::string health();

private:
    /** A connection and the thread that serves it. */
    struct Served {
        Implementation& server;
        Connections::Connection& connection;
        pthread_t thread{};
        std::list<Served>::iterator self{};
    };

    /** @param data a Served. */
    static void* serve(void* data);

    void acceptAll();
    void acceptOne();
    /** @throws std::bad_alloc */
    void begin(int socket, const sockaddr& address);
    void joinEnded();

    Shared _shared;
    const Log _log;
    Descriptor _stop;
    Descriptor _listener;
    std::uint16_t _port;
    std::thread _acceptor;

    std::mutex _mutex;
    std::condition_variable _changed;
    std::list<Served> _running;
    std::list<Served> _ended;
};

HttpServer::Implementation::Implementation(const Settings& settings, Handler handler, Authenticator* authenticator,
                                           Log log)
    : _shared(settings, std::move(handler), authenticator, log), _log(std::move(log)),
      _stop(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)), _listener(listenOn(settings.address, settings.port)),
      _port(portOf(_listener.get())) {
    _shared.stop = _stop.get();
    if (settings.tls) {
        _shared.setKeys(std::make_shared<const TlsKeys>(*settings.tls, _log));
    }
    _acceptor = std::thread([this] { acceptAll(); });
}

HttpServer::Implementation::~Implementation() {
    stop();
    std::unique_lock lock(_mutex);
    _changed.wait(lock, [this] { return _running.empty(); });
    lock.unlock();
    joinEnded();
}

bool HttpServer::Implementation::stop() {
    if (_acceptor.joinable()) {
        _shared.stopping = true;
        eventfd_write(_stop.get(), 1);
        _acceptor.join();
        _listener.reset();
        _shared.handshakes.close();
        _shared.answers.close();
        _shared.answerMemory.close();
        if (_shared.logIns) {
            _shared.logIns->close();
        }
        _shared.connections.endIdle();
        if (!_shared.connections.waitForAnswers(_shared.settings.stopTime)) {
            _shared.events.report("stopped before all answers were sent");
        }
        _shared.connections.endAll();
    }
    std::unique_lock lock(_mutex);
    return _changed.wait_for(lock, endTime, [this] { return _running.empty(); });
}

void HttpServer::Implementation::renewKeys() {
    if (!_shared.settings.tls) {
        return;
    }
    try {
        _shared.setKeys(std::make_shared<const TlsKeys>(*_shared.settings.tls, _log));
        _log("read the certificate and its key again");
    } catch (const ServerError& error) {
        _log(fmt::format("the certificate and its key stay as they were: {}", error.what()));
    }
}

std::string HttpServer::Implementation::health() {
    const Connections::Counts counts = _shared.connections.counts();
    const auto of = [&](Connections::State state) { return counts.of[static_cast<std::size_t>(state)]; };
    const LogIns::Counts logIns = _shared.logIns ? _shared.logIns->counts() : LogIns::Counts{};
    return fmt::format("{} connections idle, {} sending requests, {} logging in, {} answered, {} taking answers; since "
                       "the start {} requests, {} connections refused, {} log-ins good, {} wrong",
                       of(Connections::State::idle), of(Connections::State::receiving),
                       of(Connections::State::loggingIn), of(Connections::State::answering),
                       of(Connections::State::sending), _shared.requests.load(), counts.refused, logIns.good,
                       logIns.wrong);
}

void HttpServer::Implementation::acceptAll() {
    std::array<pollfd, 2> sources = {{{_listener.get(), POLLIN, 0}, {_stop.get(), POLLIN, 0}}};
    while (!_shared.stopping) {
        const int ready = poll(sources.data(), sources.size(), lookInterval);
        joinEnded();
        if (ready == 0) {
            _shared.events.settle();
        } else if (ready > 0 && (sources[0].revents & POLLIN) != 0) {
            acceptOne();
        }
    }
}

void HttpServer::Implementation::acceptOne() {
    sockaddr_storage storage{};
    auto& address = reinterpret_cast<sockaddr&>(storage);
    socklen_t size = sizeof storage;
    const int socket = accept4(_listener.get(), &address, &size, SOCK_CLOEXEC | SOCK_NONBLOCK);
    if (socket < 0) {
        if (const int error = errno; error != EAGAIN && error != EINTR && error != ECONNABORTED) {
            _shared.events.report("", fmt::format("cannot accept a connection: {}", textOf(error)));
            std::this_thread::sleep_for(errorPause);
        }
        return;
    }
    // A connection that its client has reset before it is accepted costs no thread: very many of them hold up nobody.
    pollfd client{socket, 0, 0};
    if (poll(&client, 1, 0) > 0) {
        close(socket);
        return;
    }
    try {
        begin(socket, address);
    } catch (const std::bad_alloc&) {
        close(socket);
    }
}

void HttpServer::Implementation::begin(int socket, const sockaddr& address) {
    constexpr int yes = 1;
    setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
    Connections::Connection* const connection =
        _shared.connections.opened(socket, Server::textOf(address), networkOf(address));
    int error = 0;
    if (connection != nullptr) {
        const std::lock_guard lock(_mutex);
        Served& served = _running.emplace_back(Served{*this, *connection});
        served.self = std::prev(_running.end());
        pthread_attr_t attributes{};
        pthread_attr_init(&attributes);
        pthread_attr_setstacksize(&attributes, stackSize);
        error = pthread_create(&served.thread, &attributes, &serve, &served);
        pthread_attr_destroy(&attributes);
        if (error == 0) {
            return;
        }
        _running.pop_back();
    }
    if (!_shared.settings.tls) {
        send(socket, busy.data(), busy.size(), MSG_DONTWAIT | MSG_NOSIGNAL);
    }
    if (connection != nullptr) {
        _shared.events.report("", fmt::format("cannot make a thread for a connection: {}", textOf(error)));
        _shared.connections.closed(*connection);
    }
    close(socket);
}

void* HttpServer::Implementation::serve(void* data) {
    Served& served = *static_cast<Served*>(data);
    Implementation& server = served.server;
    const int socket = served.connection.socket;
    Exchange(server._shared, served.connection).run();
    server._shared.connections.closed(served.connection);
    close(socket);
    const std::lock_guard lock(server._mutex);
    server._ended.splice(server._ended.end(), server._running, served.self);
    server._changed.notify_all();
    return nullptr;
}

void HttpServer::Implementation::joinEnded() {
    std::list<Served> ended;
    {
        const std::lock_guard lock(_mutex);
        ended.swap(_ended);
    }
    for (const Served& served : ended) {
        pthread_join(served.thread, nullptr);
    }
}

HttpServer::HttpServer(const Settings& settings, Handler handler, Authenticator* authenticator, Log log) try
    : _implementation(std::make_unique<Implementation>(settings, std::move(handler), authenticator, std::move(log))) {
} catch (const std::system_error& error) {
    throw ServerError(fmt::format("cannot make the threads of the server: {}", error.code().message()));
}

HttpServer::~HttpServer() = default;

std::uint16_t HttpServer::port() const {
    return _implementation->port();
}

bool HttpServer::stop() {
    return _implementation->stop();
}

void HttpServer::renewKeys() {
    _implementation->renewKeys();
}

std::string HttpServer::health() const {
    return _implementation->health();
}

} // namespace ObjectManager::Server

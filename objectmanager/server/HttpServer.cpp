#include "server/HttpServer.h"

#include "server/ListenSocket.h"
#include "server/PromptMethods.h"
#include "server/Workers.h"

#include <fmt/format.h>
#include <microhttpd.h>

#include <linux/tcp.h>
#include <malloc.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>
#include <charconv>
#include <condition_variable>
#include <cstdarg>
#include <cstdio>
#include <ctime>
#include <fstream>
#include <iterator>
#include <list>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>
#include <thread>
#include <utility>

namespace ObjectManager::Server {

namespace {

using Clock = Connections::Clock;
using State = Connections::State;
/** Log-ins that are checked at a time, and those that may wait for it. */
constexpr unsigned int logInThreads = 4;
constexpr std::size_t waitingLogIns = 64;

/** How far beyond the limit connections are accepted, so that their clients can be told. */
constexpr unsigned int surplusConnections = 64;

/** How many times the limit of a body is read, and thrown away, so that its client is there for the refusal. */
constexpr std::size_t readBeyondLimit = 4;

/** How often it is looked for what is overdue. */
constexpr std::chrono::milliseconds watchInterval{250};

/** What was taken for an answer of this size is given back to the system, which would not be so by itself. */
constexpr std::size_t largeAnswer = std::size_t{1024} * 1024;

/** Threads that wait for clients. */
constexpr unsigned int clientThreads = 2;

constexpr const char* tlsPriorities = "NORMAL:-VERS-ALL:+VERS-TLS1.3:+VERS-TLS1.2";

/** The text without what would break or forge lines of a log. */
std::string printable(std::string_view text) {
    std::string result;
    for (const char character : text) {
        const auto code = static_cast<unsigned char>(character);
        if (code < ' ' || code == '\x7f') {
            result += fmt::format("\\x{:02x}", code);
        } else {
            result += character;
        }
    }
    return result;
}

/** How the library's messages begin that say of a client what the server says itself, or need not. */
constexpr std::array<std::string_view, 8> repetitions = {
    "Connection socket is closed",
    "Connection was closed",
    "Error: received handshake",
    "Failed to parse `Content-Length'",
    "Failed to send",
    "Not enough memory in pool to allocate header",
    "Socket has been disconnected",
    "Too large value of 'Content-Length'",
};
/** How the one begins that tells the status with which the library has refused a request by itself. */
constexpr std::string_view refusalMessage = "Error processing request (HTTP response code is ";

bool isRepetition(std::string_view message) {
    return std::any_of(repetitions.begin(), repetitions.end(),
                       [message](std::string_view beginning) { return message.starts_with(beginning); });
}

std::string readPem(const std::filesystem::path& file) {
    std::ifstream stream(file, std::ios::binary);
    if (!stream) {
        throw ServerError(fmt::format("{}: {}", file.string(), std::generic_category().message(errno)));
    }
    std::string content{std::istreambuf_iterator<char>(stream), {}};
    if (content.empty()) {
        throw ServerError(fmt::format("{}: found nothing in it, expected PEM", file.string()));
    }
    return content;
}

std::string formatMessage(const char* format, va_list arguments) {
    constexpr std::size_t longest = 1000;
    std::array<char, longest> text{};
    std::vsnprintf(text.data(), text.size(), format, arguments);
    std::string line = text.data();
    while (line.ends_with('\n')) {
        line.pop_back();
    }
    // Some end in the page that the client gets.
    return printable(line.substr(0, line.find(" ('<html")));
}

/** Empty where there is none. */
std::string_view headerOf(MHD_Connection* http, const char* name) {
    const char* const value = MHD_lookup_connection_value(http, MHD_HEADER_KIND, name);
    return value == nullptr ? std::string_view() : value;
}

/** The size that a body was announced to have, which memory may be too small for; 0 where it was not. */
std::uint64_t announcedSize(MHD_Connection* http) {
    const std::string_view text = headerOf(http, MHD_HTTP_HEADER_CONTENT_LENGTH);
    std::uint64_t size = 0;
    std::from_chars(text.data(), text.data() + text.size(), size);
    return size;
}

/** The refusal of a request. */
HttpReply refusal(unsigned int status, const std::string& problem) {
    return {status, {{MHD_HTTP_HEADER_CONTENT_TYPE, "text/plain; charset=utf-8"}}, problem + "\n", problem};
}

HttpReply unauthorized(const std::string& text) {
    HttpReply reply = refusal(MHD_HTTP_UNAUTHORIZED, text);
    // What is wrong with a log-in has been logged, and a client's first request without one is usual.
    reply.problem.clear();
    reply.headers.emplace_back(MHD_HTTP_HEADER_WWW_AUTHENTICATE, R"(Basic realm="orvcim", charset="UTF-8")");
    return reply;
}

/** Of the calling thread so far. */
std::chrono::nanoseconds processorTime() {
    timespec time{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
    return std::chrono::seconds(time.tv_sec) + std::chrono::nanoseconds(time.tv_nsec);
}

/** Whether anything came from the client. The end of the connection counts as one byte. */
bool hasReceived(int socket) {
    tcp_info info{};
    socklen_t size = sizeof info;
    return getsockopt(socket, IPPROTO_TCP, TCP_INFO, &info, &size) == 0 && info.tcpi_bytes_received > 1;
}

/**
 * The refusal of a request that tells the end of its body in a way that others may read differently (RFC 9112, section
 * 6.3); nothing where it does not.
 */
std::optional<HttpReply> framingRefusal(MHD_Connection* http) {
    struct Framing {
        std::string_view length;
        std::string_view coding;
        bool contradictory = false;
    };
    Framing framing;
    const auto take = [](void* data, MHD_ValueKind, const char* name, const char* value) {
        Framing& found = *static_cast<Framing*>(data);
        const std::string_view text = value == nullptr ? "" : value;
        const bool isLength = equalTokens(name, MHD_HTTP_HEADER_CONTENT_LENGTH);
        if (isLength || equalTokens(name, MHD_HTTP_HEADER_TRANSFER_ENCODING)) {
            std::string_view& known = isLength ? found.length : found.coding;
            found.contradictory |= !known.empty() && known != text;
            known = text;
        }
        return MHD_YES;
    };
    MHD_get_connection_values(http, MHD_HEADER_KIND, take, &framing);
    if (framing.contradictory || (!framing.length.empty() && !framing.coding.empty())) {
        return refusal(MHD_HTTP_BAD_REQUEST, "found several lengths of the body, expected one");
    }
    if (!framing.coding.empty() && !equalTokens(framing.coding, "chunked")) {
        return refusal(MHD_HTTP_NOT_IMPLEMENTED,
                       fmt::format("found the Transfer-Encoding \"{}\", expected chunked", framing.coding));
    }
    return std::nullopt;
}

} // namespace

class HttpServer::Implementation {
public:
    Implementation(const Settings& settings, Handler handler, Authenticator* authenticator, Log log);
    Implementation(const Implementation&) = delete;
    Implementation& operator=(const Implementation&) = delete;
    ~Implementation();

    std::uint16_t port() const { return _port; }

private:
    enum class Step {
        /** Its headers are here. */
        arriving,
        /** The authenticator is asked. */
        loggingIn,
        /** Its body comes. */
        receiving,
        /** The handler is asked. */
        working,
        answered,
    };

    /** One request and what becomes of it. While it is suspended it belongs to the worker that has it. */
    struct Exchange {
        MHD_Connection* http;
        Connections::Connection& connection;
        Step step = Step::arriving;
        HttpRequest request{};
        /** Null where it asks for none that may be prompt. */
        PromptMethods::Method* method = nullptr;
        std::string body{};
        /** Of what came, also where it is not kept. */
        std::size_t bodySize = 0;
        Caller caller{"", true, true};
        std::optional<HttpReply> reply{};
        /** What is wrong with the request, for the log; empty where nothing is. */
    };

    /** Of an answer, until it is sent. */
    struct Body {
        std::string text;
        std::atomic<bool>& largeAnswerSent;

        ~Body() {
            if (text.size() >= largeAnswer) {
                largeAnswerSent = true;
            }
        }
    };

    static MHD_Result onRequest(void* self, MHD_Connection* http, const char* url, const char* method,
                                const char* version, const char* data, std::size_t* size, void** exchange);
    static void onCompleted(void* self, MHD_Connection* http, void** exchange, MHD_RequestTerminationCode reason);
    static void onConnection(void* self, MHD_Connection* http, void** connection, MHD_ConnectionNotificationCode what);
    static void* onRequestLine(void* self, const char* url, MHD_Connection* http);
    static void onMessage(void* self, const char* format, va_list arguments);

    static Connections::Connection& connectionOf(MHD_Connection* http);

    void start(int listener);
    void watch();

    MHD_Result proceed(Exchange& exchange, const char* data, std::size_t size);
    MHD_Result arrive(Exchange& exchange);
    MHD_Result authenticate(Exchange& exchange);
    void logIn(Exchange& exchange, const std::string& user, const std::string& password);
    MHD_Result receive(Exchange& exchange, const char* data, std::size_t size);
    MHD_Result work(Exchange& exchange);
    void answer(Exchange& exchange);
    MHD_Result suspend(Exchange& exchange, Step step, Workers& workers, Workers::Task task);
    static void refuse(Exchange& exchange, unsigned int status, const std::string& problem);
    /** The connection ends with it. */
    static void refuse(Exchange& exchange, HttpReply reply);
    MHD_Result send(Exchange& exchange);
    void report(const Connections::Connection& connection, const std::string& what);

    const Settings _settings;
    const Handler _handler;
    Authenticator* const _authenticator;
    const Log _log;
    std::string _certificate;
    std::string _key;
    std::uint16_t _port = 0;
    Connections _connections;
    RecentLogIns _recentLogIns;
    PromptMethods _promptMethods;
    Workers _workers;
    Workers _logInWorkers;
    std::atomic<bool> _stopping = false;
    /** Since the watcher looked for it. */
    std::atomic<bool> _largeAnswerSent = false;

    /** What the library said while it started. */
    std::string _startMessages;
    std::atomic<bool> _started = false;
    /** With which status the library has refused what it read last in this thread, until that is reported; 0 if none.
     */
    static thread_local unsigned int _refusal;
    MHD_Daemon* _daemon = nullptr;

    std::mutex _mutex;
    std::condition_variable _changed;
    bool _watching = true;
    /** Failed log-ins, and when they are answered, in that order. */
    std::list<std::pair<Clock::time_point, MHD_Connection*>> _failedLogIns;
    std::thread _watcher;
};

thread_local unsigned int HttpServer::Implementation::_refusal = 0;

HttpServer::Implementation::Implementation(const Settings& settings, Handler handler, Authenticator* authenticator,
                                           Log log)
    : _settings(settings), _handler(std::move(handler)), _authenticator(authenticator), _log(std::move(log)),
      _connections(settings.limits, settings.tls.has_value(), _log), _promptMethods(settings.promptMethods),
      // Every connection has one request at a time, so no more can wait.
      _workers(settings.threads, settings.limits.connections + surplusConnections),
      _logInWorkers(authenticator == nullptr ? 0 : logInThreads, waitingLogIns) {
    if (settings.tls) {
        _certificate = readPem(settings.tls->certificate);
        _key = readPem(settings.tls->key);
    }
    const int listener = listenOn(settings.address, settings.port);
    _port = portOf(listener);
    start(listener);
    try {
        _watcher = std::thread([this] { watch(); });
    } catch (const std::system_error&) {
        MHD_stop_daemon(_daemon);
        throw;
    }
}

void HttpServer::Implementation::start(int listener) {
    const Limits& limits = _settings.limits;
    // What is idle or slow is looked for here; the library's own time is for clients who take nothing of an answer.
    const auto answerTime = std::chrono::ceil<std::chrono::seconds>(std::max(limits.idleTime, limits.requestTime));
    const std::array<MHD_OptionItem, 4> tlsOptions = {{
        {MHD_OPTION_HTTPS_MEM_CERT, 0, _certificate.data()},
        {MHD_OPTION_HTTPS_MEM_KEY, 0, _key.data()},
        {MHD_OPTION_HTTPS_PRIORITIES, 0, const_cast<char*>(tlsPriorities)},
        {MHD_OPTION_END, 0, nullptr},
    }};
    const std::array<MHD_OptionItem, 1> noOptions = {{{MHD_OPTION_END, 0, nullptr}}};
    _daemon = MHD_start_daemon(MHD_USE_EPOLL_INTERNAL_THREAD | MHD_ALLOW_SUSPEND_RESUME | MHD_USE_ERROR_LOG |
                                   (_settings.tls ? MHD_USE_TLS : MHD_NO_FLAG),
                               0, nullptr, nullptr, &onRequest, this,                                            //
                               MHD_OPTION_EXTERNAL_LOGGER, &onMessage, this,                                     //
                               MHD_OPTION_LISTEN_SOCKET, listener,                                               //
                               MHD_OPTION_NOTIFY_CONNECTION, &onConnection, this,                                //
                               MHD_OPTION_URI_LOG_CALLBACK, &onRequestLine, this,                                //
                               MHD_OPTION_NOTIFY_COMPLETED, &onCompleted, this,                                  //
                               MHD_OPTION_CONNECTION_MEMORY_LIMIT, 2 * limits.headerBytes,                       //
                               MHD_OPTION_CONNECTION_LIMIT, limits.connections + surplusConnections,             //
                               MHD_OPTION_THREAD_POOL_SIZE, clientThreads,                                       //
                               MHD_OPTION_CONNECTION_TIMEOUT, static_cast<unsigned int>(answerTime.count()) + 1, //
                               MHD_OPTION_ARRAY, _settings.tls ? tlsOptions.data() : noOptions.data(),           //
                               MHD_OPTION_END);
    if (_daemon == nullptr) {
        close(listener);
        throw ServerError(_settings.tls ? fmt::format("cannot serve with the certificate {} and the key {}: {}",
                                                      _settings.tls->certificate.string(), _settings.tls->key.string(),
                                                      _startMessages)
                                        : fmt::format("cannot serve: {}", _startMessages));
    }
    _started = true;
}

HttpServer::Implementation::~Implementation() {
    {
        const std::lock_guard lock(_mutex);
        _stopping = true;
    }
    _changed.notify_all();
    // The library's threads may be about to use it until they end.
    const int listener = MHD_quiesce_daemon(_daemon);
    shutdown(listener, SHUT_RDWR);
    if (!_connections.waitForAnswers(_settings.stopTime)) {
        _log("stopped before all answers were sent");
    }
    // From here on nothing is suspended for longer than a worker takes to end.
    _logInWorkers.finish();
    _workers.finish();
    {
        const std::lock_guard lock(_mutex);
        _watching = false;
    }
    _changed.notify_all();
    _watcher.join();
    MHD_stop_daemon(_daemon);
    close(listener);
}

void HttpServer::Implementation::watch() {
    std::unique_lock lock(_mutex);
    while (_watching || !_failedLogIns.empty()) {
        const auto now = Clock::now();
        while (!_failedLogIns.empty() && (_stopping || _failedLogIns.front().first <= now)) {
            MHD_resume_connection(_failedLogIns.front().second);
            _failedLogIns.pop_front();
        }
        _connections.endOverdue();
        if (_largeAnswerSent.exchange(false)) {
            lock.unlock();
            malloc_trim(0);
            lock.lock();
        }
        const auto next = now + watchInterval;
        _changed.wait_until(lock, _failedLogIns.empty() ? next : std::min(next, _failedLogIns.front().first),
                            [this] { return !_watching || (_stopping && !_failedLogIns.empty()); });
    }
}

/* What the library calls. For a connection it does so from one thread. */

Connections::Connection& HttpServer::Implementation::connectionOf(MHD_Connection* http) {
    return *static_cast<Connections::Connection*>(
        MHD_get_connection_info(http, MHD_CONNECTION_INFO_SOCKET_CONTEXT)->socket_context);
}

void HttpServer::Implementation::onMessage(void* self, const char* format, va_list arguments) {
    auto& server = *static_cast<Implementation*>(self);
    const std::string line = formatMessage(format, arguments);
    if (!server._started) {
        server._startMessages += (server._startMessages.empty() ? "" : "; ") + line;
    } else if (line.starts_with(refusalMessage)) {
        std::from_chars(line.data() + refusalMessage.size(), line.data() + line.size(), _refusal);
    } else if (!isRepetition(line)) {
        server._log(line);
    }
}

void HttpServer::Implementation::onConnection(void* self, MHD_Connection* http, void** connection,
                                              MHD_ConnectionNotificationCode what) {
    auto& server = *static_cast<Implementation*>(self);
    if (what == MHD_CONNECTION_NOTIFY_STARTED) {
        const int socket = MHD_get_connection_info(http, MHD_CONNECTION_INFO_CONNECTION_FD)->connect_fd;
        const sockaddr* address = MHD_get_connection_info(http, MHD_CONNECTION_INFO_CLIENT_ADDRESS)->client_addr;
        *connection = &server._connections.opened(socket, textOf(*address));
        return;
    }
    auto& closed = *static_cast<Connections::Connection*>(*connection);
    if (const unsigned int status = std::exchange(_refusal, 0); status != 0) {
        server.report(closed, fmt::format("answered {}: {}", status, MHD_get_reason_phrase_for(status)));
    } else if (!closed.asked && hasReceived(closed.socket)) {
        server.report(closed, "closed: what it sent is no request of HTTP");
    }
    server._connections.closed(closed);
}

void* HttpServer::Implementation::onRequestLine(void* self, const char* /*url*/, MHD_Connection* http) {
    Connections::Connection& connection = connectionOf(http);
    connection.asked = true;
    static_cast<Implementation*>(self)->_connections.enter(connection, State::receiving);
    return nullptr;
}

MHD_Result HttpServer::Implementation::onRequest(void* self, MHD_Connection* http, const char* /*url*/,
                                                 const char* method, const char* /*version*/, const char* data,
                                                 std::size_t* size, void** exchange) {
    if (*exchange == nullptr) {
        auto* const made = new Exchange{http, connectionOf(http)};
        made->request.method = method;
        *exchange = made;
    }
    const std::size_t given = std::exchange(*size, 0);
    return static_cast<Implementation*>(self)->proceed(*static_cast<Exchange*>(*exchange), data, given);
}

void HttpServer::Implementation::onCompleted(void* self, MHD_Connection* http, void** exchange,
                                             MHD_RequestTerminationCode reason) {
    auto& server = *static_cast<Implementation*>(self);
    const std::unique_ptr<Exchange> ended(static_cast<Exchange*>(std::exchange(*exchange, nullptr)));
    Connections::Connection& connection = connectionOf(http);
    const State before = server._connections.enter(connection, State::idle);
    if (before == State::leaving || reason == MHD_REQUEST_TERMINATED_COMPLETED_OK ||
        reason == MHD_REQUEST_TERMINATED_DAEMON_SHUTDOWN) {
        return; // what the server shut down was reported then
    }
    if (ended != nullptr && (ended->step == Step::working || ended->step == Step::answered)) {
        server.report(connection, "gone before the answer was sent");
    } else if (const MHD_ConnectionInfo* answer = MHD_get_connection_info(http, MHD_CONNECTION_INFO_HTTP_STATUS);
               answer != nullptr && answer->http_status != 0) {
        _refusal = 0;
        server.report(connection, fmt::format("answered {}: {}", answer->http_status,
                                              MHD_get_reason_phrase_for(answer->http_status)));
    } else {
        server.report(connection, "gone before the request was here");
    }
}

/* The way of a request. */

MHD_Result HttpServer::Implementation::proceed(Exchange& exchange, const char* data, std::size_t size) {
    switch (exchange.step) {
    case Step::arriving:
        return arrive(exchange);
    case Step::loggingIn:
        if (exchange.reply) {
            return send(exchange);
        }
        exchange.step = Step::receiving;
        _connections.enter(exchange.connection, State::receiving);
        return MHD_YES;
    case Step::receiving:
        return size > 0 ? receive(exchange, data, size) : work(exchange);
    case Step::working:
        return send(exchange);
    case Step::answered:
        break;
    }
    return MHD_YES;
}

MHD_Result HttpServer::Implementation::arrive(Exchange& exchange) {
    const Limits& limits = _settings.limits;
    const std::size_t headerSize =
        MHD_get_connection_info(exchange.http, MHD_CONNECTION_INFO_REQUEST_HEADER_SIZE)->header_size;
    if (exchange.connection.surplus) {
        refuse(exchange, MHD_HTTP_SERVICE_UNAVAILABLE, "too many connections");
    } else if (_stopping) {
        refuse(exchange, MHD_HTTP_SERVICE_UNAVAILABLE, "the server is stopping");
    } else if (headerSize > limits.headerBytes) {
        refuse(exchange, MHD_HTTP_REQUEST_HEADER_FIELDS_TOO_LARGE,
               fmt::format("the headers have {} bytes, expected {} at most", headerSize, limits.headerBytes));
    } else if (const std::uint64_t bodySize = announcedSize(exchange.http);
               bodySize > readBeyondLimit * limits.bodyBytes) {
        refuse(exchange, MHD_HTTP_CONTENT_TOO_LARGE,
               fmt::format("the body has {} bytes, expected {} at most", bodySize, limits.bodyBytes));
    } else if (std::optional<HttpReply> refusal = framingRefusal(exchange.http)) {
        refuse(exchange, *std::move(refusal));
    } else if (_authenticator != nullptr) {
        return authenticate(exchange);
    }
    if (exchange.reply) {
        return send(exchange);
    }
    exchange.step = Step::receiving;
    return MHD_YES;
}

MHD_Result HttpServer::Implementation::authenticate(Exchange& exchange) {
    const std::optional<Credentials> given = credentialsOf(headerOf(exchange.http, MHD_HTTP_HEADER_AUTHORIZATION));
    if (!given) {
        // How clients learn that they should log in.
        exchange.reply = unauthorized("log in with a user name and password");
        return send(exchange);
    }
    const auto& [user, password] = *given;
    if (auto caller = _recentLogIns.find(user, password)) {
        exchange.caller = *std::move(caller);
        exchange.step = Step::receiving;
        return MHD_YES;
    }
    return suspend(exchange, Step::loggingIn, _logInWorkers,
                   [this, &exchange, given = *given] { logIn(exchange, given.user, given.password); });
}

void HttpServer::Implementation::logIn(Exchange& exchange, const std::string& user, const std::string& password) {
    LogIn result = _authenticator->logIn(user, password, exchange.connection.address);
    if (result.caller) {
        _recentLogIns.remember(user, password, *result.caller);
        exchange.caller = *std::move(result.caller);
        MHD_resume_connection(exchange.http);
        return;
    }
    report(exchange.connection, fmt::format("log-in as \"{}\" failed: {}", printable(user), printable(result.problem)));
    exchange.reply = unauthorized("the log-in failed");
    const std::lock_guard lock(_mutex);
    _failedLogIns.emplace_back(Clock::now() + _settings.failedLogInDelay, exchange.http);
}

MHD_Result HttpServer::Implementation::receive(Exchange& exchange, const char* data, std::size_t size) {
    const std::size_t limit = _settings.limits.bodyBytes;
    exchange.bodySize += size;
    if (exchange.bodySize <= limit) {
        exchange.body.append(data, size);
    } else if (exchange.bodySize > readBeyondLimit * limit && _connections.shutDown(exchange.connection)) {
        report(exchange.connection, fmt::format("cut off: the body has more than {} bytes", readBeyondLimit * limit));
    }
    return MHD_YES;
}

MHD_Result HttpServer::Implementation::work(Exchange& exchange) {
    if (exchange.bodySize > _settings.limits.bodyBytes) {
        refuse(
            exchange, MHD_HTTP_CONTENT_TOO_LARGE,
            fmt::format("the body has {} bytes, expected {} at most", exchange.bodySize, _settings.limits.bodyBytes));
        return send(exchange);
    }
    const auto take = [](void* headers, MHD_ValueKind, const char* name, const char* value) {
        static_cast<decltype(exchange.request.headers)*>(headers)->emplace_back(name, value == nullptr ? "" : value);
        return MHD_YES;
    };
    MHD_get_connection_values(exchange.http, MHD_HEADER_KIND, take, &exchange.request.headers);
    exchange.request.body = exchange.body;
    exchange.method = _promptMethods.find(exchange.request);
    if (exchange.method != nullptr && exchange.method->isPrompt(Clock::now())) {
        _connections.enter(exchange.connection, State::answering);
        answer(exchange);
        return send(exchange);
    }
    return suspend(exchange, Step::working, _workers, [this, &exchange] {
        answer(exchange);
        MHD_resume_connection(exchange.http);
    });
}

void HttpServer::Implementation::answer(Exchange& exchange) {
    const auto begin = processorTime();
    exchange.reply = _handler(exchange.request, exchange.caller);
    if (exchange.method != nullptr) {
        exchange.method->took(processorTime() - begin, Clock::now());
    }
}

MHD_Result HttpServer::Implementation::suspend(Exchange& exchange, Step step, Workers& workers, Workers::Task task) {
    exchange.step = step;
    _connections.enter(exchange.connection, State::answering);
    MHD_suspend_connection(exchange.http);
    // When a worker has it, it may be resumed at any moment.
    MHD_Connection* const http = exchange.http;
    if (!workers.add(std::move(task))) {
        refuse(exchange, MHD_HTTP_SERVICE_UNAVAILABLE, "too much to do");
        MHD_resume_connection(http);
    }
    return MHD_YES;
}

void HttpServer::Implementation::refuse(Exchange& exchange, unsigned int status, const std::string& problem) {
    refuse(exchange, refusal(status, problem));
}

void HttpServer::Implementation::refuse(Exchange& exchange, HttpReply reply) {
    exchange.reply = std::move(reply);
    exchange.reply->headers.emplace_back(MHD_HTTP_HEADER_CONNECTION, "close");
}

MHD_Result HttpServer::Implementation::send(Exchange& exchange) {
    HttpReply& reply = *exchange.reply;
    if (!reply.problem.empty()) {
        report(exchange.connection, fmt::format("answered {}: {}", reply.status, printable(reply.problem)));
    }
    auto* const body = new Body{std::move(reply.body), _largeAnswerSent};
    const std::unique_ptr<MHD_Response, decltype(&MHD_destroy_response)> response(
        MHD_create_response_from_buffer_with_free_callback_cls(
            body->text.size(), body->text.data(), [](void* sent) { delete static_cast<Body*>(sent); }, body),
        &MHD_destroy_response);
    for (const auto& [name, value] : reply.headers) {
        // The library takes no empty value, for which blanks are another way of writing.
        MHD_add_response_header(response.get(), name.c_str(), value.empty() ? " " : value.c_str());
    }
    _connections.enter(exchange.connection, State::answering);
    exchange.step = Step::answered;
    return MHD_queue_response(exchange.http, reply.status, response.get());
}

void HttpServer::Implementation::report(const Connections::Connection& connection, const std::string& what) {
    _log(fmt::format("{}: {}", connection.address, what));
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

} // namespace ObjectManager::Server

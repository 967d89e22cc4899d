#include "server/Exchange.h"

#include "server/HttpStatus.h"
#include "server/Printable.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <malloc.h>

#include <algorithm>
#include <ctime>
#include <new>
#include <thread>
#include <utility>

namespace ObjectManager::Server {

namespace {

/** How many times the limit of a body is read, and thrown away, so that its client is there for the refusal. */
constexpr std::size_t readBeyondLimit = 4;

/** What each body may have without a share of the memory for all of them, so that small requests are never refused. */
constexpr std::size_t freeBody = std::size_t{16} * 1024;

/** Memory of answers this large is returned to the system; the allocator would keep it. */
constexpr std::size_t largeAnswer = std::size_t{1024} * 1024;

/** Answers up to this size are sent in one piece with their headers. */
constexpr std::size_t smallAnswer = std::size_t{16} * 1024;

/** For how long a client is listened to after its last answer, so that it can read it. */
constexpr std::chrono::seconds finishTime{1};

/** How many requests, and steps of TLS's handshakes, of one network may wait for their turn. */
constexpr unsigned int waitingOfNetwork = 1000;

/** Where there is no memory for anything else. */
constexpr std::string_view noMemory =
    "HTTP/1.1 503 Service Unavailable\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";

/** Half of the processors, so that no storm of them takes all. */
unsigned int handshakesAtATime() {
    return std::max(1U, std::thread::hardware_concurrency() / 2);
}

HttpReply refusal(unsigned int status, const std::string& problem) {
    return {status, {{"Content-Type", "text/plain; charset=utf-8"}}, problem + "\n", problem};
}

HttpReply unauthorized(const std::string& text) {
    HttpReply reply = refusal(Status::unauthorized, text);
    // What is wrong with a log-in has been logged, and a client's first request without one is usual.
    reply.problem.clear();
    reply.headers.emplace_back("WWW-Authenticate", R"(Basic realm="orvcim", charset="UTF-8")");
    return reply;
}

/** Thrown where a log-in is missing or wrong. */
struct Unauthorized {
    const char* text;
};

const std::string* headerOf(const HttpHeaders& headers, std::string_view name) {
    const auto found = std::find_if(headers.begin(), headers.end(),
                                    [&](const auto& header) { return equalTokens(header.first, name); });
    return found == headers.end() ? nullptr : &found->second;
}

/** What stands before an answer's body. */
std::string headOf(const HttpReply& reply, bool keepAlive) {
    std::string head = fmt::format("HTTP/1.1 {} {}\r\nDate: {:%a, %d %b %Y %H:%M:%S} GMT\r\nConnection: {}\r\n"
                                   "Content-Length: {}\r\n",
                                   reply.status, Status::reasonOf(reply.status), fmt::gmtime(std::time(nullptr)),
                                   keepAlive ? "Keep-Alive" : "close", reply.body.size());
    for (const auto& [name, value] : reply.headers) {
        head.append(name).append(": ").append(value).append("\r\n");
    }
    return head += "\r\n";
}

} // namespace

Shared::Shared(Settings given, Handler function, Authenticator* authenticator, Log log)
    : settings(std::move(given)), handler(std::move(function)), events(std::move(log)),
      connections(settings.limits, events), hosts(settings.hosts),
      handshakes(handshakesAtATime(), handshakesAtATime(), waitingOfNetwork),
      // A quarter is for others than the network that has most.
      answers(settings.threads, (3 * settings.threads + 3) / 4, waitingOfNetwork),
      bodies(settings.limits.allBodiesBytes) {
    if (authenticator != nullptr) {
        logIns.emplace(*authenticator, settings.failedLogInDelay);
    }
}

std::shared_ptr<const TlsKeys> Shared::keys() {
    const std::lock_guard lock(_mutex);
    return _keys;
}

void Shared::setKeys(std::shared_ptr<const TlsKeys> keys) {
    const std::lock_guard lock(_mutex);
    _keys = std::move(keys);
}

Exchange::Exchange(Shared& shared, Connections::Connection& connection)
    : _shared(shared), _limits(shared.settings.limits), _connection(connection) {}

void Exchange::run() noexcept {
    try {
        begin();
        while (serve()) {
        }
        enter(State::idle);
        _stream->finish(Clock::now() + finishTime);
    } catch (const Ended&) {
        // The client knows as much as it can.
    } catch (const std::exception& error) {
        if (_stream) {
            _stream->send(noMemory, std::chrono::milliseconds{0});
        }
        try {
            report(fmt::format("answered 503: {}", error.what()));
        } catch (const std::exception&) {
            // There is no memory for the line either.
        }
    }
}

void Exchange::begin() {
    _stream.emplace(_connection.socket, _shared.keys());
    const auto compute = [this](const std::function<void()>& step) {
        const Turns::Turn turn = _shared.handshakes.take(_connection.network, true, Clock::now() + _limits.idleTime,
                                                         [this] { return _stream->isBroken(); });
        if (turn) {
            step();
        }
        return static_cast<bool>(turn);
    };
    if (_stream->shakeHands(Clock::now() + _limits.idleTime, compute) != Stream::Outcome::done) {
        if (_stream->hasReceived() && !_shared.stopping) {
            const std::string& problem = _stream->handshakeProblem();
            report("closed: the TLS handshake failed: " + (problem.empty() ? "it did not end in time" : problem));
        }
        throw Ended{};
    }
}

bool Exchange::serve() {
    _head = {};
    _user.clear();
    _body.clear();
    _bodyIsMissing = false;
    bool keepAlive = false;
    HttpReply reply{};
    try {
        Budget::Share share(_shared.bodies, _connection.network);
        readHead();
        check();
        Caller caller = logIn();
        caller.address = _connection.address;
        readBody(&share);
        reply = answer(caller);
        keepAlive = _head.keepAlive;
        _connection.served = true;
    } catch (const HttpError& error) {
        reply = refusal(error.status(), error.what());
    } catch (const Unauthorized& error) {
        reply = unauthorized(error.text);
        keepAlive = _head.keepAlive;
    }
    keepAlive = keepAlive && !_shared.stopping;
    send(std::move(reply), keepAlive);
    if (keepAlive) {
        skipBody();
    }
    return keepAlive;
}

void Exchange::readHead() {
    enter(State::idle);
    _begin = Clock::now();
    // Empty lines in front of a request are what old clients sent after a body.
    const auto dropEmptyLines = [this] { _received.erase(0, _received.find_first_not_of("\r\n")); };
    dropEmptyLines();
    bool begun = false;
    _until = _begin + _limits.idleTime;
    std::optional<std::size_t> size;
    while (!(size = sizeOfHead(_received))) {
        if (!mayBeRequestLine(_received)) {
            break;
        }
        const bool hasLine = _received.find('\n') != std::string::npos;
        if (_received.size() > 2 * _limits.headerBytes) {
            const unsigned int status = hasLine ? Status::headersTooLarge : Status::uriTooLong;
            throw HttpError(status, std::string(Status::reasonOf(status)));
        }
        if (hasLine && !begun) {
            begun = true;
            enter(State::receiving);
            _until = Clock::now() + _limits.requestTime;
        }
        readMore(_received);
        dropEmptyLines();
    }
    if (!mayBeRequestLine(_received)) {
        report("closed: not an HTTP request");
        throw Ended{};
    }
    _begin = Clock::now();
    if (!begun) {
        _until = _begin + _limits.requestTime;
        enter(State::receiving);
    }
    _asked = true;
    ++_shared.requests;
    if (*size > _limits.headerBytes) {
        throw HttpError(Status::headersTooLarge,
                        fmt::format("the headers have {} bytes, expected {} at most", *size, _limits.headerBytes));
    }
    _head = parseHead(std::string_view(_received).substr(0, *size));
    _received.erase(0, *size);
    _bodyIsMissing = true;
}

void Exchange::check() const {
    if (_connection.surplus) {
        throw HttpError(Status::serviceUnavailable, "too many connections");
    }
    if (_shared.stopping) {
        throw HttpError(Status::serviceUnavailable, "the server is stopping");
    }
    if (_head.framing.length > readBeyondLimit * _limits.bodyBytes) {
        throw HttpError(Status::contentTooLarge, fmt::format("the body has {} bytes, expected {} at most",
                                                             _head.framing.length, _limits.bodyBytes));
    }
    if (!_head.host.empty() && !_shared.hosts.areCalled(hostNameOf(_head.host), _shared.keys().get())) {
        throw HttpError(Status::badRequest, fmt::format("found the Host \"{}\", expected an address or a name of this "
                                                        "server (see --host)",
                                                        printable(_head.host)));
    }
    if (const std::string* const origin = headerOf(_head.headers, "Origin")) {
        throw HttpError(
            Status::forbidden,
            fmt::format("found the header Origin with \"{}\": pages in browsers are not served", printable(*origin)));
    }
}

Caller Exchange::logIn() {
    if (!_shared.logIns) {
        return {"", true, true};
    }
    const std::string* const header = headerOf(_head.headers, "Authorization");
    const std::optional<Credentials> given = header == nullptr ? std::nullopt : credentialsOf(*header);
    if (!given) {
        // How clients learn that they should log in.
        throw Unauthorized{"log in with a user name and password"};
    }
    if (auto caller = _shared.logIns->recent(*given)) {
        _user = caller->user;
        return *std::move(caller);
    }
    enter(State::loggingIn);
    LogIns::Decision decision = _shared.logIns->check(
        *given, {_connection.address, _connection.network, [this] { return _stream->isBroken(); }},
        Clock::now() + _limits.requestTime);
    if (decision.verdict == LogIns::Verdict::busy) {
        throw HttpError(Status::serviceUnavailable, _shared.stopping ? "the server is stopping" : "too much to do");
    }
    if (decision.verdict == LogIns::Verdict::wrong) {
        report(fmt::format("log-in as \"{}\" failed: {}", printable(given->user), printable(decision.problem)));
        _stream->pause(decision.answerAt, _shared.stop);
        throw Unauthorized{"the log-in failed"};
    }
    _until = Clock::now() + _limits.requestTime;
    enter(State::receiving);
    _user = decision.caller->user;
    return *std::move(decision.caller);
}

void Exchange::readBody(Budget::Share* share) {
    if (_head.expectsContinue && _received.empty() && (_head.framing.chunked || _head.framing.length > 0)) {
        _stream->send("HTTP/1.1 100 Continue\r\n\r\n", _limits.idleTime);
    }
    const std::size_t limit = _limits.bodyBytes;
    std::uint64_t size = 0;
    const auto keep = [&](std::string_view data) {
        size += data.size();
        if (size > readBeyondLimit * limit) {
            report(fmt::format("cut off: the body has more than {} bytes", readBeyondLimit * limit));
            throw Ended{};
        }
        if (size > limit || share == nullptr) {
            return;
        }
        if (size > freeBody && !share->grow(size)) {
            throw HttpError(Status::serviceUnavailable,
                            fmt::format("the bodies of all requests have more than {} bytes", _shared.bodies.bytes()));
        }
        _body.append(data);
    };
    if (_head.framing.chunked) {
        ChunkedBody chunks(_limits.headerBytes);
        std::string data;
        for (chunks.take(_received, data); true; chunks.take(_received, data)) {
            keep(data);
            data.clear();
            if (chunks.isComplete()) {
                break;
            }
            readMore(_received);
        }
    } else {
        while (size < _head.framing.length) {
            if (_received.empty()) {
                readMore(_received);
            }
            const std::size_t taken = std::min<std::uint64_t>(_received.size(), _head.framing.length - size);
            keep(std::string_view(_received).substr(0, taken));
            _received.erase(0, taken);
        }
    }
    _bodyIsMissing = false;
    if (size > limit) {
        throw HttpError(Status::contentTooLarge,
                        fmt::format("the body has {} bytes, expected {} at most", size, limit));
    }
}

void Exchange::readMore(std::string& to) {
    switch (_stream->receive(to, _until)) {
    case Stream::Outcome::done:
        return;
    case Stream::Outcome::late:
        endLate();
    case Stream::Outcome::gone:
        endEarly();
    }
}

void Exchange::skipBody() {
    if (!_bodyIsMissing) {
        return;
    }
    enter(State::receiving);
    _until = Clock::now() + _limits.requestTime;
    // It does not wait for leave to send what has been answered.
    _head.expectsContinue = false;
    try {
        readBody(nullptr);
    } catch (const HttpError&) {
        throw Ended{};
    }
}

HttpReply Exchange::answer(const Caller& caller) {
    enter(State::answering);
    const Turns::Turn turn = _shared.answers.take(_connection.network, true, Clock::now() + _limits.requestTime,
                                                  [this] { return _stream->isBroken(); });
    if (!turn) {
        throw HttpError(Status::serviceUnavailable, _shared.stopping ? "the server is stopping" : "too much to do");
    }
    return _shared.handler({_head.method, std::move(_head.headers), _body}, caller);
}

void Exchange::send(HttpReply reply, bool keepAlive) {
    if (!reply.problem.empty()) {
        report(fmt::format("answered {}: {}", reply.status, printable(reply.problem)));
    }
    enter(State::sending);
    std::string head = headOf(reply, keepAlive);
    const bool hasBody = _head.method != "HEAD";
    const bool isSmall = hasBody && reply.body.size() <= smallAnswer;
    if (isSmall) {
        head += reply.body;
    }
    Stream::Outcome outcome = _stream->send(head, _limits.idleTime);
    if (outcome == Stream::Outcome::done && hasBody && !isSmall) {
        outcome = _stream->send(reply.body, _limits.idleTime);
    }
    const std::size_t size = reply.body.size();
    if (size >= largeAnswer) {
        std::string().swap(reply.body);
        malloc_trim(0);
    }
    if (_shared.settings.accessLog) {
        _shared.events.report(fmt::format("{}: {} \"{} {}\" {} {} {:.1f} ms", _connection.address,
                                          _user.empty() ? "-" : printable(_user), printable(_head.method),
                                          printable(_head.target), reply.status, size,
                                          std::chrono::duration<double, std::milli>(Clock::now() - _begin).count()));
    }
    if (outcome != Stream::Outcome::done) {
        enter(State::sending);
        report("gone before the answer was sent");
        throw Ended{};
    }
}

void Exchange::enter(State state) {
    if (!_shared.connections.enter(_connection, state)) {
        throw Ended{};
    }
}

void Exchange::endLate() {
    if (_received.find('\n') == std::string::npos && !_bodyIsMissing) {
        throw Ended{}; // idle
    }
    throw HttpError(Status::requestTimeout, fmt::format("the request did not arrive within {} s",
                                                        std::chrono::duration<double>(_limits.requestTime).count()));
}

void Exchange::endEarly() {
    const bool begun = _bodyIsMissing || _received.find('\n') != std::string::npos;
    // Throws where the server has shut the connection down, which is no news.
    enter(begun ? State::receiving : State::idle);
    if (begun) {
        report("gone before the request was here");
    } else if (!_asked && !_received.empty()) {
        report("closed: not an HTTP request");
    }
    throw Ended{};
}

void Exchange::report(const std::string& what) {
    _shared.events.report(_connection.network, fmt::format("{}: {}", _connection.address, what));
}

} // namespace ObjectManager::Server

#include "server/Exchange.h"

#include "basics/Printable.h"
#include "server/HttpStatus.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <malloc.h>

#include <algorithm>
#include <ctime>
#include <iterator>
#include <new>
#include <thread>
#include <utility>

namespace ObjectManager::Server {

namespace {

/**
 * A body that is too large is read and dropped up to this multiple of the limit: a client that is still sending would
 * not read the refusal.
 */
constexpr std::size_t readBeyondLimit = 4;

/** How many bytes of each body do not count against the memory for bodies, so that small requests are never refused. */
constexpr std::size_t freeBody = std::size_t{16} * 1024;

/** Memory of answers this large is returned to the system; the allocator would keep it. */
constexpr std::size_t largeAnswer = std::size_t{1024} * 1024;

/** How many bytes of each answer do not count against the memory for answers, and the steps in which answers ask. */
constexpr std::size_t freeAnswer = std::size_t{256} * 1024;

/** Answers up to this size are sent in one piece with their headers. */
constexpr std::size_t smallAnswer = std::size_t{16} * 1024;

/** How long the server keeps receiving after its last answer: closing at once could make the client lose the answer. */
constexpr std::chrono::seconds finishTime{1};

/** How many requests, and how many steps of TLS handshakes, of one network may wait for their turn. */
constexpr unsigned int waitingOfNetwork = 1000;

/** The answer when there is no memory for any other. */
constexpr std::string_view noMemory =
    "HTTP/1.1 503 Service Unavailable\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";

/** Half of the processors, so that handshakes alone cannot keep all of them busy. */
unsigned int handshakesAtATime() {
    return std::max(1U, std::thread::hardware_concurrency() / 2);
}

HttpReply refusal(unsigned int status, const std::string& problem) {
    return {status, {{"Content-Type", "text/plain; charset=utf-8"}}, problem + "\n", problem};
}

HttpReply unauthorized(const std::string& text) {
    HttpReply reply = refusal(Status::unauthorized, text);
    // A failed log-in has already been logged, and a first request without a log-in is usual.
    reply.problem.clear();
    reply.headers.emplace_back("WWW-Authenticate", R"(Basic realm="orvcim", charset="UTF-8")");
    return reply;
}

/** Thrown if the log-in is missing or wrong. */
struct Unauthorized {
    const char* text;
};

const std::string* headerOf(const HttpHeaders& headers, std::string_view name) {
    const auto found = std::find_if(headers.begin(), headers.end(),
                                    [&](const auto& header) { return equalTokens(header.first, name); });
    return found == headers.end() ? nullptr : &found->second;
}

void appendHeaders(std::string& text, const HttpHeaders& headers) {
    for (const auto& [name, value] : headers) {
        text.append(name).append(": ").append(value).append("\r\n");
    }
}

/** The status line and headers of an answer. @param framing the header that tells where the body ends, as a line. */
std::string headOf(const HttpReply& reply, bool keepAlive, std::string_view framing) {
    std::string head = fmt::format("HTTP/1.1 {} {}\r\nDate: {:%a, %d %b %Y %H:%M:%S} GMT\r\nConnection: {}\r\n{}",
                                   reply.status, Status::reasonOf(reply.status), fmt::gmtime(std::time(nullptr)),
                                   keepAlive ? "Keep-Alive" : "close", framing);
    appendHeaders(head, reply.headers);
    return head += "\r\n";
}

} // namespace

Shared::Shared(Settings given, Handler function, Authenticator* authenticator, Log log)
    : settings(std::move(given)), handler(std::move(function)), events(std::move(log)),
      connections(settings.limits, events), hosts(settings.hosts),
      handshakes(handshakesAtATime(), handshakesAtATime(), waitingOfNetwork),
      // No network gets the last quarter of the turns.
      answers(settings.threads, (3 * settings.threads + 3) / 4, waitingOfNetwork),
      bodies(settings.limits.allBodiesBytes), answerMemory(settings.limits.allAnswersBytes) {
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
        shakeHands();
        while (serve()) {
        }
        enter(State::idle);
        _stream->finish(Clock::now() + finishTime);
    } catch (const Ended&) {
        // The connection is closed without another answer.
    } catch (const std::exception& error) {
        if (_stream && !_begun) {
            _stream->send(noMemory, std::chrono::milliseconds{0});
        } else if (_stream && !_head.takesChunks) {
            _stream->endWithReset();
        }
        try {
            report(fmt::format("{}: {}", _begun ? "broke off the answer" : "answered 503", error.what()));
        } catch (const std::exception&) {
            // There is no memory for the line in the log either.
        }
    }
}

void Exchange::shakeHands() {
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
    _bodyIsMissing = false;
    _begun = false;
    _sent = 0;
    bool keepAlive = false;
    HttpReply reply{};
    try {
        Body body{{_shared.bodies, _connection.network}, {}};
        readHead();
        check();
        Caller caller = logIn();
        caller.address = _connection.address;
        readBody(&body);
        reply = answer(caller, body.text);
        keepAlive = _head.keepAlive;
        _connection.served = true;
    } catch (const HttpError& error) {
        reply = refusal(error.status(), error.what());
    } catch (const Unauthorized& error) {
        reply = unauthorized(error.text);
        keepAlive = _head.keepAlive;
    }
    if (_begun) {
        finish(reply);
        return _keepAlive;
    }
    keepAlive = keepAlive && !_shared.stopping;
    sendWhole(std::move(reply), keepAlive);
    if (keepAlive) {
        skipBody();
    }
    return keepAlive;
}

void Exchange::readHead() {
    enter(State::idle);
    _begin = Clock::now();
    // Old clients send an empty line after a body; RFC 9112 has servers ignore it (section 2.2).
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
        // The answer asks the client to log in.
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

void Exchange::readBody(Body* to) {
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
        if (size > limit || to == nullptr) {
            return;
        }
        if (size > freeBody && !to->share.grow(size)) {
            throw HttpError(Status::serviceUnavailable,
                            fmt::format("the bodies of all requests have more than {} bytes", _shared.bodies.bytes()));
        }
        to->text.append(data);
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
    // The request has been answered: the client does not wait for "100 Continue".
    _head.expectsContinue = false;
    try {
        readBody(nullptr);
    } catch (const HttpError&) {
        throw Ended{};
    }
}

HttpReply Exchange::answer(const Caller& caller, std::string_view body) {
    enter(State::answering);
    Turns::Turn turn = _shared.answers.take(_connection.network, true, Clock::now() + _limits.requestTime,
                                            [this] { return _stream->isBroken(); });
    if (!turn) {
        throw HttpError(Status::serviceUnavailable, _shared.stopping ? "the server is stopping" : "too much to do");
    }
    _turn.emplace(std::move(turn));
    HttpReply reply = _shared.handler({_head.method, std::move(_head.headers), body, this}, caller);
    _turn.reset();
    _memory.reset();
    return reply;
}

void Exchange::sendWhole(HttpReply reply, bool keepAlive) {
    if (!reply.problem.empty()) {
        report(fmt::format("answered {}: {}", reply.status, printable(reply.problem)));
    }
    enter(State::sending);
    _status = reply.status;
    _sent = reply.body.size();
    std::string head = headOf(reply, keepAlive, fmt::format("Content-Length: {}\r\n", _sent));
    const bool hasBody = _head.method != "HEAD";
    const bool isSmall = hasBody && _sent <= smallAnswer;
    if (isSmall) {
        head += reply.body;
    }
    Stream::Outcome outcome = _stream->send(head, _limits.idleTime);
    if (outcome == Stream::Outcome::done && hasBody && !isSmall) {
        outcome = _stream->send(reply.body, _limits.idleTime);
    }
    if (_sent >= largeAnswer) {
        std::string().swap(reply.body);
        malloc_trim(0);
    }
    logAccess();
    if (outcome != Stream::Outcome::done) {
        enter(State::sending);
        report("gone before the answer was sent");
        throw Ended{};
    }
}

void Exchange::hold(std::size_t bytes) {
    if (bytes <= freeAnswer) {
        return;
    }
    if (!_memory) {
        _memory.emplace(_shared.answerMemory, _connection.network);
    }
    _memory->grow((bytes + freeAnswer - 1) / freeAnswer * freeAnswer);
}

/**
 * To a client that does not understand chunks, the end of the connection is the end of the body. From here on, the
 * thread that makes the answer waits for its client. It gives its turn back, so that no other client waits as well.
 */
void Exchange::begin(const HttpReply& reply) {
    _turn.reset();
    _begun = true;
    _status = reply.status;
    _keepAlive = _head.takesChunks && _head.keepAlive && !_shared.stopping;
    enter(State::sending);
    std::string text = headOf(reply, _keepAlive, _head.takesChunks ? "Transfer-Encoding: chunked\r\n" : "");
    append(text, reply.body);
    deliver(text);
}

void Exchange::send(std::string_view piece) {
    std::string text;
    append(text, piece);
    deliver(text);
}

void Exchange::finish(const HttpReply& rest) {
    if (rest.problem.empty()) {
        std::string text;
        append(text, rest.body);
        if (_head.takesChunks && _head.method != "HEAD") {
            text += "0\r\n\r\n";
        }
        deliver(text);
    } else {
        breakOff(rest);
    }
    if (_sent >= largeAnswer) {
        malloc_trim(0);
    }
    logAccess();
}

/**
 * A client that has announced it gets the reason in trailers after the last chunk (RFC 9110, section 6.5). For every
 * other client the answer visibly breaks off: its last chunk is missing, or the connection is reset.
 */
void Exchange::breakOff(const HttpReply& rest) {
    if (!_head.takesTrailers || rest.headers.empty()) {
        abandon("broke off the answer: " + printable(rest.problem));
    }
    report("broke off the answer: " + printable(rest.problem));
    _keepAlive = false;
    std::string text = "0\r\n";
    appendHeaders(text, rest.headers);
    deliver(text += "\r\n");
}

/** Appends a piece of the body in the form in which it is sent, as a chunk or as it is. */
void Exchange::append(std::string& text, std::string_view piece) {
    _sent += piece.size();
    if (piece.empty() || _head.method == "HEAD") {
        return;
    }
    if (!_head.takesChunks) {
        text += piece;
        return;
    }
    text.reserve(text.size() + piece.size() + 20);
    fmt::format_to(std::back_inserter(text), "{:x}\r\n", piece.size());
    text.append(piece).append("\r\n");
}

/** Sends text of an answer in pieces; gives up if the client takes it too slowly. */
void Exchange::deliver(std::string_view text) {
    const Clock::time_point start = Clock::now();
    Clock::time_point lastTaken = start;
    while (!text.empty()) {
        const bool isHurried = _memory && _shared.answerMemory.isAwaited();
        const Clock::time_point until = isHurried ? start + _shared.settings.hurryTime : lastTaken + _limits.idleTime;
        // Waits for hurryTime at most, to notice when another answer begins to wait for this one's memory.
        const Stream::Outcome outcome =
            _stream->sendSome(text, std::min(until, Clock::now() + _shared.settings.hurryTime));
        if (outcome == Stream::Outcome::done) {
            lastTaken = Clock::now();
        } else if (outcome == Stream::Outcome::gone || Clock::now() >= until) {
            abandon(outcome == Stream::Outcome::late && isHurried
                        ? "cut off: others wait for the memory of an answer that is taken too slowly"
                        : "gone before the answer was sent");
        }
    }
}

/** Ends the connection in the middle of an answer in pieces. */
void Exchange::abandon(const std::string& problem) {
    if (!_head.takesChunks) {
        _stream->endWithReset();
    }
    logAccess();
    // If the server has shut the connection down itself, this throws, and nothing is logged.
    enter(State::sending);
    report(problem);
    throw Ended{};
}

void Exchange::logAccess() {
    if (_shared.settings.accessLog) {
        _shared.events.report(fmt::format("{}: {} \"{} {}\" {} {} {:.1f} ms", _connection.address,
                                          _user.empty() ? "-" : printable(_user), printable(_head.method),
                                          printable(_head.target), _status, _sent,
                                          std::chrono::duration<double, std::milli>(Clock::now() - _begin).count()));
    }
}

void Exchange::enter(State state) {
    if (!_shared.connections.enter(_connection, state)) {
        throw Ended{};
    }
}

void Exchange::endLate() {
    if (_received.find('\n') == std::string::npos && !_bodyIsMissing) {
        throw Ended{}; // The connection was idle: there is no request to answer.
    }
    throw HttpError(Status::requestTimeout, fmt::format("the request did not arrive within {} s",
                                                        std::chrono::duration<double>(_limits.requestTime).count()));
}

void Exchange::endEarly() {
    const bool begun = _bodyIsMissing || _received.find('\n') != std::string::npos;
    // If the server has shut the connection down itself, this throws, and nothing is logged.
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

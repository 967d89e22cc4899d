#include "server/Stream.h"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <new>

namespace ObjectManager::Server {

namespace {

constexpr std::size_t pieceSize = std::size_t{16} * 1024;

/** The timeout for poll(): the milliseconds until a time, at least 0. */
int millisecondsUntil(Stream::Clock::time_point until) {
    const auto left = std::chrono::ceil<std::chrono::milliseconds>(until - Stream::Clock::now()).count();
    constexpr std::chrono::milliseconds::rep most = 1'000'000'000;
    return static_cast<int>(std::clamp<std::chrono::milliseconds::rep>(left, 0, most));
}

/** The alert that the client has sent, in words. The TLS library has no words for most numbers that clients may send.
 */
std::string alertOf(gnutls_session_t session) {
    const char* const name = gnutls_alert_get_name(gnutls_alert_get(session));
    return name == nullptr ? "alert " + std::to_string(static_cast<int>(gnutls_alert_get(session))) : name;
}

} // namespace

Stream::Stream(int socket, std::shared_ptr<const TlsKeys> keys) : _socket(socket), _keys(std::move(keys)) {
    if (_keys == nullptr) {
        return;
    }
    gnutls_session_t session = nullptr;
    if (gnutls_init(&session, GNUTLS_SERVER | GNUTLS_NONBLOCK | GNUTLS_NO_SIGNAL) != GNUTLS_E_SUCCESS) {
        throw std::bad_alloc();
    }
    _session.reset(session);
    if (gnutls_priority_set(session, _keys->priorities()) != GNUTLS_E_SUCCESS ||
        gnutls_credentials_set(session, GNUTLS_CRD_CERTIFICATE, _keys->credentials()) != GNUTLS_E_SUCCESS) {
        throw std::bad_alloc();
    }
    gnutls_transport_set_ptr(session, this);
    gnutls_transport_set_pull_function(session, &pull);
    gnutls_transport_set_push_function(session, &push);
}

Stream::~Stream() = default;

ssize_t Stream::pull(gnutls_transport_ptr_t self, void* data, std::size_t size) {
    auto& stream = *static_cast<Stream*>(self);
    const ssize_t received = recv(stream._socket, data, size, MSG_DONTWAIT);
    stream._hasReceived |= received > 0;
    return received;
}

ssize_t Stream::push(gnutls_transport_ptr_t self, const void* data, std::size_t size) {
    return ::send(static_cast<Stream*>(self)->_socket, data, size, MSG_DONTWAIT | MSG_NOSIGNAL);
}

Stream::Outcome Stream::shakeHands(Clock::time_point until,
                                   const std::function<bool(const std::function<void()>& step)>& compute) {
    if (!isEncrypted()) {
        return Outcome::done;
    }
    Outcome outcome = wait(POLLIN, until);
    while (outcome == Outcome::done) {
        int code = GNUTLS_E_SUCCESS;
        if (!compute([&] { code = gnutls_handshake(_session.get()); })) {
            return Outcome::gone;
        }
        if (code == GNUTLS_E_SUCCESS) {
            return Outcome::done;
        }
        outcome = proceed(code, until);
        if (outcome == Outcome::gone) {
            _handshakeProblem = code == GNUTLS_E_FATAL_ALERT_RECEIVED ? "the client refused: " + alertOf(_session.get())
                                                                      : gnutls_strerror(code);
            gnutls_alert_send_appropriate(_session.get(), code);
        }
    }
    return outcome;
}

Stream::Outcome Stream::receive(std::string& to, Clock::time_point until) {
    const std::size_t before = to.size();
    to.resize(before + pieceSize);
    ssize_t size = 0;
    Outcome outcome = Outcome::done;
    do {
        if (isEncrypted()) {
            size = gnutls_record_recv(_session.get(), to.data() + before, pieceSize);
            outcome = size > 0 ? Outcome::done : size == 0 ? Outcome::gone : proceed(size, until);
        } else if (outcome = wait(POLLIN, until); outcome == Outcome::done) {
            size = pull(this, to.data() + before, pieceSize);
            outcome = size > 0 || (size < 0 && (errno == EAGAIN || errno == EINTR)) ? Outcome::done : Outcome::gone;
        }
    } while (size <= 0 && outcome == Outcome::done);
    to.resize(before + static_cast<std::size_t>(std::max<ssize_t>(size, 0)));
    return outcome;
}

Stream::Outcome Stream::send(std::string_view text, std::chrono::milliseconds patience) {
    Outcome outcome = Outcome::done;
    while (!text.empty() && outcome == Outcome::done) {
        outcome = sendSome(text, Clock::now() + patience);
    }
    return outcome;
}

Stream::Outcome Stream::sendSome(std::string_view& text, Clock::time_point until) {
    Outcome outcome = Outcome::done;
    while (outcome == Outcome::done) {
        const ssize_t size = isEncrypted() ? gnutls_record_send(_session.get(), text.data(), text.size())
                                           : push(this, text.data(), text.size());
        if (size > 0) {
            text.remove_prefix(static_cast<std::size_t>(size));
            return Outcome::done;
        }
        if (isEncrypted()) {
            outcome = proceed(size, until);
        } else {
            outcome = errno == EAGAIN || errno == EINTR ? wait(POLLOUT, until) : Outcome::gone;
        }
    }
    return outcome;
}

void Stream::endWithReset() const {
    constexpr linger atOnce{1, 0};
    setsockopt(_socket, SOL_SOCKET, SO_LINGER, &atOnce, sizeof atOnce);
}

void Stream::pause(Clock::time_point until, int wake) const {
    std::array<pollfd, 2> sources = {{{_socket, 0, 0}, {wake, POLLIN, 0}}};
    while (Clock::now() < until && poll(sources.data(), sources.size(), millisecondsUntil(until)) < 0 &&
           errno == EINTR) {
    }
}

bool Stream::isBroken() const {
    pollfd source{_socket, 0, 0};
    return poll(&source, 1, 0) > 0;
}

void Stream::finish(Clock::time_point until) {
    if (isEncrypted()) {
        gnutls_bye(_session.get(), GNUTLS_SHUT_WR);
    }
    shutdown(_socket, SHUT_WR);
    constexpr std::size_t most = std::size_t{1024} * 1024;
    std::array<char, pieceSize> room{};
    for (std::size_t taken = 0; taken < most && wait(POLLIN, until) == Outcome::done;) {
        const ssize_t size = recv(_socket, room.data(), room.size(), MSG_DONTWAIT);
        if (size <= 0) {
            return;
        }
        taken += static_cast<std::size_t>(size);
    }
}

Stream::Outcome Stream::wait(short events, Clock::time_point until) const {
    pollfd source{_socket, events, 0};
    int ready = 0;
    do {
        ready = poll(&source, 1, millisecondsUntil(until));
    } while (ready < 0 && errno == EINTR);
    return ready > 0 ? Outcome::done : ready == 0 ? Outcome::late : Outcome::gone;
}

Stream::Outcome Stream::proceed(ssize_t code, Clock::time_point until) const {
    switch (code) {
    case GNUTLS_E_AGAIN:
        return wait(gnutls_record_get_direction(_session.get()) == 0 ? POLLIN : POLLOUT, until);
    case GNUTLS_E_INTERRUPTED:
        return Clock::now() < until ? Outcome::done : Outcome::late;
    default:
        // This ends connections that ask for new keys, too: a renegotiation costs the server more than the client.
        return Outcome::gone;
    }
}

} // namespace ObjectManager::Server

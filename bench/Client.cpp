#include "Client.h"

#include "System.h"

#include <fcntl.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <stdexcept>
#include <string_view>
#include <thread>

namespace Bench {

namespace {

void requireTls(int status) {
    if (status < 0) {
        throw std::runtime_error(std::string("TLS: ") + gnutls_strerror(status));
    }
}

constexpr std::string_view lineEnd = "\r\n";

/** The position of a chunk's data in a reply that has at least the line with the chunk's size. */
struct Chunk {
    Chunk(const std::string& reply, std::size_t start)
        : data(reply.find(lineEnd, start) + lineEnd.size()),
          size(std::stoul(reply.substr(start, data - start), nullptr, hexadecimal)) {}

    std::size_t end() const { return data + size + lineEnd.size(); }

    static constexpr int hexadecimal = 16;
    std::size_t data;
    std::size_t size;
};

} // namespace

Client::Client(std::uint16_t port, Transport transport) : _socket(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    require(_socket >= 0, "socket");
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    require(connect(_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0, "connect");
    constexpr int yes = 1;
    setsockopt(_socket, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
    if (transport == Transport::tls) {
        shakeHands();
    }
}

/** The name in the certificate does not matter here. */
void Client::shakeHands() {
    gnutls_certificate_credentials_t credentials = nullptr;
    requireTls(gnutls_certificate_allocate_credentials(&credentials));
    _credentials.reset(credentials);
    gnutls_session_t session = nullptr;
    requireTls(gnutls_init(&session, GNUTLS_CLIENT));
    _session.reset(session);
    requireTls(gnutls_set_default_priority(session));
    requireTls(gnutls_credentials_set(session, GNUTLS_CRD_CERTIFICATE, credentials));
    gnutls_transport_set_int(session, _socket);
    requireTls(gnutls_handshake(session));
    fcntl(_socket, F_SETFL, O_NONBLOCK);
}

Client::~Client() {
    close(_socket);
}

void Client::ask(const std::string& request) {
    _received.clear();
    _size = 0;
    _bodySize = 0;
    _nextChunk = 0;
    _begin = Clock::now();
    const ssize_t sent = _session ? gnutls_record_send(_session.get(), request.data(), request.size())
                                  : send(_socket, request.data(), request.size(), MSG_NOSIGNAL);
    require(sent == static_cast<ssize_t>(request.size()), "send");
}

bool Client::take() {
    static std::array<char, 256 * 1024> buffer;
    // A record of TLS that was received and not yet taken wakes nobody, so
    // everything is taken.
    while (_size == 0 || _received.size() < _size) {
        const ssize_t size = _session ? gnutls_record_recv(_session.get(), buffer.data(), buffer.size())
                                      : recv(_socket, buffer.data(), buffer.size(), MSG_DONTWAIT);
        if (_session ? size == GNUTLS_E_AGAIN : size < 0 && errno == EAGAIN) {
            return false;
        }
        require(size > 0, "recv");
        add({buffer.data(), static_cast<std::size_t>(size)});
    }
    return true;
}

void Client::add(std::string_view piece) {
    if (_received.empty()) {
        _firstByte = Clock::now();
    }
    _received.append(piece);
    if (_size == 0) {
        findSize();
    }
    _end = Clock::now();
}

const std::string& Client::answerTo(const std::string& request) {
    ask(request);
    while (!take()) {
        std::this_thread::yield();
    }
    return _received;
}

void Client::findSize() {
    constexpr std::string_view end = "\r\n\r\n";
    constexpr std::string_view length = "Content-Length: ";
    if (_nextChunk == 0) {
        const std::size_t headers = _received.find(end);
        if (headers == std::string::npos) {
            return;
        }
        _bodyStart = headers + end.size();
        const std::size_t found = _received.find(length);
        if (found < headers) {
            _bodySize = std::stoul(_received.substr(found + length.size()));
            _size = _bodyStart + _bodySize;
            return;
        }
        _nextChunk = _bodyStart;
    }
    findChunks();
}

void Client::findChunks() {
    while (_size == 0 && _received.find(lineEnd, _nextChunk) != std::string::npos) {
        const Chunk chunk(_received, _nextChunk);
        if (_received.size() < chunk.end()) {
            return;
        }
        _bodySize += chunk.size;
        _nextChunk = chunk.end();
        if (chunk.size == 0) {
            _size = _nextChunk;
        }
    }
}

std::string Client::body() const {
    if (_nextChunk == 0) {
        return _received.substr(_bodyStart);
    }
    std::string joined;
    for (std::size_t next = _bodyStart; next < _nextChunk;) {
        const Chunk chunk(_received, next);
        joined.append(_received, chunk.data, chunk.size);
        next = chunk.end();
    }
    return joined;
}

} // namespace Bench

#include "HttpClient.h"

#include <gnutls/gnutls.h>

#include <arpa/inet.h>
#include <netdb.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cerrno>
#include <stdexcept>
#include <system_error>
#include <utility>

namespace ServerTest {

namespace {

/** In seconds. */
constexpr int patience = 60;

void require(bool done, const char* what) {
    if (!done) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

/** A call with a time is interrupted also by signals that are nobody's, such as those that stop and continue a process.
 */
ssize_t receiveFrom(int socket, char* data, std::size_t size) {
    ssize_t received = 0;
    do {
        received = recv(socket, data, size, 0);
    } while (received < 0 && errno == EINTR);
    return received;
}

/** What clients need that take any certificate. */
gnutls_certificate_credentials_t anyCertificate() {
    static const gnutls_certificate_credentials_t credentials = [] {
        gnutls_certificate_credentials_t made = nullptr;
        gnutls_certificate_allocate_credentials(&made);
        return made;
    }();
    return credentials;
}

/** Whether a call of the TLS library has to be made again, since it was interrupted or was busy with keys. */
bool isToBeRepeated(ssize_t code) {
    // A time that is over looks like the latter, but with an error of the system.
    return code == GNUTLS_E_INTERRUPTED || (code == GNUTLS_E_AGAIN && errno != EAGAIN);
}

addrinfo* resolve(const std::string& address, std::uint16_t port) {
    addrinfo wanted{};
    wanted.ai_flags = AI_NUMERICHOST;
    wanted.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (getaddrinfo(address.c_str(), std::to_string(port).c_str(), &wanted, &found) != 0) {
        throw std::runtime_error(address + " is no address");
    }
    return found;
}

std::string base64(std::string_view text) {
    constexpr std::string_view digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string result;
    for (std::size_t i = 0; i < text.size(); i += 3) {
        const auto byte = [&](std::size_t at) { return at < text.size() ? static_cast<unsigned char>(text[at]) : 0U; };
        const unsigned int bits = byte(i) << 16U | byte(i + 1) << 8U | byte(i + 2);
        result += digits[bits >> 18U];
        result += digits[bits >> 12U & 63U];
        result += i + 1 < text.size() ? digits[bits >> 6U & 63U] : '=';
        result += i + 2 < text.size() ? digits[bits & 63U] : '=';
    }
    return result;
}

} // namespace

HttpClient::HttpClient(std::uint16_t port, const std::string& to, const std::string& from) {
    addrinfo* const target = resolve(to, port);
    _socket = socket(target->ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
    require(_socket >= 0, "socket");
    const timeval time{patience, 0};
    setsockopt(_socket, SOL_SOCKET, SO_RCVTIMEO, &time, sizeof time);
    setsockopt(_socket, SOL_SOCKET, SO_SNDTIMEO, &time, sizeof time);
    constexpr int yes = 1;
    setsockopt(_socket, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
    if (!from.empty()) {
        addrinfo* const source = resolve(from, 0);
        require(bind(_socket, source->ai_addr, source->ai_addrlen) == 0, "bind");
        freeaddrinfo(source);
    }
    const int connected = connect(_socket, target->ai_addr, target->ai_addrlen);
    const int error = errno;
    freeaddrinfo(target);
    if (connected != 0) {
        close(_socket);
        throw std::system_error(error, std::generic_category(), "connect");
    }
}

HttpClient::HttpClient(HttpClient&& other) noexcept
    : _socket(std::exchange(other._socket, -1)), _session(std::move(other._session)),
      _received(std::move(other._received)), _wasReset(other._wasReset) {}

HttpClient::~HttpClient() {
    if (_socket >= 0) {
        close(_socket);
    }
}

void HttpClient::EndSession::operator()(gnutls_session_int* session) const {
    gnutls_deinit(session);
}

void HttpClient::encrypt() {
    gnutls_session_t session = nullptr;
    gnutls_init(&session, GNUTLS_CLIENT | GNUTLS_NO_SIGNAL);
    _session.reset(session);
    gnutls_set_default_priority(session);
    gnutls_credentials_set(session, GNUTLS_CRD_CERTIFICATE, anyCertificate());
    gnutls_transport_set_int(session, _socket);
    int code = 0;
    do {
        errno = 0;
        code = gnutls_handshake(session);
    } while (isToBeRepeated(code));
    if (code != GNUTLS_E_SUCCESS) {
        throw std::runtime_error(std::string("no TLS: ") + gnutls_strerror(code));
    }
}

std::string HttpClient::certificate() const {
    unsigned int count = 0;
    const gnutls_datum_t* const first = gnutls_certificate_get_peers(_session.get(), &count);
    return {reinterpret_cast<const char*>(first->data), first->size};
}

bool HttpClient::send(std::string_view text) const {
    while (!text.empty()) {
        if (_session) {
            errno = 0;
            const ssize_t sent = gnutls_record_send(_session.get(), text.data(), text.size());
            if (sent < 0 && !isToBeRepeated(sent)) {
                require(sent != GNUTLS_E_AGAIN, "send");
                return false;
            }
            text.remove_prefix(static_cast<std::size_t>(std::max<ssize_t>(sent, 0)));
            continue;
        }
        const ssize_t sent = ::send(_socket, text.data(), text.size(), MSG_NOSIGNAL);
        if (sent < 0 && (errno == EPIPE || errno == ECONNRESET)) {
            return false;
        }
        require(sent >= 0, "send");
        text.remove_prefix(static_cast<std::size_t>(sent));
    }
    return true;
}

std::size_t HttpClient::take(char* data, std::size_t size) const {
    if (_session) {
        ssize_t received = 0;
        do {
            errno = 0;
            received = gnutls_record_recv(_session.get(), data, size);
        } while (isToBeRepeated(received));
        require(received != GNUTLS_E_AGAIN, "recv");
        // Without the end that TLS has, the connection ends as well.
        return static_cast<std::size_t>(std::max<ssize_t>(received, 0));
    }
    const ssize_t received = receiveFrom(_socket, data, size);
    if (received < 0 && errno == ECONNRESET) {
        _wasReset = true;
        return 0;
    }
    require(received >= 0, "recv");
    return static_cast<std::size_t>(received);
}

bool HttpClient::fill() {
    std::array<char, 65536> buffer{};
    const std::size_t size = take(buffer.data(), buffer.size());
    _received.append(buffer.data(), size);
    return size > 0;
}

void HttpClient::requireMore() {
    if (!fill()) {
        throw std::runtime_error("the connection ended after \"" + _received + '"');
    }
}

std::string HttpClient::takeLine() {
    constexpr std::string_view lineEnd = "\r\n";
    std::size_t end = 0;
    while ((end = _received.find(lineEnd)) == std::string::npos) {
        requireMore();
    }
    std::string line = takeBytes(end);
    takeBytes(lineEnd.size());
    return line;
}

std::string HttpClient::takeBytes(std::size_t size) {
    while (_received.size() < size) {
        requireMore();
    }
    std::string bytes = _received.substr(0, size);
    _received.erase(0, size);
    return bytes;
}

std::map<std::string, std::string> HttpClient::takeHeaders() {
    std::map<std::string, std::string> headers;
    for (std::string line = takeLine(); !line.empty(); line = takeLine()) {
        const std::size_t colon = line.find(": ");
        std::string name = line.substr(0, colon);
        std::transform(name.begin(), name.end(), name.begin(), [](unsigned char c) { return std::tolower(c); });
        std::string& value = headers[name];
        value = line.substr(colon + 2);
        value.erase(value.find_last_not_of(' ') + 1);
    }
    return headers;
}

Reply HttpClient::receive() {
    Reply reply;
    const std::string line = takeLine();
    reply.status = std::stoi(line.substr(line.find(' ') + 1));
    reply.headers = takeHeaders();
    if (const auto length = reply.headers.find("content-length"); length != reply.headers.end()) {
        reply.body = takeBytes(std::stoul(length->second));
    } else if (reply.headers.contains("transfer-encoding")) {
        constexpr int hexadecimal = 16;
        while (const std::size_t size = std::stoul(takeLine(), nullptr, hexadecimal)) {
            reply.body += takeBytes(size);
            takeBytes(2);
            ++reply.chunks;
        }
        reply.trailers = takeHeaders();
    } else {
        reply.body = receiveAll();
    }
    return reply;
}

std::string HttpClient::receiveSome(std::size_t most) const {
    std::string text(most, '\0');
    text.resize(take(text.data(), text.size()));
    return text;
}

bool HttpClient::isReadable() const {
    pollfd source{_socket, POLLIN, 0};
    return poll(&source, 1, 0) > 0;
}

std::string HttpClient::receiveAll() {
    while (fill()) {
    }
    return std::exchange(_received, "");
}

void HttpClient::endSending() const {
    if (_session) {
        gnutls_bye(_session.get(), GNUTLS_SHUT_WR);
    }
    shutdown(_socket, SHUT_WR);
}

void HttpClient::reset() {
    const linger atOnce{1, 0};
    setsockopt(_socket, SOL_SOCKET, SO_LINGER, &atOnce, sizeof atOnce);
    close(std::exchange(_socket, -1));
}

std::string post(std::string_view body, std::string_view headers) {
    return "POST /cimom HTTP/1.1\r\nHost: localhost\r\n" + std::string(headers) +
           "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + std::string(body);
}

std::string logInAs(const std::string& user, const std::string& password) {
    return "Authorization: Basic " + base64(user + ":" + password) + "\r\n";
}

} // namespace ServerTest

#include "server/ListenSocket.h"

#include "server/ServerError.h"

#include <arpa/inet.h>
#include <fmt/format.h>
#include <netdb.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <iterator>
#include <memory>
#include <string>
#include <system_error>

namespace ObjectManager::Server {

namespace {

const sockaddr_in& asIpv4(const sockaddr& address) {
    return reinterpret_cast<const sockaddr_in&>(address);
}

const sockaddr_in6& asIpv6(const sockaddr& address) {
    return reinterpret_cast<const sockaddr_in6&>(address);
}

} // namespace

Address::Address(const std::string& text, std::uint16_t port) {
    addrinfo wanted{};
    wanted.ai_flags = AI_NUMERICHOST | AI_NUMERICSERV | AI_PASSIVE;
    wanted.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (getaddrinfo(text.c_str(), std::to_string(port).c_str(), &wanted, &found) != 0) {
        throw ServerError(fmt::format("found the address \"{}\", expected an IPv4 or IPv6 address in numbers", text));
    }
    const std::unique_ptr<addrinfo, decltype(&freeaddrinfo)> owner(found, freeaddrinfo);
    std::memcpy(&_storage, found->ai_addr, found->ai_addrlen);
    _size = found->ai_addrlen;
}

bool Address::isLoopback() const {
    constexpr unsigned int loopbackNetwork = 127;
    constexpr unsigned int networkShift = 24;
    return get()->sa_family == AF_INET
               ? ntohl(asIpv4(*get()).sin_addr.s_addr) >> networkShift == loopbackNetwork
               : memcmp(&asIpv6(*get()).sin6_addr, &in6addr_loopback, sizeof in6addr_loopback) == 0;
}

std::string textOf(const sockaddr& address) {
    std::array<char, INET6_ADDRSTRLEN> text{};
    const void* bytes = nullptr;
    int family = address.sa_family;
    if (family == AF_INET6 && IN6_IS_ADDR_V4MAPPED(&asIpv6(address).sin6_addr)) {
        constexpr std::size_t mappedOffset = 12;
        bytes = &asIpv6(address).sin6_addr.s6_addr[mappedOffset];
        family = AF_INET;
    } else if (family == AF_INET6) {
        bytes = &asIpv6(address).sin6_addr;
    } else {
        bytes = &asIpv4(address).sin_addr;
    }
    return inet_ntop(family, bytes, text.data(), text.size()) == nullptr ? "unknown address" : text.data();
}

std::string networkOf(const sockaddr& address) {
    const std::string text = textOf(address);
    if (text.find(':') == std::string::npos) {
        return text.starts_with("127.") ? "127.0.0.0/8" : text;
    }
    sockaddr_in6 network = asIpv6(address);
    constexpr std::size_t networkBytes = 8;
    std::fill(std::begin(network.sin6_addr.s6_addr) + networkBytes, std::end(network.sin6_addr.s6_addr), 0);
    return textOf(reinterpret_cast<const sockaddr&>(network)) + "/64";
}

std::string hostAndPort(const std::string& address, std::uint16_t port) {
    return address.find(':') == std::string::npos ? fmt::format("{}:{}", address, port)
                                                  : fmt::format("[{}]:{}", address, port);
}

int listenOn(const std::string& address, std::uint16_t port) {
    const Address where(address, port);
    const int listener = socket(where.get()->sa_family, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    constexpr int yes = 1;
    if (listener >= 0 && setsockopt(listener, SOL_SOCKET, SO_REUSEADDR, &yes, sizeof yes) == 0 &&
        bind(listener, where.get(), where.size()) == 0 && listen(listener, SOMAXCONN) == 0) {
        return listener;
    }
    const int error = errno;
    if (listener >= 0) {
        close(listener);
    }
    throw ServerError(
        fmt::format("cannot listen on {}: {}", hostAndPort(address, port), std::generic_category().message(error)));
}

std::uint16_t portOf(int socket) {
    sockaddr_storage address{};
    socklen_t size = sizeof address;
    getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size);
    const auto& bound = reinterpret_cast<const sockaddr&>(address);
    return ntohs(bound.sa_family == AF_INET ? asIpv4(bound).sin_port : asIpv6(bound).sin6_port);
}

} // namespace ObjectManager::Server

/** The socket that clients connect to. */
#ifndef SERVER_LISTENSOCKET_H
#define SERVER_LISTENSOCKET_H

#include <netinet/in.h>

#include <cstdint>
#include <string>

struct sockaddr;

namespace ObjectManager::Server {

/** A numeric IP address. */
class Address {
public:
    /** @throws ServerError if the text is not a numeric address. */
    explicit Address(const std::string& text, std::uint16_t port = 0);

    bool isLoopback() const;
    const sockaddr* get() const { return reinterpret_cast<const sockaddr*>(&_storage); }
    socklen_t size() const { return _size; }

private:
    sockaddr_storage _storage{};
    socklen_t _size = 0;
};

/** The address of a client as text. */
std::string textOf(const sockaddr& address);

/**
 * The network of a client, for limits: its address; but one client can easily have all addresses in 127.0.0.0/8, or all
 * IPv6 addresses with the same first 64 bits, so these count as one network.
 */
std::string networkOf(const sockaddr& address);

/** The address and port in the form that URLs have. */
std::string hostAndPort(const std::string& address, std::uint16_t port);

/** Makes a listening socket, which the caller has to close. @throws ServerError */
int listenOn(const std::string& address, std::uint16_t port);
std::uint16_t portOf(int socket);

} // namespace ObjectManager::Server

#endif

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
    /** @throws ServerError where the text is none. */
    explicit Address(const std::string& text, std::uint16_t port = 0);

    bool isLoopback() const;
    const sockaddr* get() const { return reinterpret_cast<const sockaddr*>(&_storage); }
    socklen_t size() const { return _size; }

private:
    sockaddr_storage _storage{};
    socklen_t _size = 0;
};

/** The address of a client, as people write it. */
std::string textOf(const sockaddr& address);

/**
 * What counts as one client: the address, and where one client can easily have many, their network, which is
 * 127.0.0.0/8 and of IPv6 addresses the first 64 bits.
 */
std::string networkOf(const sockaddr& address);

/** Whose address, with its port, stands in a URL. */
std::string hostAndPort(const std::string& address, std::uint16_t port);

/** The listening socket, which is the caller's. @throws ServerError */
int listenOn(const std::string& address, std::uint16_t port);
std::uint16_t portOf(int socket);

} // namespace ObjectManager::Server

#endif

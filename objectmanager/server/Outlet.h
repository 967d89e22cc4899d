/** Where an answer goes that is too large to be held as a whole. */
#ifndef SERVER_OUTLET_H
#define SERVER_OUTLET_H

#include <cstddef>
#include <string_view>

namespace ObjectManager::Server {

struct HttpReply;

/**
 * Sends an answer while it is made: its status and headers with the first piece of the body, then piece after piece. It
 * waits for the client, so that whoever makes the answer goes no faster than the client takes it.
 *
 * What it throws tells that nobody takes the answer any more. It is no std::exception and meant for the server: those
 * who make the answer let it pass.
 */
class Outlet {
public:
    /** How many bytes of a body are gathered before they are sent. A body with fewer is returned as a whole. */
    static constexpr std::size_t pieceBytes = std::size_t{64} * 1024;

    Outlet() = default;
    Outlet(const Outlet&) = delete;
    Outlet& operator=(const Outlet&) = delete;
    virtual ~Outlet() = default;

    /**
     * Says how many bytes the memory has, altogether, that the answer is made of; waits until there is room for them.
     * All of it counts until the answer has been sent.
     */
    virtual void hold(std::size_t bytes) = 0;

    /** Sends the first piece, which is the body of `reply`. From here on the answer cannot become another. */
    virtual void begin(const HttpReply& reply) = 0;

    /** Sends another piece. */
    virtual void send(std::string_view piece) = 0;
};

} // namespace ObjectManager::Server

#endif

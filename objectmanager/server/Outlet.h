/** Where an answer goes that is too large to be held as a whole. */
#ifndef SERVER_OUTLET_H
#define SERVER_OUTLET_H

#include <cstddef>
#include <string_view>

namespace ObjectManager::Server {

struct HttpReply;

/**
 * Sends an answer while it is being made: the status and headers with the first piece of the body, then piece after
 * piece. Every function waits for the client, so that the answer is made no faster than the client takes it.
 *
 * If the client no longer takes the answer, the functions throw an object that is no std::exception. Only the server
 * catches it: code that makes an answer must let it pass.
 */
class Outlet {
public:
    /** The size of a piece in bytes. A smaller body is returned as a whole. */
    static constexpr std::size_t pieceBytes = std::size_t{64} * 1024;

    Outlet() = default;
    Outlet(const Outlet&) = delete;
    Outlet& operator=(const Outlet&) = delete;
    virtual ~Outlet() = default;

    /**
     * Reserves memory: waits until the answer may have `bytes` in all, in objects and text. The largest number counts
     * until the answer has been sent.
     */
    virtual void hold(std::size_t bytes) = 0;

    /** Sends the status, the headers and, as the first piece, the body of `reply`. The status is then final. */
    virtual void begin(const HttpReply& reply) = 0;

    /** Sends another piece. */
    virtual void send(std::string_view piece) = 0;
};

} // namespace ObjectManager::Server

#endif

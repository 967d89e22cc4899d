/** An HTTP server in front of a function that answers requests. */
#ifndef SERVER_HTTPSERVER_H
#define SERVER_HTTPSERVER_H

#include "server/Connections.h"
#include "server/HttpMessage.h"
#include "server/LogIns.h"
#include "server/Settings.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <stdexcept>

namespace ObjectManager::Server {

/** Called by several threads at once; must not throw. */
using Handler = std::function<HttpReply(const HttpRequest&, const Caller&)>;

/** A server that cannot be started. what() is one line. */
class ServerError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/**
 * Serves from when it is made until it ends.
 *
 * Clients are served by threads of its own: two wait for them, some run the handler, some ask the authenticator. What a
 * client does wrong, and what it is refused, is logged in one line.
 */
class HttpServer {
public:
    /**
     * @param authenticator is asked about every client; where it is null, everybody may do everything. Outlives the
     *        server.
     * @throws ServerError
     */
    HttpServer(const Settings& settings, Handler handler, Authenticator* authenticator, Log log);
    HttpServer(const HttpServer&) = delete;
    HttpServer& operator=(const HttpServer&) = delete;
    /** Accepts no more connections, sends the answers that are under way, and ends. */
    ~HttpServer();

    std::uint16_t port() const;

private:
    class Implementation;
    std::unique_ptr<Implementation> _implementation;
};

} // namespace ObjectManager::Server

#endif

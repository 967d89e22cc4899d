/** An HTTP server in front of a function that answers requests. */
#ifndef SERVER_HTTPSERVER_H
#define SERVER_HTTPSERVER_H

#include "server/EventLog.h"
#include "server/HttpMessage.h"
#include "server/LogIns.h"
#include "server/ServerError.h"
#include "server/Settings.h"

#include <cstdint>
#include <memory>
#include <string>

namespace ObjectManager::Server {

/**
 * Serves from when it is made until it ends.
 *
 * One thread accepts connections, and each connection has a thread of its own. What a client does wrong, and what it is
 * refused, is logged in one line.
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
    /** Stops it, and waits for every handler that still runs, however long that takes. */
    ~HttpServer();

    std::uint16_t port() const;

    /**
     * Accepts no more connections, sends the answers that are under way, and closes the others, within the settings'
     * stopTime and a second.
     * @return false where a handler, or the authenticator, still runs then.
     */
    bool stop();

    /**
     * Reads the certificate and its key again. New connections get them; where they are wrong, the old ones stay, and
     * the log says so.
     */
    void renewKeys();

    /** In one line, what it does and has done. */
    std::string health() const;

private:
    class Implementation;
    std::unique_ptr<Implementation> _implementation;
};

} // namespace ObjectManager::Server

#endif

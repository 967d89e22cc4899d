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
 * Serves clients from its construction until it is stopped or destroyed.
 *
 * One thread accepts connections, and each connection has a thread of its own. Mistakes and refused requests of clients
 * are logged, each in one line.
 */
class HttpServer {
public:
    /**
     * @param authenticator checks the log-in of every client; if it is null, every client may do everything. It must
     *        outlive the server.
     * @throws ServerError
     */
    HttpServer(const Settings& settings, Handler handler, Authenticator* authenticator, Log log);
    HttpServer(const HttpServer&) = delete;
    HttpServer& operator=(const HttpServer&) = delete;
    /** Stops the server, and waits for every handler that still runs, however long that takes. */
    ~HttpServer();

    std::uint16_t port() const;

    /**
     * Accepts no more connections, sends the answers that are under way, and closes the others, within the settings'
     * stopTime and a second.
     * @return false if a handler or the authenticator still runs after this time.
     */
    bool stop();

    /**
     * Reads the certificate and its key again. New connections use them; if the new files are wrong, the old ones stay
     * in use, and the log says so.
     */
    void renewKeys();

    /** One line with the numbers of connections, requests and log-ins. */
    std::string health() const;

private:
    class Implementation;
    std::unique_ptr<Implementation> _implementation;
};

} // namespace ObjectManager::Server

#endif

/** The names that clients may use for the server. */
#ifndef SERVER_HOSTS_H
#define SERVER_HOSTS_H

#include "server/TlsKeys.h"

#include <set>
#include <string>
#include <vector>

namespace ObjectManager::Server {

/**
 * Checks the host that a request names. A page in a user's browser can reach the server by a name of the page's author
 * that leads to the server's address (DNS rebinding). So a request must name a numeric address, or a name of the
 * server.
 */
class Hosts {
public:
    /** @param others names that are accepted beside the machine's and localhost. */
    explicit Hosts(const std::vector<std::string>& others);

    /**
     * Whether the server has a name. @param name in the form that hostNameOf returns.
     * @param keys the certificate, whose names are accepted, too; null without TLS.
     */
    bool areCalled(const std::string& name, const TlsKeys* keys) const;

private:
    std::set<std::string> _names;
};

} // namespace ObjectManager::Server

#endif

/** By which names clients may call the server. */
#ifndef SERVER_HOSTS_H
#define SERVER_HOSTS_H

#include "server/TlsKeys.h"

#include <set>
#include <string>
#include <vector>

namespace ObjectManager::Server {

/**
 * A page in somebody's browser can reach a server by a name of its author's that leads to the server's address: so a
 * request has to name an address in numbers, or a name that is the server's.
 */
class Hosts {
public:
    /** @param others names beside the machine's and localhost. */
    explicit Hosts(const std::vector<std::string>& others);

    /**
     * @param name as hostNameOf gives it.
     * @param keys null where there are none.
     */
    bool areCalled(const std::string& name, const TlsKeys* keys) const;

private:
    std::set<std::string> _names;
};

} // namespace ObjectManager::Server

#endif

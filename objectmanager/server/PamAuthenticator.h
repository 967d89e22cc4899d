/** Log-ins of the system's users. */
#ifndef SERVER_PAMAUTHENTICATOR_H
#define SERVER_PAMAUTHENTICATOR_H

#include "server/LogIns.h"
#include "server/Settings.h"

#include <string>
#include <utility>

namespace ObjectManager::Server {

/** Checks passwords with PAM, and derives rights from the user's groups. */
class PamAuthenticator final : public Authenticator {
public:
    explicit PamAuthenticator(PamSettings settings) : _settings(std::move(settings)) {}

    LogIn logIn(const std::string& user, const std::string& password, const std::string& address) override;

private:
    const PamSettings _settings;
};

/** Whether the system has a group of that name. */
bool groupExists(const std::string& name);

} // namespace ObjectManager::Server

#endif

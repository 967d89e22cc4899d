/** Who a client is, and what he may do. */
#ifndef SERVER_LOGINS_H
#define SERVER_LOGINS_H

#include "server/HttpMessage.h"

#include <array>
#include <chrono>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager::Server {

struct LogIn {
    /** Nothing where the log-in failed. */
    std::optional<Caller> caller;
    /** Why it failed, for the person who runs the server. */
    std::string problem;
};

struct Credentials {
    std::string user;
    std::string password;
};

/**
 * What the value of the header Authorization gives for HTTP's scheme Basic (RFC 7617); nothing where it is of another
 * scheme or wrong, or has a character that no log-in can have.
 */
std::optional<Credentials> credentialsOf(std::string_view authorization);

/** Decides on log-ins. Used by several threads at once. */
class Authenticator {
public:
    Authenticator() = default;
    Authenticator(const Authenticator&) = delete;
    Authenticator& operator=(const Authenticator&) = delete;
    virtual ~Authenticator() = default;

    /** May take its time. @param address the client's. */
    virtual LogIn logIn(const std::string& user, const std::string& password, const std::string& address) = 0;
};

/**
 * Log-ins that succeeded lately, since clients send their password with every request and it is expensive to check.
 * Keeps no password, only what tells whether the same one comes again. Used by several threads at once.
 */
class RecentLogIns {
public:
    using Clock = std::chrono::steady_clock;
    static constexpr std::chrono::seconds lifetime{30};
    static constexpr std::size_t capacity = 1000;

    RecentLogIns();

    std::optional<Caller> find(const std::string& user, const std::string& password,
                               Clock::time_point now = Clock::now());
    void remember(const std::string& user, const std::string& password, const Caller& caller,
                  Clock::time_point now = Clock::now());

private:
    using Digest = std::array<unsigned char, 32>;

    struct Entry {
        Caller caller;
        Clock::time_point until;
    };

    Digest digestOf(const std::string& user, const std::string& password) const;

    Digest _secret{};
    std::mutex _mutex;
    std::map<Digest, Entry> _entries;
};

} // namespace ObjectManager::Server

#endif

/** Who a client is, and what he may do. */
#ifndef SERVER_LOGINS_H
#define SERVER_LOGINS_H

#include "server/HttpMessage.h"
#include "server/Turns.h"

#include <array>
#include <atomic>
#include <chrono>
#include <functional>
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
 * Log-ins that succeeded, since clients send their password with every request and it is expensive to check. Keeps no
 * password, only what tells whether the same one comes again. Used by several threads at once.
 */
class RecentLogIns {
public:
    using Clock = std::chrono::steady_clock;
    /** For how long a log-in is good after its last use, and after it was checked. */
    static constexpr std::chrono::seconds lifetime{30};
    static constexpr std::chrono::minutes longestLifetime{5};
    /** For how long it is known that a log-in was good. */
    static constexpr std::chrono::hours memory{24};
    static constexpr std::size_t capacity = 1000;

    RecentLogIns();

    /** The caller where the log-in need not be checked, which renews it. */
    std::optional<Caller> find(const Credentials& given, Clock::time_point now = Clock::now());
    /** Whether the log-in was good the last time that it was checked. */
    bool isKnown(const Credentials& given, Clock::time_point now = Clock::now());
    /** Where there are too many, the one that was used longest ago is forgotten. */
    void remember(const Credentials& given, const Caller& caller, Clock::time_point now = Clock::now());
    void forget(const Credentials& given);

private:
    using Digest = std::array<unsigned char, 32>;

    struct Entry {
        Caller caller;
        Clock::time_point checked;
        Clock::time_point used;
    };

    Digest digestOf(const Credentials& given) const;

    Digest _secret{};
    std::mutex _mutex;
    std::map<Digest, Entry> _entries;
};

/**
 * Decides whom the server lets in. Who was let in lately is not checked again; the others are, a few at a time, which
 * the networks take in turns, users who were good before ahead of strangers. Used by several threads at once.
 */
class LogIns {
public:
    using Clock = std::chrono::steady_clock;

    /** Where and how a log-in is asked for. */
    struct Client {
        const std::string& address;
        const std::string& network;
        /** Whether the client has gone, and the log-in need not be checked. */
        std::function<bool()> isGone;
    };

    enum class Verdict {
        in,
        wrong,
        /** Too many wait already, or it took too long. */
        busy,
    };

    struct Decision {
        Verdict verdict;
        std::optional<Caller> caller{};
        /** Why it is wrong, for the person who runs the server. */
        std::string problem{};
        /** When the client may learn that it is wrong: the same for a wrong password and a user who does not exist. */
        Clock::time_point answerAt{};
    };

    /**
     * @param authenticator outlives this.
     * @param delay after which a wrong log-in is answered; what takes longer is answered after twice as long, and so
     * on.
     */
    LogIns(Authenticator& authenticator, std::chrono::milliseconds delay);

    /** Where it need not be checked. */
    std::optional<Caller> recent(const Credentials& given) { return _recent.find(given); }
    /** Waits for its turn, and checks. @param until when waiting for the turn ends. */
    Decision check(const Credentials& given, const Client& client, Clock::time_point until);

    /** Nothing is checked any more; those who wait are told that it is busy. */
    void close() { _turns.close(); }

    struct Counts {
        std::size_t good;
        std::size_t wrong;
    };
    /** Of those that were checked since the start. */
    Counts counts() const { return {_good, _wrong}; }

private:
    Authenticator& _authenticator;
    const std::chrono::milliseconds _delay;
    RecentLogIns _recent;
    Turns _turns;
    std::atomic<std::size_t> _good = 0;
    std::atomic<std::size_t> _wrong = 0;
};

} // namespace ObjectManager::Server

#endif

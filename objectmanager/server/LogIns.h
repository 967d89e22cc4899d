/** Log-ins: which user a client is, and which rights the user has. */
#ifndef SERVER_LOGINS_H
#define SERVER_LOGINS_H

#include "server/HttpMessage.h"
#include "server/Turns.h"

#include <gnutls/crypto.h>

#include <array>
#include <atomic>
#include <chrono>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager::Server {

struct LogIn {
    /** The user and his rights; no value if the log-in failed. */
    std::optional<Caller> caller;
    /** Why the log-in failed, for the person who runs the server. */
    std::string problem;
};

struct Credentials {
    std::string user;
    std::string password;
};

/**
 * The user and password in the value of the header Authorization, in HTTP's scheme Basic (RFC 7617). No value if it has
 * another scheme, is malformed, or contains a character that no log-in can have.
 */
std::optional<Credentials> credentialsOf(std::string_view authorization);

/** Checks log-ins. Used by several threads at once. */
class Authenticator {
public:
    Authenticator() = default;
    Authenticator(const Authenticator&) = delete;
    Authenticator& operator=(const Authenticator&) = delete;
    virtual ~Authenticator() = default;

    /** Checks a log-in, which may take long. @param address the client's address. */
    virtual LogIn logIn(const std::string& user, const std::string& password, const std::string& address) = 0;
};

/**
 * Remembers successful log-ins, since clients send their password with every request and checking it is expensive. It
 * does not keep passwords, but keyed digests that tell whether the same password comes again. Used by several threads
 * at once.
 */
class RecentLogIns {
public:
    using Clock = std::chrono::steady_clock;
    /** How long a log-in stays valid without another check: after its last use, and after its last check. */
    static constexpr std::chrono::seconds lifetime{30};
    static constexpr std::chrono::minutes longestLifetime{5};
    /** How long the server remembers that a log-in was correct. */
    static constexpr std::chrono::hours memory{24};
    static constexpr std::size_t capacity = 1000;

    RecentLogIns();

    /** The caller, if the log-in is still valid; then its last use is now. */
    std::optional<Caller> find(const Credentials& given, Clock::time_point now = Clock::now());
    /** Whether the log-in was correct when it was last checked. */
    bool isKnown(const Credentials& given, Clock::time_point now = Clock::now());
    /** Remembers a log-in that was checked. If there are too many, forgets the one that was used longest ago. */
    void remember(const Credentials& given, const Caller& caller, Clock::time_point now = Clock::now());
    void forget(const Credentials& given);

private:
    using Digest = std::array<unsigned char, 32>;

    struct Entry {
        Caller caller;
        Clock::time_point checked;
        Clock::time_point used;
    };

    struct HmacFree {
        void operator()(hmac_hd_st* hmac) const { gnutls_hmac_deinit(hmac, nullptr); }
    };
    using Hmac = std::unique_ptr<hmac_hd_st, HmacFree>;

    Digest digestOf(const Credentials& given) const;

    /** An HMAC with a random key and without text. Each digest begins with a copy, which is cheaper than the key. */
    Hmac _keyed;
    std::mutex _mutex;
    std::map<Digest, Entry> _entries;
};

/**
 * Decides on the log-ins of clients. A recent log-in is not checked again. Other log-ins are checked, a few at the same
 * time: networks take turns, and users whose password was correct before come before strangers. Used by several threads
 * at once.
 */
class LogIns {
public:
    using Clock = std::chrono::steady_clock;

    /** The client that logs in. */
    struct Client {
        const std::string& address;
        const std::string& network;
        /** Whether the client has closed the connection, so that the log-in need not be checked. */
        std::function<bool()> isGone;
    };

    enum class Verdict {
        in,
        wrong,
        /** Too many log-ins wait already, or the turn did not come in time. */
        busy,
    };

    struct Decision {
        Verdict verdict;
        std::optional<Caller> caller{};
        /** Why the log-in is wrong, for the person who runs the server. */
        std::string problem{};
        /**
         * When to answer that the log-in is wrong: this time does not tell a wrong password from a user that does not
         * exist.
         */
        Clock::time_point answerAt{};
    };

    /**
     * @param authenticator must outlive this object.
     * @param delay the time after which a wrong log-in is answered. If the check takes longer, the answer is sent after
     * the next multiple of it.
     */
    LogIns(Authenticator& authenticator, std::chrono::milliseconds delay);

    /** The caller, if the log-in need not be checked. */
    std::optional<Caller> recent(const Credentials& given) { return _recent.find(given); }
    /** Waits for a turn, and checks the log-in. @param until when waiting for the turn ends. */
    Decision check(const Credentials& given, const Client& client, Clock::time_point until);

    /** Ends all checks: log-ins that wait for a turn get the verdict `busy`. */
    void close() { _turns.close(); }

    struct Counts {
        std::size_t good;
        std::size_t wrong;
    };
    /** How many of the log-ins that were checked since the start were correct, and how many wrong. */
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

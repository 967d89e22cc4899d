/** The requests of one connection and their answers. */
#ifndef SERVER_EXCHANGE_H
#define SERVER_EXCHANGE_H

#include "server/AnswerMemory.h"
#include "server/Budget.h"
#include "server/Connections.h"
#include "server/Hosts.h"
#include "server/HttpMessage.h"
#include "server/HttpParser.h"
#include "server/LogIns.h"
#include "server/Settings.h"
#include "server/Stream.h"
#include "server/Turns.h"

#include <atomic>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

namespace ObjectManager::Server {

/** What the connections share. */
struct Shared {
    Shared(Settings given, Handler function, Authenticator* authenticator, Log log);

    const Settings settings;
    const Handler handler;
    EventLog events;
    Connections connections;
    const Hosts hosts;
    /** For the steps of TLS's handshakes, which cost the processor much. */
    Turns handshakes;
    Turns answers;
    Budget bodies;
    AnswerMemory answerMemory;
    /** Nothing where everybody may do everything. */
    std::optional<LogIns> logIns;
    std::atomic<bool> stopping = false;
    std::atomic<std::size_t> requests = 0;
    /** Readable from when the server stops. */
    int stop = -1;

    /** The keys for new connections; null without TLS. */
    std::shared_ptr<const TlsKeys> keys();
    void setKeys(std::shared_ptr<const TlsKeys> keys);

private:
    std::mutex _mutex;
    std::shared_ptr<const TlsKeys> _keys;
};

/**
 * One connection, from its first byte to its last, in the thread that runs it. It waits for its client, for its turn,
 * for the authenticator and for the handler, and holds up nobody meanwhile.
 */
class Exchange final : private Outlet {
public:
    /** Both outlive it. */
    Exchange(Shared& shared, Connections::Connection& connection);

    /** Returns when the connection is to be closed. */
    void run() noexcept;

private:
    using Clock = std::chrono::steady_clock;
    using State = Connections::State;

    /** Thrown where the connection is to be closed, and whatever there is to say has been said. */
    struct Ended {};

    void shakeHands();
    /** @return false where the connection is to be closed. */
    bool serve();

    void readHead();
    void check() const;
    Caller logIn();
    /** @param share of the memory for all bodies; where it is null, the body is thrown away. */
    void readBody(Budget::Share* share);
    void readMore(std::string& to);
    /** Takes the body of a request that has been answered without it. */
    void skipBody();
    HttpReply answer(const Caller& caller);
    /** Sends an answer as a whole. */
    void sendWhole(HttpReply reply, bool keepAlive);

    /* An answer in pieces. */
    void hold(std::size_t bytes) override;
    void begin(const HttpReply& reply) override;
    void send(std::string_view piece) override;
    /** Sends the rest of an answer that has begun. */
    void finish(const HttpReply& rest);
    void breakOff(const HttpReply& rest);
    void append(std::string& text, std::string_view piece);
    void deliver(std::string_view text);
    [[noreturn]] void abandon(const std::string& problem);
    void logAccess();

    /** @throws Ended where the connection has been shut down. */
    void enter(State state);
    [[noreturn]] void endLate();
    [[noreturn]] void endEarly();
    void report(const std::string& what);

    Shared& _shared;
    const Limits& _limits;
    Connections::Connection& _connection;
    std::optional<Stream> _stream;
    /** What has come and is not taken yet. */
    std::string _received;
    /** A line of a request has come on this connection. */
    bool _asked = false;

    /* Of the request. */
    RequestHead _head;
    /** When it has to be here. */
    Clock::time_point _until;
    Clock::time_point _begin;
    std::string _user;
    std::string _body;
    /** The body, or its rest, has still to be taken from what comes. */
    bool _bodyIsMissing = false;

    /* Of its answer. */
    std::optional<Turns::Turn> _turn;
    std::optional<AnswerMemory::Share> _memory;
    /** It goes to the client in pieces, and the first is gone. */
    bool _begun = false;
    /** Whether the connection stays open behind an answer in pieces. */
    bool _keepAlive = false;
    unsigned int _status = 0;
    /** Bytes of the body. */
    std::size_t _sent = 0;
};

} // namespace ObjectManager::Server

#endif

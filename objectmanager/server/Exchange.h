/** Serves one connection: reads its requests and sends their answers. */
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
#include <string_view>

namespace ObjectManager::Server {

/** What all connections of a server share. */
struct Shared {
    Shared(Settings given, Handler function, Authenticator* authenticator, Log log);

    const Settings settings;
    const Handler handler;
    EventLog events;
    Connections connections;
    const Hosts hosts;
    /** Turns for the steps of TLS handshakes, which need much processor time. */
    Turns handshakes;
    Turns answers;
    Budget bodies;
    AnswerMemory answerMemory;
    /** No value if nobody has to log in and every client may do everything. */
    std::optional<LogIns> logIns;
    std::atomic<bool> stopping = false;
    std::atomic<std::size_t> requests = 0;
    /** A descriptor that becomes readable when the server stops. */
    int stop = -1;

    /** The keys for new connections; null without TLS. */
    std::shared_ptr<const TlsKeys> keys();
    void setKeys(std::shared_ptr<const TlsKeys> keys);

private:
    std::mutex _mutex;
    std::shared_ptr<const TlsKeys> _keys;
};

/**
 * One connection, from its first byte to its last, in the thread that calls `run`. This thread waits for the client,
 * for turns, for the authenticator and for the handler, without delaying other connections.
 */
class Exchange final : private Outlet {
public:
    /** Both arguments must outlive this object. */
    Exchange(Shared& shared, Connections::Connection& connection);

    /** Serves the connection, and returns when it has to be closed. */
    void run() noexcept;

private:
    using Clock = std::chrono::steady_clock;
    using State = Connections::State;

    /** Thrown when the connection has to be closed without another answer. */
    struct Ended {};

    /** A request's body with its share of the memory for all of them. Connections that wait for a request have none. */
    struct Body {
        Budget::Share share;
        std::string text;
    };

    void shakeHands();
    /** Serves one request. @return false if the connection has to be closed. */
    bool serve();

    void readHead();
    void check() const;
    Caller logIn();
    /** @param to where the body is kept; if it is null, the body is read and dropped. */
    void readBody(Body* to);
    void readMore(std::string& to);
    /** Reads and drops the body of a request that was answered before its body was read. */
    void skipBody();
    HttpReply answer(const Caller& caller, std::string_view body);
    /** Sends an answer as a whole. */
    void sendWhole(HttpReply reply, bool keepAlive);

    /* Sending an answer in pieces. */
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

    /** Changes the connection's state. @throws Ended if the server has shut the connection down. */
    void enter(State state);
    [[noreturn]] void endLate();
    [[noreturn]] void endEarly();
    void report(const std::string& what);

    Shared& _shared;
    const Limits& _limits;
    Connections::Connection& _connection;
    std::optional<Stream> _stream;
    /** The bytes that were received and not yet read as part of a request. */
    std::string _received;
    /** Whether a request has arrived on this connection, at least its first line and headers. */
    bool _asked = false;

    /* The request. */
    RequestHead _head;
    /** When the request must have arrived as a whole. */
    Clock::time_point _until;
    Clock::time_point _begin;
    std::string _user;
    /** Whether the body, or a part of it, has still to be read. */
    bool _bodyIsMissing = false;

    /* The answer. */
    std::optional<Turns::Turn> _turn;
    std::optional<AnswerMemory::Share> _memory;
    /** Whether the answer is sent in pieces, and the first piece was sent. */
    bool _begun = false;
    /** Whether the connection stays open after an answer in pieces. */
    bool _keepAlive = false;
    unsigned int _status = 0;
    /** How many bytes of the answer's body were sent. */
    std::size_t _sent = 0;
};

} // namespace ObjectManager::Server

#endif

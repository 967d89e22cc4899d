/** A client's connection as a stream of bytes. */
#ifndef SERVER_STREAM_H
#define SERVER_STREAM_H

#include "server/TlsKeys.h"

#include <gnutls/gnutls.h>

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

namespace ObjectManager::Server {

/** In the clear, or with TLS. Whatever it does ends when its time is over, or when the socket is shut down. */
class Stream {
public:
    using Clock = std::chrono::steady_clock;

    enum class Outcome {
        done,
        /** The time is over. */
        late,
        /** The other end has closed the connection, or what came is not TLS. */
        gone,
    };

    /**
     * @param socket stays the caller's, and open for longer than this.
     * @param keys null for a stream in the clear.
     * @throws std::bad_alloc
     */
    Stream(int socket, std::shared_ptr<const TlsKeys> keys);
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;
    ~Stream();

    bool isEncrypted() const { return _session != nullptr; }

    /**
     * Agrees with the client on keys; does nothing in the clear.
     * @param compute runs a step of it, which takes the processor's time and no other; false where that is not to be.
     */
    Outcome shakeHands(Clock::time_point until, const std::function<bool(const std::function<void()>& step)>& compute);

    /** Why client and server could not agree, in the words of the TLS library; empty where they could, or time ran out.
     */
    const std::string& handshakeProblem() const { return _handshakeProblem; }

    /** Waits for bytes, and appends them. */
    Outcome receive(std::string& to, Clock::time_point until);

    /** @param patience for how long the client may take nothing. */
    Outcome send(std::string_view text, std::chrono::milliseconds patience);

    /** Sends as much of the text as the client takes at once, and removes that from it. Waits where it takes nothing.
     */
    Outcome sendSome(std::string_view& text, Clock::time_point until);

    /**
     * The end of the connection will be a reset, by which the client sees that it did not get everything. For what has
     * no other end than the connection's.
     */
    void endWithReset();

    /** Waits until the time is over, the connection is broken, or `wake` is readable. */
    void pause(Clock::time_point until, int wake) const;

    /** Whether the connection is broken. A client that only has nothing more to send is there. */
    bool isBroken() const;

    /** Says that nothing more comes, and takes what the client still sends, so that it can read what was sent. */
    void finish(Clock::time_point until);

    /** Whether anything has come, in whatever form. */
    bool hasReceived() const { return _hasReceived; }

private:
    struct EndSession {
        void operator()(gnutls_session_t session) const { gnutls_deinit(session); }
    };

    static ssize_t pull(gnutls_transport_ptr_t self, void* data, std::size_t size);
    static ssize_t push(gnutls_transport_ptr_t self, const void* data, std::size_t size);
    /** Waits until the socket is ready for the events. */
    Outcome wait(short events, Clock::time_point until) const;
    /** What a code of the TLS library other than a size asks for. */
    Outcome proceed(ssize_t code, Clock::time_point until) const;

    const int _socket;
    const std::shared_ptr<const TlsKeys> _keys;
    std::unique_ptr<std::remove_pointer_t<gnutls_session_t>, EndSession> _session;
    bool _hasReceived = false;
    std::string _handshakeProblem;
};

} // namespace ObjectManager::Server

#endif

/** The bytes of a client's connection, in the clear or in TLS. */
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

/** A stream in the clear or in TLS. Every function returns when its time is over or the socket is shut down. */
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
     * @param socket belongs to the caller, and must stay open longer than this object exists.
     * @param keys null for a stream in the clear.
     * @throws std::bad_alloc
     */
    Stream(int socket, std::shared_ptr<const TlsKeys> keys);
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;
    ~Stream();

    bool isEncrypted() const { return _session != nullptr; }

    /**
     * Carries out the TLS handshake; does nothing in the clear.
     * @param compute is called with each step, which needs processor time and never waits; it runs the step, or returns
     *        false to end the handshake.
     */
    Outcome shakeHands(Clock::time_point until, const std::function<bool(const std::function<void()>& step)>& compute);

    /** Why the handshake failed, in the words of the TLS library; empty if it succeeded or its time was over. */
    const std::string& handshakeProblem() const { return _handshakeProblem; }

    /** Waits for bytes, and appends them to `to`. */
    Outcome receive(std::string& to, Clock::time_point until);

    /** Sends the whole text. @param patience how long the client may take nothing of it. */
    Outcome send(std::string_view text, std::chrono::milliseconds patience);

    /** Waits until the client takes a part of the text, and removes that part from the front of `text`. */
    Outcome sendSome(std::string_view& text, Clock::time_point until);

    /**
     * Makes the connection end with a reset, which tells the client that the answer is incomplete. Needed for an answer
     * whose end is the end of the connection.
     */
    void endWithReset() const;

    /** Waits until the time is over, the connection is broken, or the descriptor `wake` is readable. */
    void pause(Clock::time_point until, int wake) const;

    /** Whether the connection is broken. It is not if the client has only closed its sending direction. */
    bool isBroken() const;

    /** Ends the sending direction, and drops what the client still sends until it closes or the time is over. */
    void finish(Clock::time_point until);

    /** Whether the client has sent any byte during the handshake or later. */
    bool hasReceived() const { return _hasReceived; }

private:
    struct EndSession {
        void operator()(gnutls_session_t session) const { gnutls_deinit(session); }
    };

    static ssize_t pull(gnutls_transport_ptr_t self, void* data, std::size_t size);
    static ssize_t push(gnutls_transport_ptr_t self, const void* data, std::size_t size);
    /** Waits until the socket is ready for the events. */
    Outcome wait(short events, Clock::time_point until) const;
    /** Waits as an error code of the TLS library requires; `gone` if the code is final. */
    Outcome proceed(ssize_t code, Clock::time_point until) const;

    const int _socket;
    const std::shared_ptr<const TlsKeys> _keys;
    std::unique_ptr<std::remove_pointer_t<gnutls_session_t>, EndSession> _session;
    bool _hasReceived = false;
    std::string _handshakeProblem;
};

} // namespace ObjectManager::Server

#endif

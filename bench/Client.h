/** A client that uses as little processor time as possible. */
#ifndef BENCH_CLIENT_H
#define BENCH_CLIENT_H

#include <gnutls/gnutls.h>

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace Bench {

using Clock = std::chrono::steady_clock;

enum class Transport { plain, tls };

/** A connection that sends the same request again and again. */
class Client {
public:
    explicit Client(std::uint16_t port, Transport transport = Transport::plain);
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;
    ~Client();

    int socketNumber() const { return _socket; }

    void ask(const std::string& request);

    /** Takes the bytes that have arrived. @return whether the reply is complete. */
    bool take();

    /** Sends the request, and waits for the whole reply without sleeping. */
    const std::string& answerTo(const std::string& request);

    const std::string& reply() const { return _received; }
    /** The body of the reply, with its chunks joined. The headers are left out: one has the time that it took. */
    std::string body() const;
    std::size_t bodySize() const { return _bodySize; }
    /** The time until the reply was complete, in milliseconds. */
    double latency() const { return Milliseconds(_end - _begin).count(); }
    double firstByte() const { return Milliseconds(_firstByte - _begin).count(); }

private:
    using Milliseconds = std::chrono::duration<double, std::milli>;
    template <auto Free>
    struct Freed {
        template <typename Object>
        void operator()(Object* object) const {
            Free(object);
        }
    };

    void shakeHands();
    void add(std::string_view piece);
    void findSize();
    /** Walks from chunk to chunk as far as they have arrived. */
    void findChunks();

    int _socket;
    std::unique_ptr<gnutls_certificate_credentials_st, Freed<gnutls_certificate_free_credentials>> _credentials;
    /** Null without TLS. */
    std::unique_ptr<gnutls_session_int, Freed<gnutls_deinit>> _session;
    std::string _received;
    /** The size of the reply in bytes; 0 while it is unknown. */
    std::size_t _size = 0;
    std::size_t _bodySize = 0;
    std::size_t _bodyStart = 0;
    /** The position at which the next chunk of the body begins; 0 if the body has no chunks. */
    std::size_t _nextChunk = 0;
    Clock::time_point _begin;
    Clock::time_point _firstByte;
    Clock::time_point _end;
};

} // namespace Bench

#endif

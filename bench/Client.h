/** A client that takes as little as possible of the processor. */
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

    /** Takes what came. @return whether the reply is whole. */
    bool take();

    /** Asks, and waits for the whole reply without sleeping. */
    const std::string& answerTo(const std::string& request);

    const std::string& reply() const { return _received; }
    /** Without the headers, of which one tells how long the server took. Chunks are joined. */
    std::string body() const;
    std::size_t bodySize() const { return _bodySize; }
    /** In milliseconds. */
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
    /** Goes on from chunk to chunk as far as they have come. */
    void findChunks();

    int _socket;
    std::unique_ptr<gnutls_certificate_credentials_st, Freed<gnutls_certificate_free_credentials>> _credentials;
    /** Null where there is no TLS. */
    std::unique_ptr<gnutls_session_int, Freed<gnutls_deinit>> _session;
    std::string _received;
    /** Of the reply; 0 while it is not known. */
    std::size_t _size = 0;
    std::size_t _bodySize = 0;
    std::size_t _bodyStart = 0;
    /** Where the next chunk begins, of a body in chunks; 0 otherwise. */
    std::size_t _nextChunk = 0;
    Clock::time_point _begin;
    Clock::time_point _firstByte;
    Clock::time_point _end;
};

} // namespace Bench

#endif

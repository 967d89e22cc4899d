/** An HTTP client that sends exactly what a test says, correct or not. */
#ifndef TESTS_SERVER_HTTPCLIENT_H
#define TESTS_SERVER_HTTPCLIENT_H

#include <chrono>
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

struct gnutls_session_int;

namespace ServerTest {

struct Reply {
    int status = 0;
    /** Names in lower case. */
    std::map<std::string, std::string> headers;
    /** Of a body in chunks: all of them joined. */
    std::string body;
    /** How many chunks there were. */
    std::size_t chunks = 0;
    /** The trailers, after the last chunk. */
    std::map<std::string, std::string> trailers;
};

/** One connection. Whatever the server does not do in good time ends the test with an exception. */
class HttpClient {
public:
    /**
     * @param from the client's own address; empty for any.
     * @throws std::system_error if it cannot connect.
     */
    explicit HttpClient(std::uint16_t port, const std::string& to = "127.0.0.1", const std::string& from = "");
    HttpClient(const HttpClient&) = delete;
    HttpClient& operator=(const HttpClient&) = delete;
    HttpClient(HttpClient&& other) noexcept;
    ~HttpClient();

    /**
     * Carries out a TLS handshake, and accepts any certificate. Everything that follows is encrypted.
     * @throws std::runtime_error if the handshake fails.
     */
    void encrypt();
    /** The certificate that the server has shown, in DER. */
    std::string certificate() const;

    /** Sends a text. @return false if the server has closed the connection. */
    bool send(std::string_view text) const;
    /**
     * Waits for the whole reply. One without a length or chunks ends with the connection.
     * @throws std::runtime_error if the connection ends before.
     */
    Reply receive();
    /** Waits until something has come, and takes as much of it as there is room for. */
    std::string receiveSome(std::size_t most) const;
    /** Whether bytes, or the end of the connection, can be received. */
    bool isReadable() const;
    /** Waits for the end of the connection. @return what was received before. */
    std::string receiveAll();
    /** Whether the connection has ended with a reset. */
    bool wasReset() const { return _wasReset; }
    /** Closes the sending direction; the client can still receive. */
    void endSending() const;
    /** Goes away without a word. */
    void reset();

private:
    struct EndSession {
        void operator()(gnutls_session_int* session) const;
    };

    /** Waits for bytes, and takes them. @return how many; 0 at the end of the connection. */
    std::size_t take(char* data, std::size_t size) const;
    bool fill();
    void requireMore();
    /** What has come up to the end of the line, without it. Waits for that. */
    std::string takeLine();
    std::string takeBytes(std::size_t size);
    std::map<std::string, std::string> takeHeaders();

    int _socket;
    /** Null in the clear. */
    std::unique_ptr<gnutls_session_int, EndSession> _session;
    /** What was received and is not part of a reply yet. */
    std::string _received;
    mutable bool _wasReset = false;
};

/** The text of a request. @param headers each with its line end. */
std::string post(std::string_view body, std::string_view headers = "");

/** The header for a log-in, with its line end. */
std::string logInAs(const std::string& user, const std::string& password);

} // namespace ServerTest

#endif

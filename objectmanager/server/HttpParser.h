/**
 * Parses requests in HTTP/1.1 and HTTP/1.0 (RFC 9112). A request that two parsers could understand differently is
 * refused, even if the RFC permits servers to repair it.
 */
#ifndef SERVER_HTTPPARSER_H
#define SERVER_HTTPPARSER_H

#include "server/HttpMessage.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

namespace ObjectManager::Server {

/** A request that is refused with an HTTP status. what() is one line that says why. */
class HttpError : public std::runtime_error {
public:
    HttpError(unsigned int status, const std::string& problem) : std::runtime_error(problem), _status(status) {}

    unsigned int status() const { return _status; }

private:
    unsigned int _status;
};

/** How a request says where its body ends. */
struct Framing {
    bool chunked = false;
    /** The size of a body that is not chunked, in bytes. */
    std::uint64_t length = 0;
};

/** The request line and the headers. */
struct RequestHead {
    std::string method;
    std::string target;
    HttpHeaders headers;
    Framing framing;
    /** The value of the header Host; empty if a request in HTTP/1.0 has none. */
    std::string host;
    /** Whether the client wants the connection to stay open after the answer. */
    bool keepAlive = true;
    /** Whether the client understands an answer in chunks, as every client of HTTP/1.1 does. */
    bool takesChunks = true;
    /** Whether the client accepts trailers, the headers after the last chunk. */
    bool takesTrailers = false;
    /** Whether the client waits for "100 Continue" before it sends the body. */
    bool expectsContinue = false;
};

/** Whether the text is the first line of a request, or can become it when more bytes arrive. */
bool mayBeRequestLine(std::string_view text);

/** The size of the head in bytes, with the empty line at its end; no value if the end has not been received. */
std::optional<std::size_t> sizeOfHead(std::string_view received);

/** @param head with the empty line at its end. @throws HttpError if the request is malformed or not supported. */
RequestHead parseHead(std::string_view head);

/** The name or address in the value of the header Host, in lower case, without port, brackets and final dot. */
std::string hostNameOf(std::string_view host);

/** Decodes a chunked body that arrives in pieces of any size. */
class ChunkedBody {
public:
    /** @param mostTrailers the limit for the trailers in bytes; trailers are ignored. */
    explicit ChunkedBody(std::size_t mostTrailers) : _mostTrailers(mostTrailers) {}

    /**
     * Removes the bytes of the body from the front of `received`, and appends the decoded data to `data`.
     * @throws HttpError if the body is malformed, or its trailers exceed the limit.
     */
    void take(std::string& received, std::string& data);
    bool isComplete() const { return _part == Part::end; }

private:
    enum class Part { size, data, dataEnd, trailers, end };

    /** The first line of the bytes without its end; no value if its end has not been received. */
    std::optional<std::string_view> lineOf(std::string_view received, std::size_t most) const;

    const std::size_t _mostTrailers;
    Part _part = Part::size;
    /** How many bytes of the present chunk's data have still to be received. */
    std::uint64_t _missing = 0;
    std::size_t _trailers = 0;
};

} // namespace ObjectManager::Server

#endif

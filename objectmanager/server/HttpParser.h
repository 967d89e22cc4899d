/**
 * HTTP/1.1 as RFC 9112 has it, and nothing that two readers could understand differently: what the RFC lets a server
 * repair is refused.
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

/** A request that is answered with an error. what() says in one line what is wrong with it. */
class HttpError : public std::runtime_error {
public:
    HttpError(unsigned int status, const std::string& problem) : std::runtime_error(problem), _status(status) {}

    unsigned int status() const { return _status; }

private:
    unsigned int _status;
};

/** How the end of a body is told. */
struct Framing {
    bool chunked = false;
    /** Of a body that is not chunked. */
    std::uint64_t length = 0;
};

/** The request line and the headers. */
struct RequestHead {
    std::string method;
    std::string target;
    HttpHeaders headers;
    Framing framing;
    /** Of the header Host; empty where HTTP/1.0 has none. */
    std::string host;
    /** The connection stays open after the answer, if it is up to the client. */
    bool keepAlive = true;
    /** The client understands an answer in chunks, as from HTTP/1.1 on, and headers behind its last one. */
    bool takesChunks = true;
    bool takesTrailers = false;
    /** The client waits for leave to send its body. */
    bool expectsContinue = false;
};

/** Whether the text can be, or begin, the first line of a request. */
bool mayBeRequestLine(std::string_view text);

/** How many bytes the head has, its empty line included; nothing where its end is not here. */
std::optional<std::size_t> sizeOfHead(std::string_view received);

/** @param head ends with its empty line. @throws HttpError */
RequestHead parseHead(std::string_view head);

/** The name or address in the value of the header Host, in lower case, without port, brackets and final dot. */
std::string hostNameOf(std::string_view host);

/** Takes a chunked body apart, however it comes in pieces. */
class ChunkedBody {
public:
    /** @param mostTrailers bytes of the trailers, which nobody reads. */
    explicit ChunkedBody(std::size_t mostTrailers) : _mostTrailers(mostTrailers) {}

    /**
     * Takes from the received bytes what belongs to the body, and appends the data in it to `data`.
     * @throws HttpError
     */
    void take(std::string& received, std::string& data);
    bool isComplete() const { return _part == Part::end; }

private:
    enum class Part { size, data, dataEnd, trailers, end };

    /** The line that the bytes begin with, without its end; nothing where its end is not here. */
    std::optional<std::string_view> lineOf(std::string_view received, std::size_t most) const;

    const std::size_t _mostTrailers;
    Part _part = Part::size;
    /** Of the data of the chunk that is not here yet. */
    std::uint64_t _missing = 0;
    std::size_t _trailers = 0;
};

} // namespace ObjectManager::Server

#endif

/** Requests and replies, as the HTTP server and the function that answers requests exchange them. */
#ifndef SERVER_HTTPMESSAGE_H
#define SERVER_HTTPMESSAGE_H

#include "server/Outlet.h"

#include <strings.h>

#include <algorithm>
#include <functional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ObjectManager::Server {

/** Whether two names in HTTP (of headers, schemes, codings) are equal; letter case is ignored (RFC 9110). */
inline bool equalTokens(std::string_view left, std::string_view right) {
    return left.size() == right.size() && strncasecmp(left.data(), right.data(), left.size()) == 0;
}

/** The names and values of headers. A name may occur several times. */
using HttpHeaders = std::vector<std::pair<std::string, std::string>>;

/** A request that a client has sent. */
struct HttpRequest {
    std::string method;
    HttpHeaders headers;
    std::string_view body;
    /** Takes an answer that is too large to be returned as a whole; null if every answer has to be returned. */
    Outlet* outlet{};

    /** The value of the first header with the name; null if there is none. */
    const std::string* header(std::string_view name) const {
        const auto found = std::find_if(headers.begin(), headers.end(),
                                        [&](const auto& header) { return equalTokens(header.first, name); });
        return found == headers.end() ? nullptr : &found->second;
    }
};

struct HttpReply {
    unsigned int status;
    HttpHeaders headers;
    std::string body;
    /** Why the request was refused, as a line for the server's log; empty if it was not refused. */
    std::string problem{};
};

/** The user who sent a request, and his rights. */
struct Caller {
    std::string user;
    bool mayRead;
    bool mayChangePower;
    /** The client's address, as the log shows it. */
    std::string address{};
};

/**
 * Answers a request. Called by several threads at once. Must not throw; only exceptions of the request's outlet pass.
 *
 * If the handler has sent a part of the answer to the outlet, it returns the rest: the last piece of the body. If it
 * cannot complete such an answer, it returns a `problem`, and as headers the trailers that describe the problem.
 */
using Handler = std::function<HttpReply(const HttpRequest&, const Caller&)>;

} // namespace ObjectManager::Server

#endif

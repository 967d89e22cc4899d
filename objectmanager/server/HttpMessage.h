/** What passes between the HTTP server and the function that answers requests. */
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

/** Whether two names of HTTP's (headers, schemes, codings) are the same: letter case is ignored (RFC 9110). */
inline bool equalTokens(std::string_view left, std::string_view right) {
    return left.size() == right.size() && strncasecmp(left.data(), right.data(), left.size()) == 0;
}

/** Names and values. A name may come several times. */
using HttpHeaders = std::vector<std::pair<std::string, std::string>>;

/** A request as it came in. */
struct HttpRequest {
    std::string method;
    HttpHeaders headers;
    std::string_view body;
    /** For an answer that is too large to be held as a whole; null where every answer has to be returned. */
    Outlet* outlet{};

    /** The value of the first header of that name; null where there is none. */
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
    /** Why the request was refused, in a line for the server's log; empty where it was not. */
    std::string problem{};
};

/** Who asks, and what he may do. */
struct Caller {
    std::string user;
    bool mayRead;
    bool mayChangePower;
    /** Where the client is, as the log names it. */
    std::string address{};
};

/**
 * Answers a request. Called by several threads at once; must not throw, but for what the request's outlet throws.
 *
 * Of an answer that has begun at the outlet, it returns the rest: the last piece of the body. Where the answer cannot
 * be ended, it returns a `problem`, and the headers tell of it to a client that takes trailers.
 */
using Handler = std::function<HttpReply(const HttpRequest&, const Caller&)>;

} // namespace ObjectManager::Server

#endif

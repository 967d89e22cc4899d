/** The statuses of HTTP that requests are answered with (RFC 9110, section 15, and RFC 2774). */
#ifndef SERVER_HTTPSTATUS_H
#define SERVER_HTTPSTATUS_H

#include <algorithm>
#include <array>
#include <string_view>
#include <utility>

namespace ObjectManager::Server::Status {

constexpr unsigned int ok = 200;
constexpr unsigned int badRequest = 400;
constexpr unsigned int unauthorized = 401;
constexpr unsigned int forbidden = 403;
constexpr unsigned int methodNotAllowed = 405;
constexpr unsigned int notAcceptable = 406;
constexpr unsigned int requestTimeout = 408;
constexpr unsigned int contentTooLarge = 413;
constexpr unsigned int uriTooLong = 414;
constexpr unsigned int unsupportedMediaType = 415;
constexpr unsigned int headersTooLarge = 431;
constexpr unsigned int internalServerError = 500;
constexpr unsigned int notImplemented = 501;
constexpr unsigned int serviceUnavailable = 503;
constexpr unsigned int versionNotSupported = 505;
constexpr unsigned int notExtended = 510;

/** The reason phrase of a status; "Other" for statuses without one here. */
constexpr std::string_view reasonOf(unsigned int status) {
    constexpr std::array<std::pair<unsigned int, std::string_view>, 17> reasons = {{
        {ok, "OK"},
        {badRequest, "Bad Request"},
        {unauthorized, "Unauthorized"},
        {forbidden, "Forbidden"},
        {404, "Not Found"},
        {methodNotAllowed, "Method Not Allowed"},
        {notAcceptable, "Not Acceptable"},
        {requestTimeout, "Request Timeout"},
        {contentTooLarge, "Content Too Large"},
        {uriTooLong, "URI Too Long"},
        {unsupportedMediaType, "Unsupported Media Type"},
        {headersTooLarge, "Request Header Fields Too Large"},
        {internalServerError, "Internal Server Error"},
        {notImplemented, "Not Implemented"},
        {serviceUnavailable, "Service Unavailable"},
        {versionNotSupported, "HTTP Version Not Supported"},
        {notExtended, "Not Extended"},
    }};
    const auto* const found =
        std::find_if(reasons.begin(), reasons.end(), [status](const auto& reason) { return reason.first == status; });
    return found == reasons.end() ? "Other" : found->second;
}

} // namespace ObjectManager::Server::Status

#endif

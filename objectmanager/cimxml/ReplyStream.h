/** The way that the document of an answer goes. */
#ifndef CIMXML_REPLYSTREAM_H
#define CIMXML_REPLYSTREAM_H

#include "broker/Arena.h"
#include "server/HttpMessage.h"

#include <cstddef>
#include <functional>
#include <string_view>

namespace ObjectManager::CimXml {

/**
 * Sends a document while it is made, and has room kept for what it is made of: what providers returned, and text that
 * cannot be sent yet. Without an outlet it does nothing. It throws what the outlet throws.
 */
class ReplyStream final : private Arena::Meter {
public:
    /**
     * @param outlet null where the document has to be returned.
     * @param headers gives the reply's headers, when it begins.
     */
    ReplyStream(Server::Outlet* outlet, std::function<Server::HttpHeaders()> headers)
        : _outlet(outlet), _headers(std::move(headers)) {}

    bool canSend() const { return _outlet != nullptr; }
    /** Whether the client has got something. */
    bool hasBegun() const { return _hasBegun; }

    /** Sends a piece of the document, and with the first one that the request was answered. */
    void send(std::string_view piece);

    /** Waits until there is room for so many bytes of text, beside what providers returned. */
    void holdText(std::size_t bytes);

private:
    void grow(std::size_t bytes) override;

    Server::Outlet* const _outlet;
    const std::function<Server::HttpHeaders()> _headers;
    bool _hasBegun = false;
    std::size_t _results = 0;
    std::size_t _text = 0;
};

} // namespace ObjectManager::CimXml

#endif

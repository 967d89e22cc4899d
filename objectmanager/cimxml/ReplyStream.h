/** Sends the document of a reply while it is being made. */
#ifndef CIMXML_REPLYSTREAM_H
#define CIMXML_REPLYSTREAM_H

#include "model/Operations.h"
#include "server/HttpMessage.h"

#include <cstddef>
#include <functional>
#include <string_view>

namespace ObjectManager::CimXml {

/**
 * Sends a document piece by piece, and reserves the memory that the document needs: for the objects that providers
 * returned, and for text that cannot be sent yet. Without an outlet it does nothing. Exceptions of the outlet pass.
 */
class ReplyStream final : public MemoryMeter {
public:
    /**
     * @param outlet null if the document has to be returned as a whole.
     * @param headers makes the reply's headers, when the first piece is sent.
     */
    ReplyStream(Server::Outlet* outlet, std::function<Server::HttpHeaders()> headers)
        : _outlet(outlet), _headers(std::move(headers)) {}

    bool canSend() const { return _outlet != nullptr; }
    /** Whether a piece has been sent. */
    bool hasBegun() const { return _hasBegun; }

    /** Sends a piece of the document. The reply's status and headers go with the first piece. */
    void send(std::string_view piece);

    /** Waits until `bytes` of text can be held in memory, beside the objects that providers returned. */
    void holdText(std::size_t bytes);

    void take(std::size_t bytes) override;
    void give(std::size_t bytes) noexcept override { _results -= bytes; }

private:
    void hold();

    Server::Outlet* const _outlet;
    const std::function<Server::HttpHeaders()> _headers;
    bool _hasBegun = false;
    /** In bytes, of what providers returned: now, and the most so far, for which room is kept. */
    std::size_t _results = 0;
    std::size_t _mostResults = 0;
    /** In bytes. */
    std::size_t _text = 0;
};

} // namespace ObjectManager::CimXml

#endif

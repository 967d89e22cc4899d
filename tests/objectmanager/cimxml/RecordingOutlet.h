/** An outlet that records the pieces of a reply, in place of the server's. */
#ifndef TESTS_OBJECTMANAGER_CIMXML_RECORDINGOUTLET_H
#define TESTS_OBJECTMANAGER_CIMXML_RECORDINGOUTLET_H

#include "cimxml/Service.h"

#include <algorithm>
#include <optional>
#include <string>
#include <vector>

namespace ObjectManager::CimXml {

class RecordingOutlet : public Server::Outlet {
public:
    /** Thrown like the server's exception for a client that has gone. */
    struct Gone {};

    void hold(std::size_t bytes) override { held = std::max(held, bytes); }

    void begin(const HttpReply& reply) override {
        begun = reply;
        send(begun->body);
    }

    void send(std::string_view piece) override {
        if (pieces.size() == piecesUntilGone) {
            throw Gone{};
        }
        pieces.emplace_back(piece);
    }

    /** The whole reply that the client gets: the pieces, and the rest that the handler returned. */
    HttpReply joined(const HttpReply& rest) const {
        if (!begun) {
            return rest;
        }
        HttpReply whole = *begun;
        whole.body.clear();
        for (const std::string& piece : pieces) {
            whole.body += piece;
        }
        whole.body += rest.body;
        return whole;
    }

    std::optional<HttpReply> begun;
    std::vector<std::string> pieces;
    std::size_t piecesUntilGone = static_cast<std::size_t>(-1);
    std::size_t held = 0;
};

} // namespace ObjectManager::CimXml

#endif

#include "cimxml/ReplyStream.h"

#include "server/HttpStatus.h"

#include <algorithm>
#include <string>

namespace ObjectManager::CimXml {

void ReplyStream::send(std::string_view piece) {
    if (_hasBegun) {
        _outlet->send(piece);
        return;
    }
    // Set before the piece is sent: after a failure, nobody knows how much of it the client got.
    _hasBegun = true;
    _outlet->begin({Server::Status::ok, _headers(), std::string(piece)});
}

void ReplyStream::holdText(std::size_t bytes) {
    _text = bytes;
    hold();
}

void ReplyStream::take(std::size_t bytes) {
    _mostResults = std::max(_mostResults, _results + bytes);
    hold();
    _results += bytes;
}

void ReplyStream::hold() {
    if (_outlet != nullptr) {
        _outlet->hold(_mostResults + _text);
    }
}

} // namespace ObjectManager::CimXml

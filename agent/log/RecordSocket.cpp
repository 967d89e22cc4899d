#include "RecordSocket.h"

#include <sys/socket.h>
#include <sys/uio.h>
#include <unistd.h>

#include <array>
#include <charconv>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <optional>
#include <string_view>

namespace OrvLog {

namespace {

/** Every operation leaves records below it, which no host has asked for. */
constexpr int lowestLevel = 5000;

std::optional<int> number(std::string_view text) {
    int value = -1;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc{} && end == text.data() + text.size() && value >= 0 ? std::optional<int>(value)
                                                                                  : std::nullopt;
}

std::optional<int> socketOption(int descriptor, int option) {
    int value = 0;
    socklen_t size = sizeof value;
    return getsockopt(descriptor, SOL_SOCKET, option, &value, &size) == 0 ? std::optional<int>(value) : std::nullopt;
}

bool isMessageSocket(int descriptor) {
    const int type = socketOption(descriptor, SO_TYPE).value_or(-1);
    return socketOption(descriptor, SO_DOMAIN) == AF_UNIX && (type == SOCK_DGRAM || type == SOCK_SEQPACKET);
}

iovec piece(std::string_view text) {
    // sendmsg(2) reads only, but takes what recvmsg(2) takes, too.
    return {.iov_base = const_cast<char*>(text.data()), .iov_len = text.size()};
}

} // namespace

RecordSocket RecordSocket::fromEnvironment() {
    const char* variable = std::getenv("ORV_AGENT_LOG_SOCKET");
    const auto descriptor = variable == nullptr ? std::nullopt : number(variable);
    return RecordSocket(descriptor && isMessageSocket(*descriptor) ? *descriptor : -1);
}

void RecordSocket::send(const Record& record) const {
    if (_descriptor < 0 || record.kind != Kind::log || record.level < lowestLevel) {
        return;
    }
    std::array<char, sizeof "-2147483648\n-2147483648\n"> head{};
    const int headSize = std::snprintf(head.data(), head.size(), "%d\n%d\n", gettid(), record.level);

    std::array pieces{piece({head.data(), static_cast<std::size_t>(headSize)}), piece(record.category), piece("\n"),
                      piece(record.text)};
    msghdr message{};
    message.msg_iov = pieces.data();
    message.msg_iovlen = pieces.size();
    sendmsg(_descriptor, &message, MSG_DONTWAIT | MSG_NOSIGNAL);
}

} // namespace OrvLog

/*
 * Sends the bytes of a whole connection to the server, through a pair of sockets. Whatever they are, the server must
 * accept or refuse them, and close the connection when the client has closed it.
 */
#include "server/Exchange.h"

#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cstdint>

using namespace ObjectManager;

namespace {

/** Lets every user with the password "right" log in. */
class Doorkeeper : public Server::Authenticator {
public:
    Server::LogIn logIn(const std::string& user, const std::string& password, const std::string&) override {
        return password == "right" ? Server::LogIn{Server::Caller{user, true, true}, ""}
                                   : Server::LogIn{std::nullopt, "wrong"};
    }
};

Server::Settings settings() {
    Server::Settings made;
    made.limits.headerBytes = 1000;
    made.limits.bodyBytes = 1000;
    made.failedLogInDelay = std::chrono::milliseconds{1};
    return made;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static Doorkeeper doorkeeper;
    const auto echo = [](const Server::HttpRequest& request, const Server::Caller&) {
        return Server::HttpReply{200, {}, std::string(request.body)};
    };
    // The first byte says whether clients have to log in.
    const bool logsIn = size > 0 && data[0] == '!';
    Server::Shared shared(settings(), echo, logsIn ? &doorkeeper : nullptr, [](const std::string&) {});
    shared.stop = eventfd(0, EFD_CLOEXEC);

    std::array<int, 2> pair{};
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, pair.data()) != 0) {
        return 0;
    }
    constexpr int room = 1 << 20;
    setsockopt(pair[1], SOL_SOCKET, SO_SNDBUF, &room, sizeof room);
    setsockopt(pair[0], SOL_SOCKET, SO_SNDBUF, &room, sizeof room);
    [[maybe_unused]] const ssize_t sent = send(pair[1], data, size, MSG_DONTWAIT | MSG_NOSIGNAL);
    shutdown(pair[1], SHUT_WR);
    Server::Connections::Connection* const connection = shared.connections.opened(pair[0], "client", "client");
    Server::Exchange(shared, *connection).run();
    shared.connections.closed(*connection);
    close(pair[0]);
    close(pair[1]);
    close(shared.stop);
    return 0;
}

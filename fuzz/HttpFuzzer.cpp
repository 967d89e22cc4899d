/*
 * Sends the bytes of a whole connection to the server, through a pair of sockets. Whatever they are, the server must
 * accept or refuse them, and close the connection when the client has closed it. With FUZZ_TLS, the server expects TLS.
 */
#include "server/Exchange.h"

#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <system_error>

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

#ifdef FUZZ_TLS
/** A key and a certificate that are made for this run. */
std::shared_ptr<const Server::TlsKeys> makeKeys() {
    std::string folder = (std::filesystem::temp_directory_path() / "orv-fuzz-XXXXXX").string();
    if (mkdtemp(folder.data()) == nullptr) {
        throw std::system_error(errno, std::generic_category(), folder);
    }
    const std::string command = "openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -noenc -days 2 -subj "
                                "/CN=localhost -keyout " +
                                folder + "/key -out " + folder + "/certificate 2>/dev/null";
    if (std::system(command.c_str()) != 0) {
        throw std::runtime_error(command + ": failed");
    }
    auto keys = std::make_shared<const Server::TlsKeys>(Server::Tls{folder + "/certificate", folder + "/key"},
                                                        [](const std::string&) {});
    std::filesystem::remove_all(folder);
    return keys;
}
#endif

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
#ifdef FUZZ_TLS
    static const std::shared_ptr<const Server::TlsKeys> keys = makeKeys();
    shared.setKeys(keys);
#endif

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

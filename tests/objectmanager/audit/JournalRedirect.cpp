/*
 * For LD_PRELOAD: redirects what the process sends to the socket of the system's journal to the socket that the
 * environment variable TEST_JOURNAL_SOCKET names.
 */
#include <dlfcn.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <cstdlib>
#include <cstring>
#include <string_view>

extern "C" ssize_t sendmsg(int socket, const msghdr* message, int flags) {
    static auto* const original = reinterpret_cast<decltype(&sendmsg)>(dlsym(RTLD_NEXT, "sendmsg"));
    const auto* const address = static_cast<const sockaddr_un*>(message->msg_name);
    const char* const own = std::getenv("TEST_JOURNAL_SOCKET");
    if (own == nullptr || address == nullptr || address->sun_family != AF_UNIX ||
        std::string_view(static_cast<const char*>(address->sun_path)) != "/run/systemd/journal/socket") {
        return original(socket, message, flags);
    }
    sockaddr_un redirected{};
    redirected.sun_family = AF_UNIX;
    std::strncpy(static_cast<char*>(redirected.sun_path), own, sizeof redirected.sun_path - 1);
    msghdr other = *message;
    other.msg_name = &redirected;
    other.msg_namelen = sizeof redirected;
    return original(socket, &other, flags);
}

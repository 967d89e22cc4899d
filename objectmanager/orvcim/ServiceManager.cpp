#include "orvcim/ServiceManager.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <charconv>
#include <cstddef>
#include <cstdlib>
#include <cstring>

namespace ObjectManager::Orvcim {

namespace {

std::string environment(const char* name) {
    const char* const value = std::getenv(name);
    return value == nullptr ? "" : value;
}

/** The number that a text consists of; no value if it is something else. */
std::optional<long> numberIn(const std::string& text) {
    long number = 0;
    const char* const end = text.data() + text.size();
    const auto [stopped, error] = std::from_chars(text.data(), end, number);
    return error == std::errc() && stopped == end ? std::optional(number) : std::nullopt;
}

} // namespace

ServiceManager::ServiceManager() : _socket(environment("NOTIFY_SOCKET")) {
    const std::string process = environment("WATCHDOG_PID");
    if (const auto limit = numberIn(environment("WATCHDOG_USEC"));
        limit && *limit > 0 && (process.empty() || numberIn(process) == getpid())) {
        // sd_watchdog_enabled(3) recommends half of the time after which the service counts as dead.
        _watchdogInterval = std::chrono::microseconds(*limit / 2);
    }
}

void ServiceManager::tell(std::string_view assignments) const {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (_socket.empty() || _socket.size() >= sizeof address.sun_path) {
        return;
    }
    std::memcpy(static_cast<char*>(address.sun_path), _socket.data(), _socket.size());
    // An at sign stands for the null byte with which the name of an abstract socket begins.
    if (address.sun_path[0] == '@') {
        address.sun_path[0] = '\0';
    }
    const int descriptor = socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    if (descriptor < 0) {
        return;
    }
    const auto size = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + _socket.size());
    sendto(descriptor, assignments.data(), assignments.size(), MSG_NOSIGNAL,
           reinterpret_cast<const sockaddr*>(&address), size);
    close(descriptor);
}

} // namespace ObjectManager::Orvcim

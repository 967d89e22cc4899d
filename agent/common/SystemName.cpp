#include "Norv/Common.h"

#include "config/Configuration.h"

#include <array>
#include <memory>
#include <new>
#include <optional>

#include <netdb.h>
#include <sys/socket.h>
#include <unistd.h>

namespace Norv {

namespace {

/**
 * The fully qualified name of the host in the hosts file or the name service; no value if they have none.
 *
 * @throws std::bad_alloc
 */
std::optional<std::string> canonicalName(const std::string& hostName) {
    addrinfo hints{};
    hints.ai_flags = AI_CANONNAME;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    const int result = ::getaddrinfo(hostName.c_str(), nullptr, &hints, &found);
    if (result == EAI_MEMORY) {
        throw std::bad_alloc();
    }
    if (result != 0) {
        return std::nullopt;
    }
    const std::unique_ptr<addrinfo, decltype(&::freeaddrinfo)> addresses(found, ::freeaddrinfo);
    return addresses->ai_canonname != nullptr ? std::optional<std::string>(addresses->ai_canonname) : std::nullopt;
}

bool isFullyQualified(const std::string& name) {
    return name.find('.') != std::string::npos;
}

std::string hostsName() {
    std::array<char, 256> buffer{};
    // The last byte stays zero: a name that fills the buffer need not be terminated.
    if (::gethostname(buffer.data(), buffer.size() - 1) != 0 || buffer.front() == '\0') {
        return "localhost";
    }
    std::string name = buffer.data();
    if (isFullyQualified(name)) {
        return name;
    }
    // A hosts file that lists the host's name as an alias of "localhost" gives no better name.
    auto canonical = canonicalName(name);
    return canonical && isFullyQualified(*canonical) ? *std::move(canonical) : name;
}

std::string determineSystemName() {
    try {
        if (auto configured = Agent::loadConfiguration().systemName) {
            return *std::move(configured);
        }
    } catch (const Agent::ConfigurationError&) {
        // The log library reports the error; the host's own name does not need the configuration.
    }
    return hostsName();
}

} // namespace

std::string getSystemName() {
    // Never destroyed: threads of the host program may ask for it until the process ends.
    static const std::string& name = *new std::string(determineSystemName());
    return name;
}

} // namespace Norv

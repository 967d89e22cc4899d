#include "server/Hosts.h"

#include "server/HttpParser.h"

#include <arpa/inet.h>
#include <unistd.h>

#include <array>

namespace ObjectManager::Server {

namespace {

bool isAddress(const std::string& name) {
    in6_addr address{};
    // A link-local address may be followed by "%" and the client's name for the network interface.
    return inet_pton(AF_INET, name.c_str(), &address) == 1 ||
           inet_pton(AF_INET6, name.substr(0, name.find('%')).c_str(), &address) == 1;
}

} // namespace

Hosts::Hosts(const std::vector<std::string>& others) : _names{"localhost"} {
    std::array<char, 256> text{};
    if (gethostname(text.data(), text.size() - 1) == 0) {
        const std::string name = hostNameOf(text.data());
        _names.insert({name, name.substr(0, name.find('.'))});
    }
    for (const std::string& other : others) {
        _names.insert(hostNameOf(other));
    }
}

bool Hosts::areCalled(const std::string& name, const TlsKeys* keys) const {
    return _names.count(name) != 0 || isAddress(name) || (keys != nullptr && keys->certify(name));
}

} // namespace ObjectManager::Server

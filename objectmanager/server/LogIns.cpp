#include "server/LogIns.h"

#include <gnutls/crypto.h>
#include <gnutls/gnutls.h>

#include <memory>
#include <stdexcept>

namespace ObjectManager::Server {

namespace {

void require(int status, const char* what) {
    if (status != GNUTLS_E_SUCCESS) {
        throw std::runtime_error(std::string(what) + ": " + gnutls_strerror(status));
    }
}

struct GnutlsFree {
    void operator()(unsigned char* data) const { gnutls_free(data); }
};

} // namespace

std::optional<Credentials> credentialsOf(std::string_view authorization) {
    constexpr std::string_view scheme = "Basic ";
    if (!equalTokens(authorization.substr(0, scheme.size()), scheme)) {
        return std::nullopt;
    }
    std::string encoded(authorization.substr(scheme.size()));
    std::erase(encoded, ' ');
    const gnutls_datum_t base64{reinterpret_cast<unsigned char*>(encoded.data()),
                                static_cast<unsigned int>(encoded.size())};
    gnutls_datum_t decoded{};
    if (gnutls_base64_decode2(&base64, &decoded) != GNUTLS_E_SUCCESS) {
        return std::nullopt;
    }
    const std::unique_ptr<unsigned char, GnutlsFree> owner(decoded.data);
    const std::string_view text(reinterpret_cast<const char*>(decoded.data), decoded.size);
    const std::size_t colon = text.find(':');
    if (colon == std::string_view::npos || text.find('\0') != std::string_view::npos) {
        return std::nullopt;
    }
    return Credentials{std::string(text.substr(0, colon)), std::string(text.substr(colon + 1))};
}

RecentLogIns::RecentLogIns() {
    require(gnutls_rnd(GNUTLS_RND_KEY, _secret.data(), _secret.size()), "random key");
}

std::optional<Caller> RecentLogIns::find(const std::string& user, const std::string& password, Clock::time_point now) {
    const Digest digest = digestOf(user, password);
    const std::lock_guard lock(_mutex);
    const auto found = _entries.find(digest);
    return found == _entries.end() || found->second.until <= now ? std::nullopt : std::optional(found->second.caller);
}

void RecentLogIns::remember(const std::string& user, const std::string& password, const Caller& caller,
                            Clock::time_point now) {
    const Digest digest = digestOf(user, password);
    const std::lock_guard lock(_mutex);
    if (_entries.size() >= capacity) {
        std::erase_if(_entries, [now](const auto& entry) { return entry.second.until <= now; });
    }
    if (_entries.size() < capacity) {
        _entries.insert_or_assign(digest, Entry{caller, now + lifetime});
    }
}

RecentLogIns::Digest RecentLogIns::digestOf(const std::string& user, const std::string& password) const {
    // A user's name has no colon here, as it has none in HTTP.
    const std::string text = user + ':' + password;
    Digest digest{};
    require(
        gnutls_hmac_fast(GNUTLS_MAC_SHA256, _secret.data(), _secret.size(), text.data(), text.size(), digest.data()),
        "digest");
    return digest;
}

} // namespace ObjectManager::Server

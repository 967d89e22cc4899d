#include "server/LogIns.h"

#include <gnutls/gnutls.h>

#include <algorithm>
#include <new>
#include <stdexcept>

namespace ObjectManager::Server {

namespace {

/** How many log-ins are checked at a time, how many of them of one network, and how many of one network may wait. */
constexpr unsigned int checkedAtATime = 4;
constexpr unsigned int checkedOfNetwork = 2;
constexpr unsigned int waitingOfNetwork = 32;

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
    Digest key{};
    require(gnutls_rnd(GNUTLS_RND_KEY, key.data(), key.size()), "random key");
    gnutls_hmac_hd_t hmac = nullptr;
    require(gnutls_hmac_init(&hmac, GNUTLS_MAC_SHA256, key.data(), key.size()), "HMAC");
    _keyed.reset(hmac);
}

std::optional<Caller> RecentLogIns::find(const Credentials& given, Clock::time_point now) {
    const Digest digest = digestOf(given);
    const std::lock_guard lock(_mutex);
    const auto found = _entries.find(digest);
    if (found == _entries.end()) {
        return std::nullopt;
    }
    Entry& entry = found->second;
    if (entry.used + lifetime <= now || entry.checked + longestLifetime <= now) {
        return std::nullopt;
    }
    entry.used = now;
    return entry.caller;
}

bool RecentLogIns::isKnown(const Credentials& given, Clock::time_point now) {
    const Digest digest = digestOf(given);
    const std::lock_guard lock(_mutex);
    const auto found = _entries.find(digest);
    return found != _entries.end() && now < found->second.checked + memory;
}

void RecentLogIns::remember(const Credentials& given, const Caller& caller, Clock::time_point now) {
    const Digest digest = digestOf(given);
    const std::lock_guard lock(_mutex);
    if (_entries.size() >= capacity && !_entries.contains(digest)) {
        _entries.erase(std::min_element(_entries.begin(), _entries.end(), [](const auto& left, const auto& right) {
            return left.second.used < right.second.used;
        }));
    }
    _entries.insert_or_assign(digest, Entry{caller, now, now});
}

void RecentLogIns::forget(const Credentials& given) {
    const Digest digest = digestOf(given);
    const std::lock_guard lock(_mutex);
    _entries.erase(digest);
}

RecentLogIns::Digest RecentLogIns::digestOf(const Credentials& given) const {
    // The colon separates the two: HTTP's scheme Basic allows none in a user's name.
    const std::string text = given.user + ':' + given.password;
    Hmac hmac(gnutls_hmac_copy(_keyed.get()));
    if (!hmac) {
        throw std::bad_alloc();
    }
    require(gnutls_hmac(hmac.get(), text.data(), text.size()), "HMAC");
    Digest digest{};
    gnutls_hmac_output(hmac.get(), digest.data());
    return digest;
}

LogIns::LogIns(Authenticator& authenticator, std::chrono::milliseconds delay)
    : _authenticator(authenticator), _delay(delay), _turns(checkedAtATime, checkedOfNetwork, waitingOfNetwork) {}

LogIns::Decision LogIns::check(const Credentials& given, const Client& client, Clock::time_point until) {
    const auto begin = Clock::now();
    LogIn result;
    {
        const Turns::Turn turn = _turns.take(client.network, _recent.isKnown(given), until, client.isGone);
        if (!turn) {
            return {Verdict::busy};
        }
        result = _authenticator.logIn(given.user, given.password, client.address);
    }
    if (result.caller) {
        ++_good;
        _recent.remember(given, *result.caller);
        return {Verdict::in, std::move(result.caller)};
    }
    ++_wrong;
    _recent.forget(given);
    const auto delays = 1 + (Clock::now() - begin) / _delay;
    return {Verdict::wrong, std::nullopt, std::move(result.problem), begin + delays * _delay};
}

} // namespace ObjectManager::Server

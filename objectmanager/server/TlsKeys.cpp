#include "server/TlsKeys.h"

#include "basics/Files.h"
#include "server/ServerError.h"

#include <fmt/chrono.h>
#include <fmt/format.h>

#include <sys/stat.h>

#include <ctime>
#include <system_error>

namespace ObjectManager::Server {

namespace {

/**
 * TLS 1.3 and 1.2 with ephemeral keys on elliptic curves and authenticated ciphers. With these, a handshake costs the
 * server a millisecond at most, whatever the client asks for; a group like ffdhe8192 would cost half a second.
 */
constexpr const char* allowed =
    "NORMAL:-VERS-ALL:+VERS-TLS1.3:+VERS-TLS1.2:-KX-ALL:+ECDHE-ECDSA:+ECDHE-RSA:-GROUP-ALL:+GROUP-X25519:"
    "+GROUP-SECP256R1:+GROUP-SECP384R1:-CIPHER-ALL:+AES-256-GCM:+CHACHA20-POLY1305:+AES-128-GCM:-MAC-ALL:+AEAD:"
    "-SIGN-ALL:+SIGN-ECDSA-SECP256R1-SHA256:+SIGN-ECDSA-SECP384R1-SHA384:+SIGN-ECDSA-SECP521R1-SHA512:"
    "+SIGN-ECDSA-SHA256:+SIGN-ECDSA-SHA384:+SIGN-ECDSA-SHA512:+SIGN-EDDSA-ED25519:+SIGN-RSA-PSS-RSAE-SHA256:"
    "+SIGN-RSA-PSS-RSAE-SHA384:+SIGN-RSA-PSS-RSAE-SHA512:+SIGN-RSA-PSS-SHA256:+SIGN-RSA-PSS-SHA384:"
    "+SIGN-RSA-PSS-SHA512:+SIGN-RSA-SHA256:+SIGN-RSA-SHA384:+SIGN-RSA-SHA512:%SERVER_PRECEDENCE";

constexpr unsigned int leastRsaBits = 2048;
constexpr unsigned int leastCurveBits = 256;

std::string readPem(const std::filesystem::path& file) {
    std::string content;
    try {
        content = contentOf(file);
    } catch (const std::system_error& error) {
        throw ServerError(fmt::format("{}: {}", file.string(), error.code().message()));
    }
    if (content.empty()) {
        throw ServerError(fmt::format("{}: found nothing in it, expected PEM", file.string()));
    }
    return content;
}

gnutls_datum_t asDatum(std::string& text) {
    return {reinterpret_cast<unsigned char*>(text.data()), static_cast<unsigned int>(text.size())};
}

std::string dateOf(std::time_t time) {
    return fmt::format("{:%Y-%m-%d}", fmt::gmtime(time));
}

void warnOfReaders(const std::filesystem::path& key, const Log& log) {
    struct stat status {};
    if (stat(key.c_str(), &status) == 0 && (status.st_mode & S_IROTH) != 0) {
        log(fmt::format("{}: everybody on this machine can read the key (mode {:04o}), expected mode 0600 or 0640",
                        key.string(), status.st_mode & 07777U));
    }
}

} // namespace

TlsKeys::TlsKeys(const Tls& files, const Log& log) {
    std::string certificates = readPem(files.certificate);
    std::string key = readPem(files.key);
    const auto require = [&files](int code) {
        if (code < 0) {
            throw ServerError(fmt::format("cannot serve with the certificate {} and the key {}: {}",
                                          files.certificate.string(), files.key.string(), gnutls_strerror(code)));
        }
    };
    gnutls_certificate_credentials_t credentials = nullptr;
    require(gnutls_certificate_allocate_credentials(&credentials));
    _credentials.reset(credentials);
    gnutls_priority_t cache = nullptr;
    require(gnutls_priority_init(&cache, allowed, nullptr));
    _priorities.reset(cache);
    const gnutls_datum_t certificatesPem = asDatum(certificates);
    const gnutls_datum_t keyPem = asDatum(key);
    require(gnutls_certificate_set_x509_key_mem(credentials, &certificatesPem, &keyPem, GNUTLS_X509_FMT_PEM));
    gnutls_x509_crt_t certificate = nullptr;
    require(gnutls_x509_crt_init(&certificate));
    _certificate.reset(certificate);
    require(gnutls_x509_crt_import(certificate, &certificatesPem, GNUTLS_X509_FMT_PEM));

    const std::time_t now = std::time(nullptr);
    if (const std::time_t end = gnutls_x509_crt_get_expiration_time(certificate); end < now) {
        throw ServerError(fmt::format("{}: the certificate was valid until {}, expected one that still is",
                                      files.certificate.string(), dateOf(end)));
    }
    if (const std::time_t begin = gnutls_x509_crt_get_activation_time(certificate); begin > now) {
        log(fmt::format("{}: the certificate is valid from {} on only: is the clock right?", files.certificate.string(),
                        dateOf(begin)));
    }
    unsigned int bits = 0;
    const int algorithm = gnutls_x509_crt_get_pk_algorithm(certificate, &bits);
    const bool isRsa = algorithm == GNUTLS_PK_RSA || algorithm == GNUTLS_PK_RSA_PSS;
    if (const unsigned int least = isRsa ? leastRsaBits : leastCurveBits; bits < least) {
        throw ServerError(
            fmt::format("{}: the key has {} bits, expected {} or more", files.certificate.string(), bits, least));
    }
    warnOfReaders(files.key, log);
}

bool TlsKeys::certify(const std::string& name) const {
    return gnutls_x509_crt_check_hostname(_certificate.get(), name.c_str()) != 0;
}

} // namespace ObjectManager::Server

/** The server's certificate and key. */
#ifndef SERVER_TLSKEYS_H
#define SERVER_TLSKEYS_H

#include "server/EventLog.h"
#include "server/Settings.h"

#include <gnutls/gnutls.h>
#include <gnutls/x509.h>

#include <memory>
#include <string>

namespace ObjectManager::Server {

/** The certificate, key and algorithms that TLS sessions use. A session keeps those with which it began. */
class TlsKeys {
public:
    /**
     * @param log gets warnings about unsafe files.
     * @throws ServerError if the files cannot be read or do not belong together, the certificate has expired, or a key
     *         is too weak.
     */
    TlsKeys(const Tls& files, const Log& log);

    gnutls_certificate_credentials_t credentials() const { return _credentials.get(); }
    gnutls_priority_t priorities() const { return _priorities.get(); }
    /** Whether the certificate says that the server has this name. */
    bool certify(const std::string& name) const;

private:
    struct Free {
        void operator()(gnutls_certificate_credentials_t credentials) const {
            gnutls_certificate_free_credentials(credentials);
        }
        void operator()(gnutls_priority_t priorities) const { gnutls_priority_deinit(priorities); }
        void operator()(gnutls_x509_crt_t certificate) const { gnutls_x509_crt_deinit(certificate); }
    };
    template <typename Handle>
    using Owner = std::unique_ptr<std::remove_pointer_t<Handle>, Free>;

    Owner<gnutls_certificate_credentials_t> _credentials;
    Owner<gnutls_priority_t> _priorities;
    Owner<gnutls_x509_crt_t> _certificate;
};

} // namespace ObjectManager::Server

#endif

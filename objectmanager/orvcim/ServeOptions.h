/**
 * The options of the command `serve`.
 */
#ifndef ORVCIM_SERVEOPTIONS_H
#define ORVCIM_SERVEOPTIONS_H

#include "broker/Broker.h"
#include "cimxml/Enumerations.h"
#include "server/Settings.h"

#include <cstdint>
#include <filesystem>
#include <optional>

namespace CLI {
class App;
}

namespace ObjectManager::Orvcim {

/** The values of the options. */
struct ServeOptions {
    /** The server's settings. Its port and TLS files are not set by the options, but by the members below. */
    Server::Settings server;
    CimXml::EnumerationLimits enumerations;
    RequestLimits request;
    /** No value for the protocol's own port: 5988, with TLS 5989. */
    std::optional<std::uint16_t> port;
    /** The files of the certificate and its key; empty without TLS. */
    std::filesystem::path certificate;
    std::filesystem::path key;
    /** Whether clients must log in. */
    bool authenticate = false;
    Server::PamSettings pam;
    /** Whether to log to the system's log instead of standard error. */
    bool syslog = false;
};

/** Declares the options of the command. */
void addServeOptions(CLI::App& command, ServeOptions& options);

} // namespace ObjectManager::Orvcim

#endif

/**
 * The part of the command line that is about serving clients on the network.
 */
#ifndef ORVCIM_SERVEOPTIONS_H
#define ORVCIM_SERVEOPTIONS_H

#include "cimxml/Enumerations.h"
#include "server/Settings.h"

#include <cstdint>
#include <filesystem>
#include <optional>

namespace CLI {
class App;
}

namespace ObjectManager::Orvcim {

/** What `serve` is asked for. */
struct ServeOptions {
    /** Its port is that of the protocol where none is asked for. */
    Server::Settings server;
    CimXml::EnumerationLimits enumerations;
    std::optional<std::uint16_t> port;
    /** Empty where there is no TLS. */
    std::filesystem::path certificate;
    std::filesystem::path key;
    /** Clients have to log in. */
    bool authenticate = false;
    Server::PamSettings pam;
    /** Log to the system's log rather than to standard error. */
    bool syslog = false;
};

/** Declares the options of the command. */
void addServeOptions(CLI::App& command, ServeOptions& options);

} // namespace ObjectManager::Orvcim

#endif

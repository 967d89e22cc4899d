#include "orvcim/ServeOptions.h"

#include "server/HttpServer.h"
#include "server/ListenSocket.h"

#include <CLI/CLI.hpp>
#include <fmt/format.h>

#include <chrono>
#include <string>

namespace ObjectManager::Orvcim {

namespace {

CLI::Option* addText(CLI::App& subcommand, const std::string& option, std::string& value,
                     const std::string& description, const std::string& type) {
    return subcommand.add_option(option, value, description)->type_name(type)->capture_default_str();
}

template <typename Count>
void addCount(CLI::App& subcommand, const std::string& option, Count& value, const std::string& description,
              int most = 1'000'000'000) {
    constexpr int least = 1;
    subcommand.add_option(option, value, description)
        ->check(CLI::Range(least, most).description(""))
        ->type_name("N")
        ->capture_default_str();
}

/** What is wrong with a time; empty if it is valid. */
std::string problemOfTime(const std::string& text) {
    constexpr double least = 0.1;
    constexpr double most = 86'400;
    double seconds = 0;
    return CLI::detail::lexical_cast(text, seconds) && seconds >= least && seconds <= most
               ? std::string()
               : fmt::format("found {}, expected seconds from {} to {}", text, least, most);
}

void addTime(CLI::App& subcommand, const std::string& option, std::chrono::milliseconds& value,
             const std::string& description) {
    subcommand
        .add_option_function<double>(
            option,
            [&value](double seconds) {
                value = std::chrono::round<std::chrono::milliseconds>(std::chrono::duration<double>(seconds));
            },
            description)
        ->check(CLI::Validator(problemOfTime, ""))
        ->type_name("SECONDS")
        ->default_str(fmt::format("{}", std::chrono::duration<double>(value).count()));
}

/** What is wrong with an address; empty if it is valid. */
std::string problemOfAddress(const std::string& text) {
    try {
        const Server::Address address(text);
        return "";
    } catch (const Server::ServerError& error) {
        return error.what();
    }
}

} // namespace

void addServeOptions(CLI::App& command, ServeOptions& options) {
    Server::Settings& server = options.server;
    Server::Limits& limits = server.limits;
    command.add_option("--listen", server.address, "Address to listen on")
        ->check(CLI::Validator(problemOfAddress, ""))
        ->type_name("ADDRESS")
        ->capture_default_str();
    command.add_option("--port", options.port, "Port to listen on; 0 for any free port (default: 5988, with TLS 5989)")
        ->type_name("PORT");
    command.add_option("--tls-cert", options.certificate, "Serve with TLS: file with the certificate, in PEM")
        ->type_name("FILE");
    command.add_option("--tls-key", options.key, "File with the certificate's private key, in PEM")->type_name("FILE");
    CLI::Option* const authenticate =
        command.add_flag("--authenticate", options.authenticate, "Clients must log in; PAM checks their passwords");
    addText(command, "--pam-service", options.pam.service, "PAM service that checks log-ins", "NAME")
        ->needs(authenticate);
    command.add_option("--pam-folder", options.pam.folder, "Folder of PAM service files, instead of the system's")
        ->type_name("DIR")
        ->needs(authenticate);
    addText(command, "--read-group", options.pam.readGroup,
            "Group whose members may read (default: everyone who can log in)", "GROUP")
        ->needs(authenticate);
    addText(command, "--power-group", options.pam.powerGroup,
            "Group whose members may read and change the power state; with --allow-root, root may too", "GROUP")
        ->needs(authenticate);
    command.add_flag("--allow-root", options.pam.allowRoot, "Let root log in")->needs(authenticate);
    command
        .add_flag("--allow-without-shell", options.pam.allowWithoutShell,
                  "Let users without a log-in shell log in (see shells(5))")
        ->needs(authenticate);
    command
        .add_option("--host", server.hosts, "Another host name by which clients may address this server (repeatable)")
        ->type_name("NAME");
    command.add_flag("--syslog", options.syslog, "Log to the system's log instead of standard error");
    command.add_flag("--access-log", server.accessLog, "Log each request in one line");
    constexpr int mostThreads = 1000;
    addCount(command, "--threads", server.threads, "Requests that are answered at the same time", mostThreads);
    addCount(command, "--max-body", limits.bodyBytes, "Largest body of a request, in bytes");
    addCount(command, "--max-bodies", limits.allBodiesBytes, "Largest size of all requests' bodies together, in bytes");
    addCount(command, "--max-answers", limits.allAnswersBytes, "Memory that large answers may take, in bytes");
    addCount(command, "--max-headers", limits.headerBytes, "Largest size of a request's headers, in bytes");
    addCount(command, "--max-connections", limits.connections, "Connections that may be open at the same time");
    addCount(command, "--max-connections-per-address", limits.connectionsPerAddress,
             "Connections that may be open from one network at the same time");
    addTime(command, "--request-time", limits.requestTime, "Seconds within which a request must arrive");
    addTime(command, "--idle-time", limits.idleTime, "Seconds after which an idle connection is closed");
    addCount(command, "--max-objects", options.request.objects, "Objects that a provider returns for one request");
    addCount(command, "--max-memory", options.request.bytes, "Bytes of all objects of one request");
    addCount(command, "--max-enumerations", options.enumerations.count,
             "Enumerations that may be open at the same time; one user may have half of them");
    addCount(command, "--max-enumeration-bytes", options.enumerations.bytes,
             "Memory that open enumerations may hold, in bytes; one user may have half of it");
    addTime(command, "--enumeration-time", options.enumerations.time,
            "Seconds after which an enumeration is closed if the client pulls nothing from it");
}

} // namespace ObjectManager::Orvcim

/** The settings of a server. */
#ifndef SERVER_SETTINGS_H
#define SERVER_SETTINGS_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace ObjectManager::Server {

/** Limits for what clients may use of the server. */
struct Limits {
    /** The largest body of a request, and the largest first line with its headers, in bytes. */
    std::size_t bodyBytes = std::size_t{1024} * 1024;
    std::size_t headerBytes = std::size_t{16} * 1024;
    /** Memory for all bodies together, in bytes; the first 16 KiB of each body do not count. */
    std::size_t allBodiesBytes = std::size_t{64} * 1024 * 1024;
    /** Memory for all answers together, in bytes; the first 256 KiB of each answer do not count. */
    std::size_t allAnswersBytes = std::size_t{64} * 1024 * 1024;
    /** How many connections may be open, in all and from one network (see networkOf). */
    unsigned int connections = 1000;
    unsigned int connectionsPerAddress = 500;
    /** The time within which a request has to arrive as a whole. */
    std::chrono::milliseconds requestTime = std::chrono::seconds{30};
    /** The time after which a connection without a request is closed, and one whose client takes none of its answer. */
    std::chrono::milliseconds idleTime = std::chrono::seconds{60};
};

/** The files of the server's certificate and key, in the format PEM. */
struct Tls {
    /** The server's certificate, followed by those that lead to its root, if any. */
    std::filesystem::path certificate;
    std::filesystem::path key;
};

struct Settings {
    /** A numeric IPv4 or IPv6 address. */
    std::string address = "127.0.0.1";
    /** 0 for any free port. */
    std::uint16_t port = 0;
    std::optional<Tls> tls;
    /** How many requests are answered at a time. */
    unsigned int threads = 8;
    /** Names that clients may use in the header Host, beside addresses, the machine's names and the certificate's. */
    std::vector<std::string> hosts;
    /** Whether each request is logged. */
    bool accessLog = false;
    Limits limits;
    /** The time after which a failed log-in is answered. */
    std::chrono::milliseconds failedLogInDelay = std::chrono::seconds{2};
    /** The time within which a client has to take 64 KiB of its answer while other answers wait for memory. */
    std::chrono::milliseconds hurryTime = std::chrono::seconds{10};
    /** How long a server that stops waits for the answers that are being made or sent. */
    std::chrono::milliseconds stopTime = std::chrono::seconds{8};
};

/** How PAM checks log-ins, and which rights users have by their groups. */
struct PamSettings {
    /** The name of the PAM service. */
    std::string service = "orvcim";
    /** The folder of PAM's service files; empty for the system's. */
    std::filesystem::path folder;
    /** The group whose members may read; empty if every user who can log in may read. */
    std::string readGroup;
    /** The group whose members may read and change the power state. Root may, too, if root may log in. */
    std::string powerGroup = "orv-power";
    /** Whether root may log in. */
    bool allowRoot = false;
    /** Whether users may log in who have no log-in shell (see shells(5)) or are unknown to the system. */
    bool allowWithoutShell = false;
};

} // namespace ObjectManager::Server

#endif

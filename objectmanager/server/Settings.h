/** What a server can be told. */
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

/** What clients may take of the server. */
struct Limits {
    /** Size of a request's body, and of its first line with its headers. */
    std::size_t bodyBytes = std::size_t{1024} * 1024;
    std::size_t headerBytes = std::size_t{16} * 1024;
    /** Memory of all bodies beyond the first 16 KiB of each. */
    std::size_t allBodiesBytes = std::size_t{64} * 1024 * 1024;
    /** Memory of what answers are made of, beyond the first 256 KiB of each. */
    std::size_t allAnswersBytes = std::size_t{64} * 1024 * 1024;
    /** Connections at a time, altogether and from one network (see networkOf). */
    unsigned int connections = 1000;
    unsigned int connectionsPerAddress = 500;
    /** In which a request has to arrive as a whole. */
    std::chrono::milliseconds requestTime = std::chrono::seconds{30};
    /** After which a connection without a request is closed, and one whose client takes nothing of its answer. */
    std::chrono::milliseconds idleTime = std::chrono::seconds{60};
};

/** Files in PEM. */
struct Tls {
    /** The server's certificate, followed by those that lead to its root, if any. */
    std::filesystem::path certificate;
    std::filesystem::path key;
};

struct Settings {
    /** A numeric IPv4 or IPv6 address. */
    std::string address = "127.0.0.1";
    /** 0 for any that is free. */
    std::uint16_t port = 0;
    std::optional<Tls> tls;
    /** Requests that are served at a time. */
    unsigned int threads = 8;
    /** Names in the header Host that clients may use beside addresses, the machine's name and its certificate's. */
    std::vector<std::string> hosts;
    /** Logs each request. */
    bool accessLog = false;
    Limits limits;
    /** After which a failed log-in is answered. */
    std::chrono::milliseconds failedLogInDelay = std::chrono::seconds{2};
    /** In which a client has to take 64 KiB of its answer where others wait for the memory that it takes. */
    std::chrono::milliseconds hurryTime = std::chrono::seconds{10};
    /** How long a stopping server waits for the answers under way. */
    std::chrono::milliseconds stopTime = std::chrono::seconds{8};
};

/** How PAM is asked who a client is, and what his groups let him do. */
struct PamSettings {
    /** PAM's service. */
    std::string service = "orvcim";
    /** Of PAM's service files; empty for the system's. */
    std::filesystem::path folder;
    /** Whose members may read; empty for every user who can log in. */
    std::string readGroup;
    /** Whose members may read and change the power state. Root may as well, if root may log in. */
    std::string powerGroup = "orv-power";
    /** Root may log in. */
    bool allowRoot = false;
    /** Users may log in who have no log-in shell (see shells(5)) or are not known to the system. */
    bool allowWithoutShell = false;
};

} // namespace ObjectManager::Server

#endif

/** What a program that runs as a service tells whoever started it: the protocol of sd_notify(3). */
#ifndef ORVCIM_SERVICEMANAGER_H
#define ORVCIM_SERVICEMANAGER_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager::Orvcim {

/**
 * The service manager, as far as one has started the program and wants to hear of it. The protocol is spoken without
 * systemd's library, which is larger than the program and would be loaded with each command.
 */
class ServiceManager {
public:
    /** Reads the environment variables NOTIFY_SOCKET, WATCHDOG_USEC and WATCHDOG_PID. */
    ServiceManager();

    /** How often it wants to hear that the service is alive; not set where it does not. */
    std::optional<std::chrono::microseconds> watchdogInterval() const { return _watchdogInterval; }

    /** Tells it assignments, for example "READY=1". What it does not take is lost: the service goes on without it. */
    void tell(std::string_view assignments) const;

private:
    /** As the environment variable has it; empty where nobody listens. */
    std::string _socket;
    std::optional<std::chrono::microseconds> _watchdogInterval;
};

} // namespace ObjectManager::Orvcim

#endif

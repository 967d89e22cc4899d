/** Notifies the service manager that started the program, by the protocol of sd_notify(3). */
#ifndef ORVCIM_SERVICEMANAGER_H
#define ORVCIM_SERVICEMANAGER_H

#include <chrono>
#include <optional>
#include <string>
#include <string_view>

namespace ObjectManager::Orvcim {

/**
 * The service manager that started the program, if one did and wants notifications. Implements the protocol without
 * systemd's library, which is larger than the program and would be loaded with each command.
 */
class ServiceManager {
public:
    /** Reads the environment variables NOTIFY_SOCKET, WATCHDOG_USEC and WATCHDOG_PID. */
    ServiceManager();

    /** How often the service manager expects a notification that the service is alive; no value if it expects none. */
    std::optional<std::chrono::microseconds> watchdogInterval() const { return _watchdogInterval; }

    /** Sends assignments, for example "READY=1". A failure is ignored: the service goes on. */
    void tell(std::string_view assignments) const;

private:
    /** The value of NOTIFY_SOCKET; empty if no service manager listens. */
    std::string _socket;
    std::optional<std::chrono::microseconds> _watchdogInterval;
};

} // namespace ObjectManager::Orvcim

#endif

/**
 * A message bus of the test's own in place of the machine's, with a systemd-logind that is only played.
 */
#ifndef TESTS_AGENT_PRIVATEBUS_H
#define TESTS_AGENT_PRIVATEBUS_H

#include "TestSupport.h"

#include <string>
#include <utility>
#include <vector>

#include <sys/types.h>

namespace AgentTest {

/**
 * Throws std::runtime_error unless everything that this process and its children do on "the system bus" goes to a bus
 * in `folder`. Called before anything is done that could bring a machine down.
 */
void requireBusIn(const TemporaryFolder& folder);

/** Makes an address that leads nowhere the system bus's for this process: what forgets to set another one fails. */
void forgetSystemBus();

/** A child process, ended with the object. */
class Child {
public:
    Child() = default;
    /**
     * @param arguments the program's file first.
     * @param inherited a descriptor that the child has, too.
     * @param errors the file of its standard error; where it is empty, that of this process.
     */
    explicit Child(const std::vector<std::string>& arguments, int inherited = -1, const std::string& errors = "");
    Child(Child&& other) noexcept : _process(std::exchange(other._process, -1)) {}
    Child& operator=(Child&& other) noexcept {
        std::swap(_process, other._process);
        return *this;
    }
    ~Child() { end(); }

    pid_t process() const { return _process; }
    void end();

private:
    pid_t _process = -1;
};

/** While it exists, DBUS_SYSTEM_BUS_ADDRESS names this bus. */
class PrivateBus {
public:
    /** @param policy elements of dbus-daemon(1)'s configuration that restrict what may be sent. */
    explicit PrivateBus(const std::string& policy = "");
    ~PrivateBus();
    PrivateBus(const PrivateBus&) = delete;
    PrivateBus& operator=(const PrivateBus&) = delete;

    /** Starts a systemd-logind. @param parameters of logind_mock.py, as JSON. */
    void startLogind(const std::string& parameters = "{}");

    /** Ends it again. */
    void endLogind() { _logind.end(); }

    /** The methods that were called, in order, with their arguments: "Reboot False". Without what only reads. */
    std::vector<std::string> requests() const;

    const std::string& address() const { return _address; }
    pid_t daemon() const { return _daemon.process(); }
    const TemporaryFolder& folder() const { return _folder; }

private:
    const TemporaryFolder _folder;
    std::string _address;
    Child _daemon;
    Child _logind;
};

} // namespace AgentTest

#endif

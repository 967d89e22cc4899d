/**
 * A message bus for tests in place of the machine's, with a mock of systemd-logind.
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
 * Throws std::runtime_error unless "the system bus" of this process and its children is a bus in `folder`. Tests call
 * this before anything that could shut down a machine.
 */
void requireBusIn(const TemporaryFolder& folder);

/** Sets an unusable address of the system bus for this process: a test that forgets to set another one fails. */
void forgetSystemBus();

/** A child process, which is ended when the object is destroyed. */
class Child {
public:
    Child() = default;
    /**
     * @param arguments the program's file, followed by its arguments.
     * @param inherited a descriptor that stays open in the child.
     * @param errors the file for the child's standard error; if it is empty, that of this process is used.
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

    /** Starts the mock of systemd-logind. @param parameters of logind_mock.py, as JSON. */
    void startLogind(const std::string& parameters = "{}");

    /** Ends the mock of systemd-logind. */
    void endLogind() { _logind.end(); }

    /**
     * The methods that were called, in order, with their arguments, for example "Reboot False"; without methods that
     * only read.
     */
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

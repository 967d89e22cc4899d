#ifndef LOG_RECORDSOCKET_H
#define LOG_RECORDSOCKET_H

#include "Record.h"

namespace OrvLog {

/**
 * The socket through which a host process learns what its providers log, whatever the thresholds: it puts the number of
 * an open AF_UNIX socket that keeps messages apart into the environment variable ORV_AGENT_LOG_SOCKET before the first
 * record. orv-agent.toml(5) describes the messages.
 */
class RecordSocket {
public:
    /** Anything but the number of such a socket counts as no socket. */
    static RecordSocket fromEnvironment();

    /** Sends a record that is of interest; where there is no socket, or no room in it, does nothing. */
    void send(const Record& record) const;

private:
    explicit RecordSocket(int descriptor) : _descriptor(descriptor) {}

    /** Negative where there is no socket. */
    int _descriptor;
};

} // namespace OrvLog

#endif

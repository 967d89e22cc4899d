#ifndef LOG_DESTINATION_H
#define LOG_DESTINATION_H

#include "Line.h"

#include "config/Configuration.h"

#include <memory>
#include <string>

namespace OrvLog {

/** A destination of log lines. Used by several threads at a time. */
class Destination {
public:
    Destination() = default;
    virtual ~Destination() = default;
    Destination(const Destination&) = delete;
    Destination& operator=(const Destination&) = delete;

    /** The destination's name in messages. */
    virtual std::string name() const = 0;

    /**
     * Writes a line, without waiting.
     *
     * @return 0, or the error number that says why the line is lost.
     */
    virtual int write(const Line& line) = 0;
};

/** The host's standard error. A line that would have to wait is lost. */
std::unique_ptr<Destination> standardErrorDestination();

/**
 * The file of `settings`, rotated as they say. Any number of processes and threads may write and rotate the same file.
 */
std::unique_ptr<Destination> fileDestination(const Norv::Agent::LogSettings& settings);

/** syslog(3), with the identity and the options that the host has set. */
std::unique_ptr<Destination> syslogDestination();

} // namespace OrvLog

#endif

/**
 * Limits how long a host waits for systemd-logind during one request of a client.
 */
#ifndef INSTRUMENTATION_PATIENCE_H
#define INSTRUMENTATION_PATIENCE_H

#include "base/Deadline.h"

#include <chrono>

namespace Norv::Agent {

/**
 * One operation's share of the time that the calling thread may wait for systemd-logind during one request. A host
 * selects nodes several times in one request, and does not say where the next request begins. So the times of a
 * thread's consecutive slow operations are added up, and the next operation gets what remains. A quick operation, or a
 * pause, starts the account anew.
 */
class Patience {
public:
    /** @param whole the time that all operations of a request may take together. */
    explicit Patience(std::chrono::milliseconds whole);
    ~Patience();
    Patience(const Patience&) = delete;
    Patience& operator=(const Patience&) = delete;

    const Deadline& deadline() const { return _deadline; }

private:
    const std::chrono::steady_clock::time_point _begin = std::chrono::steady_clock::now();
    const Deadline _deadline;
};

} // namespace Norv::Agent

#endif

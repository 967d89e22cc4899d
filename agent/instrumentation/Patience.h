/**
 * How long systemd-logind is waited for, by all that a host does in answer to one request.
 */
#ifndef INSTRUMENTATION_PATIENCE_H
#define INSTRUMENTATION_PATIENCE_H

#include "base/Deadline.h"

#include <chrono>

namespace Norv::Agent {

/**
 * One operation's share of the time that the calling thread may wait. A host selects nodes several times to answer one
 * request, and does not say where the next request begins. So the time that slow operations of a thread took, one after
 * the other, is taken from what the next one may take. A quick operation, or a pause, ends the account.
 */
class Patience {
public:
    /** @param whole what all of them may take together. */
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

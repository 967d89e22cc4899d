/**
 * Calls of methods whose true outcome the agent's log tells.
 */
#ifndef ORVCIM_METHODCALL_H
#define ORVCIM_METHODCALL_H

#include "orvcim/Session.h"

#include <vector>

namespace ObjectManager::Orvcim {

struct CallOutcome {
    MethodResult result;
    /** What the agent's log said during the call; empty too where the agent's log cannot be heard. */
    std::vector<LogRecord> records;
};

/**
 * Calls a method.
 *
 * A power request that the agent refused is a failure, also where the provider reports none.
 *
 * @throws CimError, and Failure with the agent's reason.
 */
CallOutcome callMethod(Session& session, const ObjectPath& path, const Method& method,
                       const std::vector<NamedValue>& arguments);

} // namespace ObjectManager::Orvcim

#endif

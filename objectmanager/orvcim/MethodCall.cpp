#include "orvcim/MethodCall.h"

#include "agentlog/AgentLog.h"

#include <utility>

namespace ObjectManager::Orvcim {

CallOutcome callMethod(Session& session, const ObjectPath& path, const Method& method,
                       const std::vector<NamedValue>& arguments) {
    const std::uint64_t before = session.log().newest();
    MethodResult result = session.dispatcher().invokeMethod(Session::invocation(), path, method.name, arguments);
    CallOutcome outcome{std::move(result), session.log().since(before)};
    if (const std::string refusal = powerRequestText(outcome.records, PowerAnswer::refused); !refusal.empty()) {
        throw Failure(refusal);
    }
    return outcome;
}

} // namespace ObjectManager::Orvcim

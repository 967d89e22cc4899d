#include "power/PowerRequests.h"

#include "text/ObjectPathText.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>

namespace ObjectManager {

namespace {

/** The value of an argument that must be given. */
const Value& requiredArgument(const MethodCall& call, std::string_view name) {
    const NamedValue* const argument = find(call.arguments, name);
    if (argument == nullptr || argument->value.isNull()) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       fmt::format("found no argument {}, expected it since {} requires it", name, call.method));
    }
    return argument->value;
}

/** The element whose power state is to change. */
const ObjectPath& elementOf(const MethodCall& call) {
    constexpr std::string_view name = "ManagedElement";
    const auto* const path = std::get_if<std::shared_ptr<const ObjectPath>>(&requiredArgument(call, name).content);
    if (path == nullptr) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       fmt::format("{}: found no reference, expected the path of an instance", name));
    }
    return **path;
}

/** Requests go to one node, whichever service they name. Throws if the service is known to be that of another node. */
void requireActing(const ObjectPath& service, const std::string& node) {
    constexpr std::string_view prefix = "PowerStateManagement_";
    const NamedValue* const key = find(service.keys, "Name");
    const auto* const name = key == nullptr ? nullptr : std::get_if<std::string>(&key->value.content);
    if (!node.empty() && name != nullptr && name->starts_with(prefix) && name->substr(prefix.size()) != node) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       fmt::format("found the service {}, expected {}{}: the agent's node {} takes all power requests",
                                   *name, prefix, node, node));
    }
}

std::string textOf(const std::vector<ObjectPath>& paths) {
    std::vector<std::string> texts;
    texts.reserve(paths.size());
    std::ranges::transform(paths, std::back_inserter(texts), formatLocalPath);
    return texts.empty() ? "none: the service is associated with no system"
                         : fmt::format("{}", fmt::join(texts, " or "));
}

/** As long as this object exists, the agent's log records name the user who made the request. */
class OnBehalfOf {
public:
    OnBehalfOf(const LogTap& log, const Invocation& invocation)
        : _tell(log.agentFunction<Norv::OnBehalfOf1>(Norv::onBehalfOf1Name)),
          _whom(invocation.address.empty()     ? ""
                : invocation.principal.empty() ? invocation.address
                                               : fmt::format("{} from {}", invocation.principal, invocation.address)) {
        tell(_whom.empty() ? nullptr : _whom.c_str());
    }
    OnBehalfOf(const OnBehalfOf&) = delete;
    OnBehalfOf& operator=(const OnBehalfOf&) = delete;
    ~OnBehalfOf() { tell(nullptr); }

private:
    void tell(const char* whom) const {
        if (_tell != nullptr) {
            _tell(whom);
        }
    }

    Norv::OnBehalfOf1* const _tell;
    const std::string _whom;
};

CimError refusal(const std::string& message) {
    CimError error(CMPI_RC_ERR_FAILED, message);
    error.refused = true;
    return error;
}

/** What the agent has reported on a power request. */
struct Report {
    /** The agent's text; no value if it has not accepted a request. */
    std::optional<std::string> accepted;
    /** The agent's text; no value if it has not refused a request. */
    std::optional<std::string> refused;
};

/** The text of the first record of a kind, which begins with `beginning`; no value if there is no such record. */
std::optional<std::string> reported(const std::vector<LogRecord>& records, OrvLog::RecordKind kind,
                                    const char* beginning) {
    const auto found = std::ranges::find(records, static_cast<int>(kind), &LogRecord::kind);
    if (found == records.end()) {
        return std::nullopt;
    }
    return found->text.empty() ? std::string(beginning) + "memory was too short for more" : found->text;
}

/** The agent's report in the calling thread's records after the one numbered `sequence`. */
Report reportSince(const LogTap& log, std::uint64_t sequence) {
    const std::vector<LogRecord> records = log.since(sequence);
    return {reported(records, OrvLog::POWER_REQUEST_ACCEPTED_RECORD, Norv::acceptedRequestText),
            reported(records, OrvLog::POWER_REQUEST_REFUSED_RECORD, Norv::refusedRequestText)};
}

/**
 * The path of the node that gets every power request, whichever service the client names; empty if it is not known.
 */
std::string powerNode(const LogTap& log) {
    auto* const node = log.agentFunction<Norv::PowerNode1>(Norv::powerNode1Name);
    return node == nullptr ? "" : node();
}

/** Whether the agent reports the outcome of every power request in a log record of its own kind. */
bool reportsOutcomes(const LogTap& log) {
    // An instrumentation without Norv::Machine1 does not number its records of power requests either.
    return log.isAttached() && log.agentFunction<Norv::Machine1>(Norv::machine1Name) != nullptr;
}

/** The failure of a call after the machine had accepted the request, with the agent's text about that. */
CimError failureAfter(const std::string& accepted, const CimError& error) {
    CimError failure(error.code, fmt::format("{}; but before: {}", error.what(), accepted));
    failure.reasons = error.reasons;
    return failure;
}

/**
 * Calls the provider. If the call fails after the machine has accepted the request, the failure's message says that it
 * did.
 */
MethodResult answerOf(const std::function<MethodResult()>& provider, const LogTap& log, std::uint64_t before) {
    try {
        return provider();
    } catch (const CimError& error) {
        const Report report = reportSince(log, before);
        if (!report.accepted) {
            throw;
        }
        throw failureAfter(*report.accepted, error);
    }
}

} // namespace

std::vector<ObjectPath> systemsOf(const ObjectPath& service, const Invocation& invocation, Operations& operations) {
    std::vector<ObjectPath> systems;
    for (const auto& found : operations.associatorNames(
             invocation, service, {associatedPowerManagementServiceClass, "", "ServiceProvided", "UserOfService"})) {
        systems.insert(systems.end(), found.objects.begin(), found.objects.end());
    }
    return systems;
}

bool tellsPowerState(const LogTap& log) {
    return log.agentFunction<Norv::PowerState1>(Norv::powerState1Name) != nullptr;
}

std::optional<unsigned int> powerState(const LogTap& log) {
    auto* const tell = log.agentFunction<Norv::PowerState1>(Norv::powerState1Name);
    const int state = tell == nullptr ? -1 : tell();
    return state < 0 ? std::nullopt : std::optional(static_cast<unsigned int>(state));
}

std::string cancelPowerRequest(const LogTap& log) {
    const std::uint64_t before = log.newest();
    if (auto* const cancel = log.agentFunction<Norv::CancelRequest1>(Norv::cancelRequest1Name)) {
        cancel();
    }
    const Report report = reportSince(log, before);
    if (report.refused) {
        throw refusal(*report.refused);
    }
    if (report.accepted) {
        return *report.accepted;
    }
    throw CimError(CMPI_RC_ERR_NOT_SUPPORTED, "the agent cannot be asked to take back a power request");
}

bool PowerRequestRule::isAbout(std::string_view className, std::string_view method) const {
    return equalNames(method, requestPowerStateChangeMethod) && _classes.isA(className, powerManagementServiceClass);
}

MethodOutcome PowerRequestRule::call(const MethodCall& call, Operations& operations,
                                     const std::function<MethodResult()>& provider) const {
    requiredArgument(call, "PowerState");
    const ObjectPath& element = elementOf(call);
    const std::vector<ObjectPath> systems = systemsOf(call.target, call.invocation, operations);
    if (std::ranges::find(systems, element) == systems.end()) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       fmt::format("ManagedElement: found {}, expected an element whose power the service manages: {}",
                                   formatLocalPath(element), textOf(systems)));
    }

    requireActing(call.target, powerNode(_log));

    const std::uint64_t before = _log.newest();
    const OnBehalfOf behalf(_log, call.invocation);
    MethodResult result = answerOf(provider, _log, before);
    const Report report = reportSince(_log, before);
    if (report.refused) {
        throw refusal(*report.refused);
    }
    if (report.accepted) {
        return {std::move(result), *report.accepted};
    }
    if (result.returnValue != unsignedValue(CMPI_uint32, 0)) {
        return {std::move(result)};
    }
    if (reportsOutcomes(_log)) {
        throw refusal(fmt::format("{} ended without a failure, but the agent accepted no power request", call.method));
    }
    return {std::move(result), "the outcome is not known beyond the return value: the agent cannot be observed", false};
}

} // namespace ObjectManager

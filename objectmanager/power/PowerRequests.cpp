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
        : _log(log),
          _whom(invocation.address.empty()     ? ""
                : invocation.principal.empty() ? invocation.address
                                               : fmt::format("{} from {}", invocation.principal, invocation.address)) {
        _log.actFor(_whom.empty() ? nullptr : _whom.c_str());
    }
    OnBehalfOf(const OnBehalfOf&) = delete;
    OnBehalfOf& operator=(const OnBehalfOf&) = delete;
    ~OnBehalfOf() { _log.actFor(nullptr); }

private:
    const LogTap& _log;
    const std::string _whom;
};

CimError refusal(const std::string& message) {
    CimError error(CMPI_RC_ERR_FAILED, message);
    error.refused = true;
    return error;
}

/** The first record of a kind; null if there is none. */
const LogRecord* find(const std::vector<LogRecord>& records, OrvLog::RecordKind kind) {
    const auto found = std::ranges::find(records, static_cast<int>(kind), &LogRecord::kind);
    return found == records.end() ? nullptr : &*found;
}

/**
 * Calls the provider. If the call fails after the machine has accepted the request, the failure's message says that it
 * did.
 */
MethodResult answerOf(const std::function<MethodResult()>& provider, const LogTap& log, std::uint64_t before) {
    try {
        return provider();
    } catch (const CimError& error) {
        const std::vector<LogRecord> records = log.since(before);
        const LogRecord* const accepted = find(records, OrvLog::POWER_REQUEST_ACCEPTED_RECORD);
        if (accepted == nullptr) {
            throw;
        }
        CimError failure(error.code, fmt::format("{}; but before: {}", error.what(), accepted->text));
        failure.reasons = error.reasons;
        throw failure;
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

std::string cancelPowerRequest(const LogTap& log) {
    const std::uint64_t before = log.newest();
    log.cancelPowerRequest();
    const std::vector<LogRecord> records = log.since(before);
    if (const LogRecord* const refused = find(records, OrvLog::POWER_REQUEST_REFUSED_RECORD)) {
        throw refusal(refused->text);
    }
    if (const LogRecord* const accepted = find(records, OrvLog::POWER_REQUEST_ACCEPTED_RECORD)) {
        return accepted->text;
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

    requireActing(call.target, _log.powerNode());

    const std::uint64_t before = _log.newest();
    const OnBehalfOf behalf(_log, call.invocation);
    MethodResult result = answerOf(provider, _log, before);
    const std::vector<LogRecord> records = _log.since(before);
    if (const LogRecord* const refused = find(records, OrvLog::POWER_REQUEST_REFUSED_RECORD)) {
        throw refusal(refused->text);
    }
    if (const LogRecord* const accepted = find(records, OrvLog::POWER_REQUEST_ACCEPTED_RECORD)) {
        return {std::move(result), accepted->text};
    }
    if (result.returnValue != unsignedValue(CMPI_uint32, 0)) {
        return {std::move(result)};
    }
    if (_log.hearsPowerRequests()) {
        throw refusal(fmt::format("{} ended without a failure, but the agent accepted no power request", call.method));
    }
    return {std::move(result), "the outcome is not known beyond the return value: the agent cannot be observed", false};
}

} // namespace ObjectManager

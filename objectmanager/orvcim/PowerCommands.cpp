#include "agentlog/AgentLog.h"
#include "orvcim/Commands.h"
#include "orvcim/MethodCall.h"
#include "text/ObjectPathText.h"

#include <fmt/format.h>

#include <unistd.h>

#include <algorithm>
#include <iostream>
#include <iterator>

namespace ObjectManager::Orvcim {

namespace {

constexpr const char* capabilitiesClass = "TALVO_PowerManagementCapabilities";
constexpr const char* associationClass = "TALVO_AssociatedPowerManagementService";
constexpr const char* requestMethod = "RequestPowerStateChange";

/** In between: the machine is on its way from one of the other states to another. */
constexpr std::uint64_t otherPowerState = 1;

struct PowerRequest {
    std::uint64_t powerState;
    /** What the person is asked about. */
    const char* verb;
};

constexpr PowerRequest reboot{5, "reboot"};
constexpr PowerRequest shutdown{8, "shut down"};

std::vector<Instance> instancesOf(Session& session, const char* className) {
    return session.dispatcher().enumerateInstances(Session::invocation(),
                                                   {{}, session.options().nameSpace, className, {}}, std::nullopt);
}

/** Whether the class is served in the namespace. */
bool isServed(Session& session, const char* className) {
    try {
        session.dispatcher().registry().find(session.options().nameSpace, className, ProviderKind::instance);
        return true;
    } catch (const CimError&) {
        return false;
    }
}

/** The property for people; empty where the instance has none. */
std::string textOf(const Session& session, const Instance& instance, const char* name) {
    const NamedValue* property = find(instance.properties, name);
    const Class* known = session.catalogue().find(instance.path.className);
    return property == nullptr ? "" : plainText(property->value, known == nullptr ? nullptr : known->property(name));
}

/** The key called Name of the object that a property refers to; the whole reference where it has none. */
std::string nameBehind(const Session& session, const Instance& instance, const char* reference) {
    const NamedValue* property = find(instance.properties, reference);
    const auto* path =
        property == nullptr ? nullptr : std::get_if<std::shared_ptr<const ObjectPath>>(&property->value.content);
    const NamedValue* name = path == nullptr ? nullptr : find((*path)->keys, "Name");
    return name == nullptr ? textOf(session, instance, reference) : plainText(name->value, nullptr);
}

/** The power state for people, to whom "Other" alone says nothing. */
std::string stateText(const Session& session, const Instance& association) {
    const NamedValue* state = find(association.properties, "PowerState");
    const bool other = state != nullptr && state->value == unsignedValue(CMPI_uint16, otherPowerState);
    return textOf(session, association, "PowerState") + (other ? ", as while it reboots or shuts down" : "");
}

/** The service that the command is about. */
ObjectPath serviceOf(Session& session) {
    const std::vector<ObjectPath> services = session.dispatcher().enumerateInstanceNames(
        Session::invocation(), {{}, session.options().nameSpace, powerServiceClass, {}});
    if (!session.options().service.empty()) {
        ObjectPath chosen = session.instancePath(session.options().service);
        if (std::find(services.begin(), services.end(), chosen) == services.end()) {
            throw Failure(fmt::format("found no service {}, expected one of those that 'orvcim names {}' lists",
                                      formatLocalPath(chosen), powerServiceClass));
        }
        return chosen;
    }
    if (services.size() != 1) {
        throw Failure(fmt::format("found {} instances of {}, expected one{}", services.size(), powerServiceClass,
                                  services.empty() ? "" : ", or --service PATH to choose"));
    }
    return services.front();
}

/** Asks before a machine is acted upon that may be more than a simulation. */
void confirm(Session& session, const PowerRequest& request, const std::string& systemName) {
    if (session.options().yes || session.isSimulated()) {
        return;
    }
    if (isatty(STDIN_FILENO) == 0) {
        throw Failure(fmt::format("{} is not known to be a simulated machine: expected --yes, or a terminal to ask on",
                                  systemName));
    }
    std::cerr << fmt::format("Really {} {}? [y/N] ", request.verb, systemName) << std::flush;
    std::string answer;
    std::getline(std::cin, answer);
    if (!equalNames(answer, "y") && !equalNames(answer, "yes")) {
        throw Failure(fmt::format("not confirmed: {} was left alone", systemName));
    }
}

/** The text of a key that the service must have. */
Value keyOf(const ObjectPath& service, const char* name) {
    const NamedValue* key = find(service.keys, name);
    if (key == nullptr) {
        throw Failure(
            fmt::format("found no key {} in {}, expected it to name the machine", name, formatLocalPath(service)));
    }
    return key->value;
}

/** The agent's own word on the request. Throws where it is known that there was none. */
std::string confirmationOf(const CallOutcome& outcome) {
    std::string accepted = powerRequestText(outcome.records, PowerAnswer::accepted);
    if (accepted.empty() && !outcome.records.empty()) {
        throw Failure(
            fmt::format("{} ended without a failure, but the agent accepted no power request", requestMethod));
    }
    return accepted;
}

void requestPowerState(Session& session, const PowerRequest& request) {
    const ObjectPath service = serviceOf(session);
    const ObjectPath system{
        {},
        service.nameSpace,
        "TALVO_ComputerSystem",
        {{"CreationClassName", keyOf(service, "SystemCreationClassName")}, {"Name", keyOf(service, "SystemName")}}};
    confirm(session, request, plainText(keyOf(service, "SystemName"), nullptr));

    const Class* known = session.catalogue().find(powerServiceClass);
    const Method* method = known == nullptr ? nullptr : known->method(requestMethod);
    if (method == nullptr) {
        throw Failure(fmt::format("found no method {} of {} in {}, expected its declaration", requestMethod,
                                  powerServiceClass, session.schemaFolder().string()));
    }
    const CallOutcome outcome = callMethod(
        session, service, *method,
        {{"PowerState", unsignedValue(CMPI_uint16, request.powerState)}, {"ManagedElement", referenceValue(system)}});
    const std::string text = plainText(outcome.result.returnValue, method);
    if (outcome.result.returnValue != unsignedValue(CMPI_uint32, 0)) {
        throw Failure(fmt::format("{} failed with {}", requestMethod, text));
    }
    const std::string accepted = confirmationOf(outcome);
    if (session.options().format != Format::table || accepted.empty()) {
        session.writer().methodResult(*method, outcome.result.returnValue, outcome.result.outArguments);
    } else {
        session.out() << accepted << '\n';
    }
}

} // namespace

void powerStatus(Session& session) {
    std::vector<std::vector<std::string>> rows;
    if (isServed(session, associationClass)) {
        const std::vector<Instance> states = instancesOf(session, associationClass);
        rows.push_back({"SYSTEM", "SERVICE", "POWER STATE"});
        for (const Instance& state : states) {
            rows.push_back({nameBehind(session, state, "UserOfService"), nameBehind(session, state, "ServiceProvided"),
                            stateText(session, state)});
        }
        session.writer().summary(rows, states);
        return;
    }
    std::cerr << fmt::format("orvcim: the power state itself is not served: {} is not registered in {}\n",
                             associationClass, session.options().nameSpace);
    std::vector<Instance> instances = instancesOf(session, powerServiceClass);
    rows.push_back({"SERVICE OR CAPABILITIES", "POWER STATES THAT CAN BE ASKED FOR"});
    std::vector<Instance> capabilities = instancesOf(session, capabilitiesClass);
    std::move(capabilities.begin(), capabilities.end(), std::back_inserter(instances));
    for (const Instance& instance : instances) {
        rows.push_back({textOf(session, instance, "ElementName"), textOf(session, instance, "PowerStatesSupported")});
    }
    session.writer().summary(rows, instances);
}

void powerReboot(Session& session) {
    requestPowerState(session, reboot);
}

void powerShutdown(Session& session) {
    requestPowerState(session, shutdown);
}

} // namespace ObjectManager::Orvcim

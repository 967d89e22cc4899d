#include "config/PowerStates.h"
#include "orvcim/Commands.h"
#include "text/ObjectPathText.h"
#include "text/StatusText.h"

#include <fmt/format.h>

#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <iostream>
#include <iterator>
#include <optional>
#include <thread>

namespace ObjectManager::Orvcim {

namespace {

constexpr const char* capabilitiesClass = "TALVO_PowerManagementCapabilities";
constexpr const char* associationClass = "TALVO_AssociatedPowerManagementService";

/** "Other": the machine reboots or shuts down. */
constexpr std::uint64_t otherPowerState = 1;

struct PowerRequest {
    std::uint64_t powerState;
    /** Completes the question that asks for confirmation. */
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

/** The property's value for people; empty if the instance does not have it. */
std::string textOf(const Session& session, const Instance& instance, const char* name) {
    const NamedValue* property = find(instance.properties, name);
    const Class* known = session.catalogue().find(instance.path.className);
    return property == nullptr ? "" : plainText(property->value, known == nullptr ? nullptr : known->property(name));
}

/** The key Name of the object that a property refers to; the whole reference if the object has no such key. */
std::string nameBehind(const Session& session, const Instance& instance, const char* reference) {
    const NamedValue* property = find(instance.properties, reference);
    const auto* path =
        property == nullptr ? nullptr : std::get_if<std::shared_ptr<const ObjectPath>>(&property->value.content);
    const NamedValue* name = path == nullptr ? nullptr : find((*path)->keys, "Name");
    return name == nullptr ? textOf(session, instance, reference) : plainText(name->value, nullptr);
}

/** The power state in an instance of the association; no value if it is not known. */
std::optional<std::uint64_t> stateOf(const Instance& association) {
    const NamedValue* const state = find(association.properties, "PowerState");
    const auto* const number = state == nullptr ? nullptr : std::get_if<std::uint64_t>(&state->value.content);
    return number == nullptr || *number == 0 ? std::nullopt : std::optional(*number);
}

/** The power state for people; "Other" is explained. */
std::string stateText(const Session& session, const Instance& association) {
    const std::optional<std::uint64_t> state = stateOf(association);
    return !state ? "unknown"
                  : textOf(session, association, "PowerState") +
                        (*state == otherPowerState ? ", as while it reboots or shuts down" : "");
}

using Rows = std::vector<std::vector<std::string>>;

Rows rowsOf(const Session& session, const std::vector<Instance>& states) {
    Rows rows = {{"SYSTEM", "SERVICE", "POWER STATE"}};
    for (const Instance& state : states) {
        rows.push_back({nameBehind(session, state, "UserOfService"), nameBehind(session, state, "ServiceProvided"),
                        stateText(session, state)});
    }
    return rows;
}

[[noreturn]] void failAsUnknown(Session& session) {
    const std::string reasons = reasonsText(session.log().failuresSince(0), ": ");
    throw Failure("the power state is unknown" + (reasons.empty() ? ": 'orvcim check' says what is wrong" : reasons));
}

/** Throws if there is no state, or if one of them is not known. */
void requireKnown(Session& session, const std::vector<Instance>& states) {
    if (states.empty() ||
        !std::ranges::all_of(states, [](const Instance& each) { return stateOf(each).has_value(); })) {
        failAsUnknown(session);
    }
}

/** The time between two looks at the power state. */
constexpr std::chrono::milliseconds lookAgain{200};

/** Shows the states each time that they change, until the program is interrupted. */
[[noreturn]] void watch(Session& session) {
    Rows shown;
    for (;;) {
        const std::vector<Instance> states = instancesOf(session, associationClass);
        requireKnown(session, states);
        if (Rows rows = rowsOf(session, states); rows != shown) {
            session.writer().summary(rows, states);
            session.out() << std::flush;
            shown = std::move(rows);
        }
        session.log().forget();
        std::this_thread::sleep_for(lookAgain);
    }
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

/** Asks the user for confirmation unless the machine is known to be a simulated one. */
void confirm(Session& session, const PowerRequest& request, const std::string& systemName) {
    if (session.options().yes || session.isSimulated()) {
        return;
    }
    if (isatty(STDIN_FILENO) == 0) {
        throw Failure(fmt::format("{} is not known to be a simulated machine: expected --yes, or a terminal "
                                  "on which to ask for confirmation",
                                  systemName));
    }
    std::cerr << fmt::format("Really {} {}? [y/N] ", request.verb, systemName) << std::flush;
    std::string answer;
    std::getline(std::cin, answer);
    if (!equalNames(answer, "y") && !equalNames(answer, "yes")) {
        throw Failure(fmt::format("not confirmed: {} was left alone", systemName));
    }
}

/** The one machine whose power the service manages. */
ObjectPath systemOf(Session& session, const ObjectPath& service) {
    const std::vector<ObjectPath> systems = systemsOf(service, Session::invocation(), session.dispatcher());
    if (systems.size() != 1) {
        throw Failure(fmt::format("found {} systems that are associated with {}, expected one", systems.size(),
                                  formatLocalPath(service)));
    }
    return systems.front();
}

/** The system's name for people. */
std::string nameOf(const ObjectPath& system) {
    const NamedValue* const name = find(system.keys, "Name");
    return name == nullptr ? formatLocalPath(system) : plainText(name->value, nullptr);
}

/** The machine that a service switches. */
struct Switched {
    ObjectPath service;
    std::string system;
};

/** The machine's power state, for people; no value while it is on its way from one state to another. */
std::optional<std::string> lastingState(Session& session, const Switched& machine) {
    // Of several nodes, clients see the state of the first by name, and requests go to the first in the tree.
    if (tellsPowerState(session.log())) {
        const std::optional<unsigned int> state = powerState(session.log());
        if (!state) {
            failAsUnknown(session);
        }
        return Norv::Agent::isLasting(*state) ? std::optional(Norv::Agent::shownPowerState(*state)) : std::nullopt;
    }
    std::vector<Instance> states = instancesOf(session, associationClass);
    std::erase_if(states, [&](const Instance& state) {
        const NamedValue* const end = find(state.properties, "ServiceProvided");
        return end == nullptr || !(end->value == referenceValue(machine.service));
    });
    requireKnown(session, states);
    return stateOf(states.front()) == otherPowerState ? std::nullopt
                                                      : std::optional(stateText(session, states.front()));
}

/** Waits until the machine has completed the request, and shows its power state. */
void waitForEnd(Session& session, const Switched& machine) {
    using Clock = std::chrono::steady_clock;
    const std::chrono::duration<double> longest(*session.options().waitSeconds);
    const Clock::time_point start = Clock::now();
    for (;; std::this_thread::sleep_for(lookAgain)) {
        if (const std::optional<std::string> state = lastingState(session, machine)) {
            session.out() << machine.system << ": " << *state << '\n';
            return;
        }
        if (Clock::now() - start >= longest) {
            throw Failure(fmt::format("the request is not done after {} s: 'orvcim power status' shows how it goes on",
                                      longest.count()));
        }
    }
}

void requestPowerState(Session& session, const PowerRequest& request) {
    const ObjectPath service = serviceOf(session);
    const ObjectPath system = systemOf(session, service);
    confirm(session, request, nameOf(system));

    const Class* known = session.catalogue().find(powerServiceClass);
    const Method* method = known == nullptr ? nullptr : known->method(requestPowerStateChangeMethod);
    if (method == nullptr) {
        throw Failure(fmt::format("found no method {} of {} in {}, expected its declaration",
                                  requestPowerStateChangeMethod, powerServiceClass, session.schemaFolder().string()));
    }
    const MethodOutcome outcome = session.dispatcher().callMethod(
        Session::invocation(), service, method->name,
        {{"PowerState", unsignedValue(CMPI_uint16, request.powerState)}, {"ManagedElement", referenceValue(system)}});
    const Value& returnValue = outcome.result.returnValue;
    if (returnValue != unsignedValue(CMPI_uint32, 0)) {
        throw Failure(fmt::format("{} failed with {}", method->name, plainText(returnValue, method)));
    }
    if (session.options().format != Format::table || !outcome.isKnown) {
        session.writer().methodResult(*method, returnValue, outcome.result.outArguments);
        reportUnknown(outcome);
    } else {
        session.out() << outcome.remark << '\n' << std::flush;
    }
    if (session.options().waitSeconds) {
        waitForEnd(session, {service, nameOf(system)});
    }
}

} // namespace

void powerStatus(Session& session) {
    if (isServed(session, associationClass)) {
        if (session.options().watch) {
            watch(session);
        }
        const std::vector<Instance> states = instancesOf(session, associationClass);
        if (!states.empty()) {
            session.writer().summary(rowsOf(session, states), states);
        }
        requireKnown(session, states);
        return;
    }
    std::cerr << fmt::format("orvcim: no provider serves the power state: {} is not registered in {}\n",
                             associationClass, session.options().nameSpace);
    std::vector<Instance> instances = instancesOf(session, powerServiceClass);
    Rows rows;
    rows.push_back({"SERVICE OR CAPABILITIES", "POWER STATES THAT CAN BE REQUESTED"});
    std::vector<Instance> capabilities = instancesOf(session, capabilitiesClass);
    std::move(capabilities.begin(), capabilities.end(), std::back_inserter(instances));
    for (const Instance& instance : instances) {
        rows.push_back({textOf(session, instance, "ElementName"), textOf(session, instance, "PowerStatesSupported")});
    }
    session.writer().summary(rows, instances);
    throw Failure("the power state is unknown: no provider serves it");
}

void powerReboot(Session& session) {
    requestPowerState(session, reboot);
}

void powerShutdown(Session& session) {
    requestPowerState(session, shutdown);
}

void powerCancel(Session& session) {
    session.loadAgent();
    session.out() << cancelPowerRequest(session.log()) << '\n';
}

} // namespace ObjectManager::Orvcim

#include "orvcim/Commands.h"
#include "text/Layout.h"
#include "text/ObjectPathText.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <iterator>
#include <string>
#include <vector>

namespace ObjectManager::Orvcim {

namespace {

/** The namespace in which clients look for profiles. */
constexpr const char* discoveryNameSpace = "root/interop";
constexpr std::size_t indent = 2;

/** An association from a central instance to objects that belong to it. */
struct Way {
    const char* label;
    const char* associationClass;
    const char* role;
};

constexpr Way ways[] = {{"hosted by", "CIM_HostedService", "Dependent"},
                        {"manages", "CIM_ServiceAvailableToElement", "ServiceProvided"},
                        {"capabilities", "CIM_ElementCapabilities", "ManagedElement"}};

/** The instances of a class and its descendants in that namespace. */
std::vector<Instance> instancesOf(Session& session, const char* className) {
    Dispatcher& dispatcher = session.dispatcher();
    std::vector<Instance> instances;
    for (const Registration* registration : dispatcher.registry().all(discoveryNameSpace, ProviderKind::instance)) {
        if (session.catalogue().isA(registration->className, className)) {
            dispatcher.enumerateInstances(Session::invocation(), {{}, discoveryNameSpace, registration->className, {}},
                                          std::nullopt,
                                          [&](Instance&& instance) { instances.push_back(std::move(instance)); });
        }
    }
    return instances;
}

/** The value of a property for people; empty if the instance does not have the property. */
std::string textOf(Session& session, const Instance& instance, const std::string& name) {
    const NamedValue* const property = find(instance.properties, name);
    const Class* const known = session.catalogue().find(instance.path.className);
    return property == nullptr ? "" : plainText(property->value, known == nullptr ? nullptr : known->property(name));
}

/** The instances that a way leads to. */
std::vector<Instance> farInstances(Session& session, const ObjectPath& source, const AssociationFilter& filter) {
    std::vector<Instance> instances;
    for (auto& found : session.dispatcher().associators(Session::invocation(), source, filter, std::nullopt)) {
        std::move(found.objects.begin(), found.objects.end(), std::back_inserter(instances));
    }
    return instances;
}

Row pathRow(const std::string& label, const ObjectPath& path) {
    return {{label}, {formatLocalPath(path)}};
}

void writeProfile(Session& session, const Instance& profile) {
    std::vector<Row> rows = {pathRow("profile", profile.path),
                             rowOf({"organization", textOf(session, profile, "RegisteredOrganization")})};
    for (const Instance& other : farInstances(session, profile.path, {"CIM_ReferencedProfile", "", "Dependent", ""})) {
        rows.push_back(rowOf({"refers to", fmt::format("{} {}", textOf(session, other, "RegisteredName"),
                                                       textOf(session, other, "RegisteredVersion"))}));
    }
    for (const Instance& central :
         farInstances(session, profile.path, {"CIM_ElementConformsToProfile", "", "ConformantStandard", ""})) {
        rows.push_back(pathRow("central instance", central.path));
        for (const Way& way : ways) {
            for (const Instance& far : farInstances(session, central.path, {way.associationClass, "", way.role, ""})) {
                rows.push_back(pathRow(way.label, far.path));
                if (const std::string states = textOf(session, far, "PowerStatesSupported"); !states.empty()) {
                    rows.push_back(rowOf({"power states", states}));
                }
            }
        }
    }
    session.out() << fmt::format("\n{} {}\n", textOf(session, profile, "RegisteredName"),
                                 textOf(session, profile, "RegisteredVersion"))
                  << aligned(rows, indent);
}

} // namespace

void listProfiles(Session& session) {
    if (session.options().format != Format::table) {
        throw UsageError("found --format, expected none: profiles writes for people");
    }
    const std::vector<Instance> profiles = instancesOf(session, "CIM_RegisteredProfile");
    if (profiles.empty()) {
        throw Failure(fmt::format("found no registered profile in {}, expected that of power state management",
                                  discoveryNameSpace));
    }
    std::vector<std::string> nameSpaces;
    for (const Instance& nameSpace : instancesOf(session, "CIM_Namespace")) {
        nameSpaces.push_back(textOf(session, nameSpace, "Name"));
    }
    session.out() << fmt::format("Namespaces: {}\n", fmt::join(nameSpaces, ", "));
    std::for_each(profiles.begin(), profiles.end(), [&](const Instance& profile) { writeProfile(session, profile); });
}

} // namespace ObjectManager::Orvcim

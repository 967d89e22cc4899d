/**
 * What announces power state management to clients (DMTF DSP1033): the registered profiles, the services that conform
 * to the one of power state management (DMTF DSP1027), and which profile refers to which.
 */
#include "provider/Log.h"
#include "provider/ServedClass.h"

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

namespace Norv::ProfileProvider {

namespace {

using Provider::Instance;
using Provider::Path;
using Provider::Request;

constexpr const char* registeredProfileClass = "TALVO_RegisteredProfile";
constexpr const char* conformanceClass = "TALVO_ElementConformsToProfile";
constexpr const char* referencedProfileClass = "TALVO_ReferencedProfile";
/** The central class of the profile of power state management. */
constexpr const char* serviceClass = "TALVO_PowerManagementService";

/** What object managers call the namespace of discovery. */
constexpr const char* interopNameSpaces[] = {"root/interop", "interop", "root/PG_InterOp"};
/** Where the services are, if they are not where the request is. */
constexpr const char* serviceNameSpace = "root/cimv2";

/* Values of CIM_RegisteredProfile. */
constexpr CMPIUint16 specificationTypeProfile = 2;
constexpr CMPIUint16 organizationDmtf = 2;
constexpr CMPIUint16 notAdvertised = 2;

/** A profile, in the words of its document. */
struct Profile {
    /** Has the form that CIM_RegisteredSpecification prefers: who made it, a colon, what it names. */
    const char* instanceId;
    const char* name;
    const char* version;
    const char* description;
};

constexpr Profile powerStateManagement = {
    "TALVO:DSP1027-1.0.2", "Power State Management", "1.0.2",
    "Power state management of the computer system on which the object manager runs (DMTF DSP1027)."};
constexpr Profile profileRegistration = {"TALVO:DSP1033-1.0.0", "Profile Registration", "1.0.0",
                                         "Registration of the profiles that are implemented (DMTF DSP1033)."};

Path pathOf(const Profile& profile, const std::string& nameSpace) {
    return {nameSpace, registeredProfileClass, {{"InstanceID", std::string(profile.instanceId)}}};
}

Instance instanceOf(const Profile& profile, const std::string& nameSpace) {
    return {pathOf(profile, nameSpace),
            {{"SpecificationType", specificationTypeProfile},
             {"RegisteredOrganization", organizationDmtf},
             {"RegisteredName", std::string(profile.name)},
             {"RegisteredVersion", std::string(profile.version)},
             {"AdvertiseTypes", std::vector{notAdvertised}},
             {"ElementName", std::string(profile.name)},
             {"Caption", std::string(profile.name)},
             {"Description", std::string(profile.description)}}};
}

/** An association without properties of its own. */
Instance linkOf(const Request& request, const char* className, const char* firstRole, Path first,
                const char* secondRole, Path second) {
    return {{request.nameSpace, className, {{firstRole, std::move(first)}, {secondRole, std::move(second)}}}, {}};
}

bool isInterop(const std::string& nameSpace) {
    return std::any_of(std::begin(interopNameSpaces), std::end(interopNameSpaces),
                       [&](const char* name) { return Provider::isSameName(nameSpace, name); });
}

/**
 * Where the registered profiles are, seen from a request: in its own namespace if that is one of discovery, else in the
 * first of those in which the object manager serves them, else nowhere.
 */
std::vector<Path> registeredProfiles(const Request& request) {
    if (isInterop(request.nameSpace)) {
        return request.namesOf(request.nameSpace.c_str(), registeredProfileClass);
    }
    for (const char* const nameSpace : interopNameSpaces) {
        std::vector<Path> profiles = request.namesOf(nameSpace, registeredProfileClass);
        if (!profiles.empty()) {
            return profiles;
        }
    }
    return request.namesOf(request.nameSpace.c_str(), registeredProfileClass);
}

/** The central instances: each service once, though it is served in several namespaces. */
std::vector<Path> services(const Request& request) {
    std::vector<Path> paths = request.namesOf(serviceNameSpace, serviceClass);
    return paths.empty() ? request.namesOf(request.nameSpace.c_str(), serviceClass) : paths;
}

/** What the classes have in common: where they log. */
class ProfileClass : public Provider::ServedClass {
public:
    using ServedClass::ServedClass;

    void report(const char* message) const override {
        Provider::logFailure(Provider::Site::here(), "Corvane.ProfileProvider", message);
    }
};

class RegisteredProfiles final : public ProfileClass {
public:
    using ProfileClass::ProfileClass;

    std::vector<Instance> instances(const Request& request) const override {
        return {instanceOf(powerStateManagement, request.nameSpace),
                instanceOf(profileRegistration, request.nameSpace)};
    }
};

class Conformances final : public ProfileClass {
public:
    using ProfileClass::ProfileClass;

    std::vector<Instance> instances(const Request& request) const override {
        std::vector<Instance> links;
        for (const Path& profile : registeredProfiles(request)) {
            if (std::get<std::string>(profile.keys.front().value) == powerStateManagement.instanceId) {
                for (const Path& service : services(request)) {
                    links.push_back(
                        linkOf(request, conformanceClass, "ConformantStandard", profile, "ManagedElement", service));
                }
            }
        }
        return links;
    }

    std::vector<const char*> ends() const override { return {registeredProfileClass, serviceClass}; }
};

class References final : public ProfileClass {
public:
    using ProfileClass::ProfileClass;

    std::vector<Instance> instances(const Request& request) const override {
        return {linkOf(request, referencedProfileClass, "Antecedent", pathOf(profileRegistration, request.nameSpace),
                       "Dependent", pathOf(powerStateManagement, request.nameSpace))};
    }

    std::vector<const char*> ends() const override { return {registeredProfileClass}; }
};

/* They are made with the first call of a factory, and end with the library. */

RegisteredProfiles& registeredProfilesServed() {
    static RegisteredProfiles served("RegisteredProfileProvider");
    return served;
}

Conformances& conformancesServed() {
    static Conformances served("ElementConformsToProfileProvider");
    return served;
}

References& referencesServed() {
    static References served("ReferencedProfileProvider");
    return served;
}

} // namespace

extern "C" {

CMPIInstanceMI* RegisteredProfileProvider_Create_InstanceMI(const CMPIBroker* broker, const CMPIContext*, CMPIStatus*) {
    return registeredProfilesServed().instanceMI(broker);
}

CMPIInstanceMI* ElementConformsToProfileProvider_Create_InstanceMI(const CMPIBroker* broker, const CMPIContext*,
                                                                   CMPIStatus*) {
    return conformancesServed().instanceMI(broker);
}

CMPIAssociationMI* ElementConformsToProfileProvider_Create_AssociationMI(const CMPIBroker* broker, const CMPIContext*,
                                                                         CMPIStatus*) {
    return conformancesServed().associationMI(broker);
}

CMPIInstanceMI* ReferencedProfileProvider_Create_InstanceMI(const CMPIBroker* broker, const CMPIContext*, CMPIStatus*) {
    return referencesServed().instanceMI(broker);
}

CMPIAssociationMI* ReferencedProfileProvider_Create_AssociationMI(const CMPIBroker* broker, const CMPIContext*,
                                                                  CMPIStatus*) {
    return referencesServed().associationMI(broker);
}
}

} // namespace Norv::ProfileProvider

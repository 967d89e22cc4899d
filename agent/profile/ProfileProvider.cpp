/**
 * The providers that announce power state management to clients (DMTF DSP1033): they serve the registered profiles, the
 * conformance of services to the profile of power state management (DMTF DSP1027), and the references between profiles.
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
/** The central class in the profile of power state management. */
constexpr const char* serviceClass = "TALVO_PowerManagementService";

/** The names that object managers use for the namespace in which clients look for profiles. */
constexpr const char* interopNameSpaces[] = {"root/interop", "interop", "root/PG_InterOp"};
/** The namespace of the services; if they are not there, they are looked for in the request's own namespace. */
constexpr const char* serviceNameSpace = "root/cimv2";

/* Values of CIM_RegisteredProfile. */
constexpr CMPIUint16 specificationTypeProfile = 2;
constexpr CMPIUint16 organizationDmtf = 2;
constexpr CMPIUint16 notAdvertised = 2;

/** A profile. Name and version are those of the DMTF document that defines it. */
struct Profile {
    /** In the form that CIM_RegisteredSpecification recommends: an organization, a colon, and a local name. */
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

/** An association of two objects, which has no properties but its references. */
Instance linkOf(const Request& request, const char* className, const char* firstRole, Path first,
                const char* secondRole, Path second) {
    return {{request.nameSpace, className, {{firstRole, std::move(first)}, {secondRole, std::move(second)}}}, {}};
}

bool isInterop(const std::string& nameSpace) {
    return std::any_of(std::begin(interopNameSpaces), std::end(interopNameSpaces),
                       [&](const char* name) { return Provider::isSameName(nameSpace, name); });
}

/**
 * The paths of the registered profiles: those in the request's own namespace if it is one of `interopNameSpaces`,
 * otherwise those in the first of `interopNameSpaces` that has any, otherwise those in the request's own namespace.
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

/** The central instances: the services of one namespace, since other namespaces have the same services again. */
std::vector<Path> services(const Request& request) {
    std::vector<Path> paths = request.namesOf(serviceNameSpace, serviceClass);
    return paths.empty() ? request.namesOf(request.nameSpace.c_str(), serviceClass) : paths;
}

/** The base of the classes, which all log failures in the same category. */
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

/* The objects are made by the first call of a factory, and destroyed with the library. */

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

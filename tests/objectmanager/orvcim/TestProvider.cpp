/*
 * A provider library for the tests of orvcim: things that answer every kind of call, and a power management service
 * whose machine is described by environment variables,
 *
 *     ORVCIM_TEST_SERVICES   how many services there are (1)
 *     ORVCIM_TEST_STATE      the number of its power state, or none (2)
 *     ORVCIM_TEST_MACHINE    simulated, real (simulated)
 *     ORVCIM_TEST_ANSWER     accepted, refused, nothing, or the number that the method returns (accepted)
 *
 * Built with ORVCIM_TEST_SILENT it has an agent that cannot be observed.
 */
#include "Norv/Machine.h"
#include "OrvLog/Observer.h"
#include "cmpimacs.h"

#include <cstdint>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

const CMPIBroker* broker = nullptr;

using Instances = std::vector<CMPIInstance*>;

std::string setting(const char* name, const char* otherwise) {
    const char* value = std::getenv(name);
    return value == nullptr ? otherwise : value;
}

const OrvLog::Observer1* observer = nullptr;

/** Writes a record as the agent's log library does. */
void log(int level, const std::string& category, const std::string& text, int kind = OrvLog::ORDINARY_RECORD) {
    if (observer != nullptr) {
        const OrvLog::ObservedRecord1 record{kind, level, category.data(), category.size(), text.data(), text.size()};
        observer->record(observer->context, &record);
    }
}

std::string textOf(const CMPIString* string) {
    return string == nullptr ? "" : CMGetCharPtr(string);
}

std::string keyOf(const CMPIObjectPath* path, const char* name) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIData key = CMGetKey(path, name, &status);
    return status.rc == CMPI_RC_OK ? textOf(key.value.string) : "";
}

CMPIInstance* newInstance(const CMPIObjectPath* request, const char* className,
                          const std::vector<std::pair<const char*, std::string>>& keys, const char** properties) {
    CMPIObjectPath* path =
        CMNewObjectPath(broker, textOf(CMGetNameSpace(request, nullptr)).c_str(), className, nullptr);
    CMSetHostname(path, "testhost");
    std::vector<const char*> names;
    for (const auto& [name, value] : keys) {
        CMAddKey(path, name, value.c_str(), CMPI_chars);
        names.push_back(name);
    }
    names.push_back(nullptr);
    CMPIInstance* instance = CMNewInstance(broker, path, nullptr);
    CMSetPropertyFilter(instance, properties, names.data());
    for (const auto& [name, value] : keys) {
        CMSetProperty(instance, name, value.c_str(), CMPI_chars);
    }
    return instance;
}

CMPIStatus done(const CMPIResult* result) {
    CMReturnDone(result);
    CMReturn(CMPI_RC_OK);
}

CMPIStatus returnNumber(const CMPIResult* result, CMPIUint32 number) {
    CMReturnData(result, &number, CMPI_uint32);
    return done(result);
}

/** The tables and factories of a provider `P`, which has `instances`, and `invoke` where it serves methods. */
template <typename P>
struct Provider {
    static CMPIStatus enumerateNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                                     const CMPIObjectPath* path) {
        for (CMPIInstance* instance : P::instances(path, nullptr)) {
            CMReturnObjectPath(result, CMGetObjectPath(instance, nullptr));
        }
        return done(result);
    }

    static CMPIStatus enumerate(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                                const CMPIObjectPath* path, const char** properties) {
        for (CMPIInstance* instance : P::instances(path, properties)) {
            CMReturnInstance(result, instance);
        }
        return done(result);
    }

    static CMPIStatus get(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath* path,
                          const char** properties) {
        const std::string name = keyOf(path, "Name");
        if (name == "damaged") {
            log(6000, "Test", "MESSAGE [File: x.cpp, Line: 5]: the disk is on fire");
            CMReturnWithChars(broker, CMPI_RC_ERROR_SYSTEM, "cannot be read");
        }
        for (CMPIInstance* instance : P::instances(path, properties)) {
            if (keyOf(CMGetObjectPath(instance, nullptr), "Name") == name) {
                CMReturnInstance(result, instance);
            }
        }
        return done(result);
    }

    static CMPIStatus invoke(CMPIMethodMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath*,
                             const char* method, const CMPIArgs* in, CMPIArgs* out) {
        return P::invoke(result, method, in, out);
    }

    static CMPIStatus refuse() { CMReturn(CMPI_RC_ERR_NOT_SUPPORTED); }
    static CMPIStatus create(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*,
                             const CMPIInstance*) {
        return refuse();
    }
    static CMPIStatus modify(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*,
                             const CMPIInstance*, const char**) {
        return refuse();
    }
    static CMPIStatus remove(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*) {
        return refuse();
    }
    static CMPIStatus query(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*, const char*,
                            const char*) {
        return refuse();
    }
    static CMPIStatus cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) { CMReturn(CMPI_RC_OK); }
    static CMPIStatus methodCleanup(CMPIMethodMI*, const CMPIContext*, CMPIBoolean) { CMReturn(CMPI_RC_OK); }

    static CMPIInstanceMI* instanceMI(const CMPIBroker* given, const char* name) {
        static CMPIInstanceMIFT table = {CMPIVersion200, CMPIVersion200, name, cleanup,
                                         enumerateNames, enumerate,      get,  create,
                                         modify,         remove,         query};
        static CMPIInstanceMI mi = {nullptr, &table};
        broker = given;
        return &mi;
    }

    static CMPIMethodMI* methodMI(const CMPIBroker* given, const char* name) {
        static CMPIMethodMIFT table = {CMPIVersion200, CMPIVersion200, name, methodCleanup, invoke};
        static CMPIMethodMI mi = {nullptr, &table};
        broker = given;
        return &mi;
    }
};

struct Thing {
    static Instances instances(const CMPIObjectPath* request, const char** properties) {
        Instances result;
        CMPIUint16 size = 5;
        for (const char* name : {"one", "two \"quoted\""}) {
            result.push_back(newInstance(request, "Test_Thing", {{"Name", name}}, properties));
            CMSetProperty(result.back(), "Size", &size, CMPI_uint16);
        }
        return result;
    }

    static CMPIStatus invoke(const CMPIResult* result, const std::string& method, const CMPIArgs* in, CMPIArgs* out) {
        if (method == "Refuse") {
            log(5000, "Test", "not a reason");
            log(6000, "Test", "MESSAGE [File: x.cpp, Line: 5]: it is Sunday");
            log(6000, "Test", "and it rains");
            CMReturn(CMPI_RC_OK);
        }
        if (method == "Throw") {
            throw std::runtime_error("thrown by the provider");
        }
        if (method == "Absent") {
            CMReturn(CMPI_RC_ERR_METHOD_NOT_AVAILABLE);
        }
        return add(result, in, out);
    }

    /** Adds the numbers, and returns what it received as the other arguments. */
    static CMPIStatus add(const CMPIResult* result, const CMPIArgs* in, CMPIArgs* out) {
        CMPIUint64 sum = CMGetArg(in, "Left", nullptr).value.uint16;
        std::string seen;
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        if (const CMPIData right = CMGetArg(in, "Right", &status); status.rc == CMPI_RC_OK) {
            for (CMPICount i = 0; i < CMGetArrayCount(right.value.array, nullptr); ++i) {
                sum += CMGetArrayElementAt(right.value.array, i, nullptr).value.uint16;
            }
        }
        if (const CMPIData other = CMGetArg(in, "Other", &status); status.rc == CMPI_RC_OK) {
            seen += "other " + textOf(CMGetNameSpace(other.value.ref, nullptr)) + " " + keyOf(other.value.ref, "Name");
        }
        if (const CMPIData when = CMGetArg(in, "When", &status); status.rc == CMPI_RC_OK) {
            seen += " when " + std::to_string(CMGetBinaryFormat(when.value.dateTime, nullptr));
        }
        CMAddArg(out, "Sum", &sum, CMPI_uint64);
        CMAddArg(out, "Seen", seen.c_str(), CMPI_chars);
        return returnNumber(result, 1);
    }
};

constexpr const char* systemClass = "TALVO_ComputerSystem";
constexpr const char* instrumentation = "Corvane.Instrumentation";

struct PowerService {
    static Instances instances(const CMPIObjectPath* request, const char** properties) {
        log(5000, instrumentation, "Power management of a machine: 1 node", OrvLog::MACHINE_RECORD);
        Instances result;
        for (int i = 1; i <= std::stoi(setting("ORVCIM_TEST_SERVICES", "1")); ++i) {
            const std::string name = "service" + std::to_string(i);
            result.push_back(newInstance(request, "TALVO_PowerManagementService",
                                         {{"CreationClassName", "TALVO_PowerManagementService"},
                                          {"Name", name},
                                          {"SystemCreationClassName", systemClass},
                                          {"SystemName", "testhost"}},
                                         properties));
            CMSetProperty(result.back(), "ElementName", name.c_str(), CMPI_chars);
        }
        return result;
    }

    static CMPIStatus invoke(const CMPIResult* result, const std::string& /*method*/, const CMPIArgs* in,
                             CMPIArgs* /*out*/) {
        const std::string answer = setting("ORVCIM_TEST_ANSWER", "accepted");
        const CMPIUint16 state = CMGetArg(in, "PowerState", nullptr).value.uint16;
        const CMPIObjectPath* system = CMGetArg(in, "ManagedElement", nullptr).value.ref;
        const std::string what = std::to_string(state) + " for " + textOf(CMGetClassName(system, nullptr)) + " " +
                                 keyOf(system, "CreationClassName") + " " + keyOf(system, "Name");
        log(5000, "Test", "called");
        if (answer == "accepted" || answer == "refused") {
            log(10000, instrumentation, "Power request " + answer + ": " + what,
                answer == "accepted" ? OrvLog::POWER_REQUEST_ACCEPTED_RECORD : OrvLog::POWER_REQUEST_REFUSED_RECORD);
            return returnNumber(result, 0);
        }
        return returnNumber(result, answer == "nothing" ? 0 : static_cast<CMPIUint32>(std::stoul(answer)));
    }
};

struct PowerCapabilities {
    static Instances instances(const CMPIObjectPath* request, const char** properties) {
        CMPIInstance* instance =
            newInstance(request, "TALVO_PowerManagementCapabilities", {{"InstanceID", "capabilities1"}}, properties);
        CMPIArray* states = CMNewArray(broker, 2, CMPI_uint16, nullptr);
        const CMPIUint16 codes[] = {5, 8};
        for (CMPICount i = 0; i < 2; ++i) {
            CMSetArrayElementAt(states, i, &codes[i], CMPI_uint16);
        }
        CMSetProperty(instance, "ElementName", "capabilities1", CMPI_chars);
        CMSetProperty(instance, "PowerStatesSupported", &states, CMPI_uint16A);
        return {instance};
    }
};

struct ComputerSystem {
    static Instances instances(const CMPIObjectPath* request, const char** properties) {
        Instances result;
        for (const char* name : {"testhost", "otherhost"}) {
            result.push_back(
                newInstance(request, systemClass, {{"CreationClassName", systemClass}, {"Name", name}}, properties));
        }
        return result;
    }
};

/** Only the first system is associated with services: with all of them. */
struct PowerAssociation {
    static Instances instances(const CMPIObjectPath* request, const char** properties) {
        CMPIObjectPath* service = CMGetObjectPath(PowerService::instances(request, nullptr).front(), nullptr);
        CMPIObjectPath* system = CMGetObjectPath(ComputerSystem::instances(request, nullptr).front(), nullptr);
        CMPIInstance* instance = newInstance(request, "TALVO_AssociatedPowerManagementService", {}, properties);
        const std::string given = setting("ORVCIM_TEST_STATE", "2");
        CMSetProperty(instance, "ServiceProvided", &service, CMPI_ref);
        CMSetProperty(instance, "UserOfService", &system, CMPI_ref);
        if (given != "none") {
            const auto state = static_cast<CMPIUint16>(std::stoi(given));
            CMSetProperty(instance, "PowerState", &state, CMPI_uint16);
        }
        return {instance};
    }

    static CMPIStatus associatorNames(CMPIAssociationMI*, const CMPIContext*, const CMPIResult* result,
                                      const CMPIObjectPath* source, const char*, const char*, const char*,
                                      const char*) {
        const bool fromSystem = textOf(CMGetClassName(source, nullptr)) == systemClass;
        const Instances found = fromSystem ? PowerService::instances(source, nullptr)
                                           : Instances{ComputerSystem::instances(source, nullptr).front()};
        for (CMPIInstance* instance : found) {
            CMReturnObjectPath(result, CMGetObjectPath(instance, nullptr));
        }
        return done(result);
    }

    static CMPIAssociationMI* associationMI(const CMPIBroker* given) {
        using Path = const CMPIObjectPath*;
        static CMPIAssociationMIFT table = {
            CMPIVersion200,
            CMPIVersion200,
            "associationPowerAssociation",
            [](CMPIAssociationMI*, const CMPIContext*, CMPIBoolean) {
                return CMPIStatus{CMPI_RC_OK, nullptr};
            },
            [](CMPIAssociationMI*, const CMPIContext*, const CMPIResult*, Path, const char*, const char*, const char*,
               const char*, const char**) { return Provider<Thing>::refuse(); },
            associatorNames,
            [](CMPIAssociationMI*, const CMPIContext*, const CMPIResult*, Path, const char*, const char*,
               const char**) { return Provider<Thing>::refuse(); },
            [](CMPIAssociationMI*, const CMPIContext*, const CMPIResult*, Path, const char*, const char*) {
                return Provider<Thing>::refuse();
            }};
        static CMPIAssociationMI mi = {nullptr, &table};
        broker = given;
        return &mi;
    }
};

} // namespace

#ifndef ORVCIM_TEST_SILENT

void orvLogObserve1(const OrvLog::Observer1* given) {
    observer = given;
}

int orvInstrumentationMachine1() {
    return setting("ORVCIM_TEST_MACHINE", "simulated") == "simulated" ? Norv::SIMULATED_MACHINE : Norv::REAL_MACHINE;
}

#endif

#define INSTANCE_FACTORY(P)                                                                                            \
    CMPI_EXTERN_C CMPIInstanceMI* P##_Create_InstanceMI(const CMPIBroker* given, const CMPIContext*, CMPIStatus*) {    \
        return Provider<P>::instanceMI(given, "instance" #P);                                                          \
    }
#define METHOD_FACTORY(P)                                                                                              \
    CMPI_EXTERN_C CMPIMethodMI* P##_Create_MethodMI(const CMPIBroker* given, const CMPIContext*, CMPIStatus*) {        \
        return Provider<P>::methodMI(given, "method" #P);                                                              \
    }

INSTANCE_FACTORY(Thing)
METHOD_FACTORY(Thing)
INSTANCE_FACTORY(PowerService)
METHOD_FACTORY(PowerService)
INSTANCE_FACTORY(PowerCapabilities)
INSTANCE_FACTORY(PowerAssociation)
INSTANCE_FACTORY(ComputerSystem)

CMPI_EXTERN_C CMPIAssociationMI* PowerAssociation_Create_AssociationMI(const CMPIBroker* given, const CMPIContext*,
                                                                       CMPIStatus*) {
    return PowerAssociation::associationMI(given);
}

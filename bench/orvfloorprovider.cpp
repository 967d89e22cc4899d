/**
 * The floor: providers that make the broker calls of the power management provider in a bare loop, without looking at
 * a machine, logging or translating anything; and computer systems for the associations to refer to. How many objects
 * there are is told by ORV_BENCH_NODES and ORV_BENCH_SYSTEMS.
 */
#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <cstdlib>
#include <string>

namespace {

const CMPIBroker* broker = nullptr;

const char* serviceKeys[] = {"CreationClassName", "Name", "SystemCreationClassName", "SystemName", nullptr};
const char* capabilitiesKeys[] = {"InstanceID", nullptr};

int count(const char* variable) {
    const char* const value = std::getenv(variable);
    return value == nullptr ? 1 : std::atoi(value);
}

CMPIObjectPath* newPath(const CMPIObjectPath* ref, const char* className) {
    const char* const nameSpace = CMGetCharPtr(CMGetNameSpace(ref, nullptr));
    CMPIObjectPath* const path = CMNewObjectPath(broker, nameSpace, className, nullptr);
    CMSetNameSpace(path, nameSpace);
    CMSetHostname(path, "bench.example");
    return path;
}

CMPIObjectPath* newServicePath(const CMPIObjectPath* ref, const std::string& name) {
    CMPIObjectPath* const path = newPath(ref, "FLOOR_Service");
    CMAddKey(path, serviceKeys[0], "TALVO_PowerManagementService", CMPI_chars);
    CMAddKey(path, serviceKeys[1], name.c_str(), CMPI_chars);
    CMAddKey(path, serviceKeys[2], "TALVO_ComputerSystem", CMPI_chars);
    CMAddKey(path, serviceKeys[3], "bench.example", CMPI_chars);
    return path;
}

CMPIInstance* newService(const CMPIObjectPath* ref, const std::string& name, const char** properties) {
    CMPIInstance* const instance = CMNewInstance(broker, newPath(ref, "FLOOR_Service"), nullptr);
    CMSetPropertyFilter(instance, properties, serviceKeys);
    CMSetProperty(instance, serviceKeys[0], "TALVO_PowerManagementService", CMPI_chars);
    CMSetProperty(instance, serviceKeys[1], name.c_str(), CMPI_chars);
    CMSetProperty(instance, serviceKeys[2], "TALVO_ComputerSystem", CMPI_chars);
    CMSetProperty(instance, serviceKeys[3], "bench.example", CMPI_chars);
    CMSetProperty(instance, "Caption", "Power Management Service", CMPI_chars);
    CMSetProperty(instance, "Description",
                  "Reports the power state of the computer system, reboots it and shuts it down.", CMPI_chars);
    CMSetProperty(instance, "ElementName", name.c_str(), CMPI_chars);
    return instance;
}

CMPIObjectPath* newCapabilitiesPath(const CMPIObjectPath* ref, const std::string& id) {
    CMPIObjectPath* const path = newPath(ref, "FLOOR_Capabilities");
    CMAddKey(path, capabilitiesKeys[0], id.c_str(), CMPI_chars);
    return path;
}

void setCodes(const CMPIInstance* instance, const char* property, const CMPIUint16 (&codes)[3]) {
    CMPIArray* const array = CMNewArray(broker, 3, CMPI_uint16, nullptr);
    for (CMPICount i = 0; i < 3; ++i) {
        CMSetArrayElementAt(array, i, &codes[i], CMPI_uint16);
    }
    CMSetProperty(instance, property, &array, CMPI_uint16A);
}

CMPIInstance* newCapabilities(const CMPIObjectPath* ref, const std::string& id, const char** properties) {
    CMPIInstance* const instance = CMNewInstance(broker, newPath(ref, "FLOOR_Capabilities"), nullptr);
    CMSetPropertyFilter(instance, properties, capabilitiesKeys);
    CMSetProperty(instance, capabilitiesKeys[0], id.c_str(), CMPI_chars);
    setCodes(instance, "PowerChangeCapabilities", {3, 4, 8});
    CMSetProperty(instance, "ElementName", id.c_str(), CMPI_chars);
    setCodes(instance, "PowerStatesSupported", {2, 5, 8});
    return instance;
}

std::string nodeName(int i) {
    return "PowerStateManagement_node" + std::to_string(i);
}

CMPIStatus done(const CMPIResult* result) {
    CMReturnDone(result);
    return {CMPI_RC_OK, nullptr};
}

template <typename MI>
CMPIStatus cleanup(MI* /*mi*/, const CMPIContext* /*context*/, CMPIBoolean /*terminating*/) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus notSupported() {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

} // namespace

#define FLOOR_REFUSED(Class)                                                                                           \
    static CMPIStatus Class##_Cleanup(CMPIInstanceMI* mi, const CMPIContext* context, CMPIBoolean terminating) {       \
        return cleanup(mi, context, terminating);                                                                      \
    }                                                                                                                  \
    static CMPIStatus Class##_CreateInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,                   \
                                             const CMPIObjectPath*, const CMPIInstance*) {                             \
        return notSupported();                                                                                         \
    }                                                                                                                  \
    static CMPIStatus Class##_ModifyInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,                   \
                                             const CMPIObjectPath*, const CMPIInstance*, const char**) {               \
        return notSupported();                                                                                         \
    }                                                                                                                  \
    static CMPIStatus Class##_DeleteInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,                   \
                                             const CMPIObjectPath*) {                                                  \
        return notSupported();                                                                                         \
    }                                                                                                                  \
    static CMPIStatus Class##_ExecQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*, \
                                        const char*, const char*) {                                                    \
        return notSupported();                                                                                         \
    }

/** The enumerations and the lookup of a class whose objects `newObjectPath` and `newInstance` make. */
#define FLOOR_CLASS(Class, newObjectPath, newInstance, variable)                                                       \
    FLOOR_REFUSED(Class)                                                                                               \
    static CMPIStatus Class##_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,         \
                                                const CMPIObjectPath* ref) {                                           \
        const int objects = count(variable);                                                                           \
        for (int i = 0; i < objects; ++i) {                                                                            \
            CMReturnObjectPath(result, newObjectPath(ref, nodeName(i)));                                               \
        }                                                                                                              \
        return done(result);                                                                                           \
    }                                                                                                                  \
    static CMPIStatus Class##_EnumInstances(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,             \
                                            const CMPIObjectPath* ref, const char** properties) {                      \
        const int objects = count(variable);                                                                           \
        for (int i = 0; i < objects; ++i) {                                                                            \
            CMReturnInstance(result, newInstance(ref, nodeName(i), properties));                                       \
        }                                                                                                              \
        return done(result);                                                                                           \
    }                                                                                                                  \
    static CMPIStatus Class##_GetInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,               \
                                          const CMPIObjectPath* ref, const char** properties) {                        \
        CMGetKeyCount(ref, nullptr);                                                                                   \
        CMGetKeyAt(ref, 0, nullptr, nullptr);                                                                          \
        CMReturnInstance(result, newInstance(ref, nodeName(0), properties));                                           \
        return done(result);                                                                                           \
    }                                                                                                                  \
    CMInstanceMIStub(Class##_, Floor##Class##Provider, broker, CMNoHook)

namespace Service {
FLOOR_CLASS(Service, newServicePath, newService, "ORV_BENCH_NODES")

static CMPIStatus Service_MethodCleanup(CMPIMethodMI* mi, const CMPIContext* context, CMPIBoolean terminating) {
    return cleanup(mi, context, terminating);
}

static CMPIStatus Service_InvokeMethod(CMPIMethodMI*, const CMPIContext*, const CMPIResult* result,
                                       const CMPIObjectPath* ref, const char*, const CMPIArgs* in, CMPIArgs*) {
    CMGetClassName(ref, nullptr);
    CMGetArg(in, "TimeoutPeriod", nullptr);
    CMGetArg(in, "Time", nullptr);
    CMGetArg(in, "PowerState", nullptr);
    CMRelease(CMGetArg(in, "ManagedElement", nullptr).value.ref);
    const CMPIUint32 value = 0;
    CMReturnData(result, &value, CMPI_uint32);
    return done(result);
}

CMMethodMIStub(Service_, FloorServiceProvider, broker, CMNoHook)
} // namespace Service

namespace Capabilities {
FLOOR_CLASS(Capabilities, newCapabilitiesPath, newCapabilities, "ORV_BENCH_NODES")
} // namespace Capabilities

namespace ComputerSystem {

static CMPIObjectPath* newSystemPath(const CMPIObjectPath* ref, const std::string& name) {
    CMPIObjectPath* const path = newPath(ref, "TALVO_ComputerSystem");
    CMAddKey(path, "CreationClassName", "TALVO_ComputerSystem", CMPI_chars);
    CMAddKey(path, "Name", name.c_str(), CMPI_chars);
    return path;
}

static CMPIInstance* newSystem(const CMPIObjectPath* ref, const std::string& name, const char** /*properties*/) {
    return CMNewInstance(broker, newSystemPath(ref, name), nullptr);
}

FLOOR_CLASS(ComputerSystem, newSystemPath, newSystem, "ORV_BENCH_SYSTEMS")
} // namespace ComputerSystem

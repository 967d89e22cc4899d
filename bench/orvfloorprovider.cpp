/**
 * The floor: providers that do only what the power management provider cannot avoid. They make the same calls of the
 * broker and of the agent (walk through the tree, properties, the system's name, texts), a record of each node, and as
 * many log records of the same levels, with a constant text. They also serve the computer systems to which the
 * associations refer; the environment variable ORV_BENCH_SYSTEMS has their number.
 */
#include "Norv/Common.h"
#include "Norv/Instrumentation.h"
#include "Norv/Locale.h"
#include "OrvLog/OrvLogger.h"

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <cstdlib>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace {

const CMPIBroker* broker = nullptr;

const char* serviceKeys[] = {"CreationClassName", "Name", "SystemCreationClassName", "SystemName", nullptr};
const char* capabilitiesKeys[] = {"InstanceID", nullptr};

constexpr int progressLevel = 3000;
constexpr int operationLevel = 4000;
constexpr int failureLevel = 6000;

/** Writes `number` records to the log, and each to the trace as well. */
void logRecords(int number, int level) {
    static const std::string category = "Corvane.Floor";
    static const std::string text(100, 'x');
    for (int i = 0; i < number; ++i) {
        OrvLog::OrvLogger::logLevelMessage(__func__, __FILE__, __LINE__, category, level, nullptr, 0, 0, text);
        OrvLog::OrvLogger::traceLevelMessage(__func__, __FILE__, __LINE__, category, level, nullptr, 0, 0, text);
    }
}

void enter() {
    logRecords(2, operationLevel);
}

CMPIStatus leave(const CMPIResult* result) {
    CMReturnDone(result);
    logRecords(2, operationLevel);
    return {CMPI_RC_OK, nullptr};
}

/** What each request has to know of a node. */
struct Record {
    std::string path;
    std::string name;
    std::string elementName;
    std::string capabilitiesElementName;
    unsigned int powerState;
};

/** The nodes of the tree by name; all of their properties are read. */
std::map<std::string, Record> readNodes() {
    std::map<std::string, Record> nodes;
    Norv::Instrumentation cursor;
    cursor.selectNode(Norv::NodeLexicon::POWER_MANAGEMENT_NODE);
    std::vector<unsigned int> powerStates;
    unsigned int powerState = 0;
    for (; cursor; ++cursor) {
        std::string path = cursor.convertPathToString(cursor.getPathToNode());
        cursor.getProperty(Norv::NodeLexicon::POWER_STATE_LIST, powerStates);
        cursor.getProperty(Norv::NodeLexicon::POWER_STATE, powerState);
        const std::string name = "PowerStateManagement_" + path;
        std::string capabilities = "PowerStateManagementCapabilities_" + path;
        nodes.try_emplace(nodes.end(), name, Record{std::move(path), name, name, std::move(capabilities), powerState});
    }
    return nodes;
}

const std::string& nameOf(const std::pair<const std::string, Record>& node) {
    return node.second.path;
}

const std::string& nameOf(const std::string& system) {
    return system;
}

CMPIObjectPath* newPath(const CMPIObjectPath* ref, const char* className) {
    const char* const nameSpace = CMGetCharPtr(CMGetNameSpace(ref, nullptr));
    CMPIObjectPath* const path = CMNewObjectPath(broker, nameSpace, className, nullptr);
    CMSetNameSpace(path, nameSpace);
    CMSetHostname(path, Norv::getSystemName().c_str());
    return path;
}

std::string localizedText(const std::wstring& id) {
    constexpr unsigned int powerManagementTexts = 2;
    return Norv::make_string(Norv::ResourceString(
        Norv::Locale::getResourceLibrary(powerManagementTexts, Norv::Locale::getLanguageId()), id));
}

CMPIObjectPath* newServicePath(const CMPIObjectPath* ref, const std::string& node) {
    CMPIObjectPath* const path = newPath(ref, "FLOOR_Service");
    CMAddKey(path, serviceKeys[0], "TALVO_PowerManagementService", CMPI_chars);
    CMAddKey(path, serviceKeys[1], ("PowerStateManagement_" + node).c_str(), CMPI_chars);
    CMAddKey(path, serviceKeys[2], "TALVO_ComputerSystem", CMPI_chars);
    CMAddKey(path, serviceKeys[3], Norv::getSystemName().c_str(), CMPI_chars);
    return path;
}

CMPIInstance* newService(const CMPIObjectPath* ref, const std::string& node, const char** properties) {
    logRecords(2, progressLevel);
    const std::string name = "PowerStateManagement_" + node;
    CMPIInstance* const instance = CMNewInstance(broker, newPath(ref, "FLOOR_Service"), nullptr);
    CMSetPropertyFilter(instance, properties, serviceKeys);
    CMSetProperty(instance, serviceKeys[0], "TALVO_PowerManagementService", CMPI_chars);
    CMSetProperty(instance, serviceKeys[1], name.c_str(), CMPI_chars);
    CMSetProperty(instance, serviceKeys[2], "TALVO_ComputerSystem", CMPI_chars);
    CMSetProperty(instance, serviceKeys[3], Norv::getSystemName().c_str(), CMPI_chars);
    CMSetProperty(instance, "Caption", localizedText(L"MSGID_POWER_MANAGEMENT_CAPTION").c_str(), CMPI_chars);
    CMSetProperty(instance, "Description", localizedText(L"MSGID_POWER_MANAGEMENT_DESCRIPTION").c_str(), CMPI_chars);
    CMSetProperty(instance, "ElementName", name.c_str(), CMPI_chars);
    return instance;
}

CMPIObjectPath* newCapabilitiesPath(const CMPIObjectPath* ref, const std::string& node) {
    CMPIObjectPath* const path = newPath(ref, "FLOOR_Capabilities");
    CMAddKey(path, capabilitiesKeys[0], node.c_str(), CMPI_chars);
    return path;
}

void setCodes(const CMPIInstance* instance, const char* property, const CMPIUint16 (&codes)[3]) {
    CMPIArray* const array = CMNewArray(broker, 3, CMPI_uint16, nullptr);
    for (CMPICount i = 0; i < 3; ++i) {
        CMSetArrayElementAt(array, i, &codes[i], CMPI_uint16);
    }
    CMSetProperty(instance, property, &array, CMPI_uint16A);
}

CMPIInstance* newCapabilities(const CMPIObjectPath* ref, const std::string& node, const char** properties) {
    logRecords(2, progressLevel);
    CMPIInstance* const instance = CMNewInstance(broker, newPath(ref, "FLOOR_Capabilities"), nullptr);
    CMSetPropertyFilter(instance, properties, capabilitiesKeys);
    CMSetProperty(instance, capabilitiesKeys[0], node.c_str(), CMPI_chars);
    setCodes(instance, "PowerChangeCapabilities", {3, 4, 8});
    CMSetProperty(instance, "ElementName", ("PowerStateManagementCapabilities_" + node).c_str(), CMPI_chars);
    setCodes(instance, "PowerStatesSupported", {2, 5, 8});
    return instance;
}

/** Nodes that are not in the tree. */
std::vector<std::string> computerSystems() {
    const char* const number = std::getenv("ORV_BENCH_SYSTEMS");
    std::vector<std::string> systems;
    for (int i = 0; i < (number == nullptr ? 1 : std::atoi(number)); ++i) {
        systems.push_back("system" + std::to_string(i));
    }
    return systems;
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

/** The operations of a class that has an object for each of `nodes`. */
#define FLOOR_CLASS(Class, key, newObjectPath, newInstance, nodes)                                                     \
    FLOOR_REFUSED(Class)                                                                                               \
    static CMPIStatus Class##_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,         \
                                                const CMPIObjectPath* ref) {                                           \
        enter();                                                                                                       \
        logRecords(2, progressLevel);                                                                                  \
        for (const auto& node : nodes()) {                                                                             \
            CMReturnObjectPath(result, newObjectPath(ref, nameOf(node)));                                              \
        }                                                                                                              \
        return leave(result);                                                                                          \
    }                                                                                                                  \
    static CMPIStatus Class##_EnumInstances(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,             \
                                            const CMPIObjectPath* ref, const char** properties) {                      \
        enter();                                                                                                       \
        logRecords(1, progressLevel);                                                                                  \
        for (const auto& node : nodes()) {                                                                             \
            CMReturnInstance(result, newInstance(ref, nameOf(node), properties));                                      \
        }                                                                                                              \
        return leave(result);                                                                                          \
    }                                                                                                                  \
    static CMPIStatus Class##_GetInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,               \
                                          const CMPIObjectPath* ref, const char** properties) {                        \
        enter();                                                                                                       \
        CMGetKeyCount(ref, nullptr);                                                                                   \
        CMGetCharPtr(CMGetKey(ref, key, nullptr).value.string);                                                        \
        logRecords(2, progressLevel);                                                                                  \
        logRecords(1, operationLevel);                                                                                 \
        CMReturnInstance(result, newInstance(ref, nameOf(*nodes().begin()), properties));                              \
        return leave(result);                                                                                          \
    }                                                                                                                  \
    CMInstanceMIStub(Class##_, Floor##Class##Provider, broker, CMNoHook)

namespace Service {
FLOOR_CLASS(Service, "Name", newServicePath, newService, readNodes)

static CMPIStatus Service_MethodCleanup(CMPIMethodMI* mi, const CMPIContext* context, CMPIBoolean terminating) {
    return cleanup(mi, context, terminating);
}

/** RequestPowerStateChange: 5 writes to the tree, and every other state is refused. */
static CMPIStatus Service_InvokeMethod(CMPIMethodMI*, const CMPIContext*, const CMPIResult* result,
                                       const CMPIObjectPath* ref, const char*, const CMPIArgs* in, CMPIArgs*) {
    enter();
    CMGetCharPtr(CMGetClassName(ref, nullptr));
    readNodes();
    CMGetArg(in, "TimeoutPeriod", nullptr);
    CMGetArg(in, "Time", nullptr);
    const CMPIUint16 powerState = CMGetArg(in, "PowerState", nullptr).value.uint16;
    logRecords(1, operationLevel);
    if (powerState != 5) {
        logRecords(1, failureLevel);
        return {CMPI_RC_OK, nullptr};
    }
    CMPIObjectPath* const element = CMGetArg(in, "ManagedElement", nullptr).value.ref;
    Norv::Instrumentation cursor;
    cursor.selectNode(Norv::NodeLexicon::POWER_MANAGEMENT_NODE);
    logRecords(1, progressLevel);
    unsigned int reboot = 9;
    cursor.setProperty(Norv::NodeLexicon::POWER_STATE, reboot);
    CMRelease(element);
    const CMPIUint32 value = 0;
    CMReturnData(result, &value, CMPI_uint32);
    return leave(result);
}

CMMethodMIStub(Service_, FloorServiceProvider, broker, CMNoHook)
} // namespace Service

namespace Capabilities {
FLOOR_CLASS(Capabilities, "InstanceID", newCapabilitiesPath, newCapabilities, readNodes)
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

FLOOR_CLASS(ComputerSystem, "Name", newSystemPath, newSystem, computerSystems)
} // namespace ComputerSystem

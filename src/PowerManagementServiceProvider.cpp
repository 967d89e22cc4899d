/**
 * TALVO_PowerManagementService: one instance for each power-managed element, and the method RequestPowerStateChange,
 * which reboots the machine or shuts it down (CIM_PowerManagementService, DMTF DSP1027).
 */
#include "BrokerObjects.h"
#include "ElementOperations.h"
#include "Operation.h"

#include "Norv/Instrumentation.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerPowerMgmtService = "Corvane.PowerMgmtSvcProvider";
static constexpr const char* key = "Name";
static constexpr const char* requestPowerStateChangeMethod = "RequestPowerStateChange";

static const ElementProvider provider = {
    loggerPowerMgmtService,
    key,
    &PowerStateManagementObjFactory::getAllPMCMPIObjPaths,
    &PowerStateManagementObjFactory::getAllPMCMPIInstances,
    &PowerStateManagementObjFactory::getOnePMCMPIInstance,
    "*** getOnePMCMPIInstance Failed: No Instance found***",
    "getAllPMCMPIInstances Failed",
};

ORV_ELEMENT_OPERATIONS(PowerManagementService)

/** A power state that a client can request, and the write to the instrumentation tree that causes it. */
struct PowerStateChange {
    CMPIUint16 powerState;
    unsigned int written;
    const char* failed;
};

static constexpr PowerStateChange powerStateChanges[] = {
    {5, 9, "setProperty() falied to Reboot"},
    {8, 12, "setProperty() falied to Shutdown"},
};

static const PowerStateChange* findPowerStateChange(CMPIUint16 powerState) {
    for (const PowerStateChange& change : powerStateChanges) {
        if (change.powerState == powerState) {
            return &change;
        }
    }
    return nullptr;
}

/**
 * Whether the argument is given with a time. The argument is read twice: the second value's handle counts. A value of
 * another type than datetime also counts as given: a client that wants the change at some time must not get it at once.
 */
static bool isTimeGiven(const CMPIArgs* in, const char* name, CMPIStatus* status) {
    if (CMGetArg(in, name, status).value.dateTime == nullptr) {
        return false;
    }
    const CMPIData time = CMGetArg(in, name, status);
    return isObjectType(time.type) ? !isNull(time.value.dateTime) : time.value.dateTime != nullptr;
}

/** Writes the change to the machine's power-management node. A failure is only logged. */
static void changePowerState(Instrumentation& instrumentation, const PowerStateChange& change, const Site& operation) {
    instrumentation.selectNode(NodeLexicon::POWER_MANAGEMENT_NODE);
    if (!instrumentation) {
        logMessage(loggerPowerMgmtService, progressLevel, "No Instrumentation node found. ", operation.atLine());
    }
    logMessage(loggerPowerMgmtService, progressLevel,
               "Entering try catch block to execute Shutdown/Reboot as requested", operation.atLine());
    unsigned int value = change.written;
    if (!instrumentation.setProperty(NodeLexicon::POWER_STATE, value)) {
        logMessage(loggerPowerMgmtService, progressLevel, change.failed, operation.atLine());
    }
}

/** The outcome of a request. A refused request leaves the result open and without a value. */
enum class Outcome { answered, refused };

/**
 * RequestPowerStateChange without its result.
 *
 * @param in the method's arguments; the object path "ManagedElement" is released after the change was tried.
 * @param operation the place that log records name.
 */
static Outcome requestPowerStateChange(const CMPIArgs* in, CMPIStatus* status, const Site& operation) {
    const auto refuse = [](const char* reason, const Site& site) {
        logMessage(loggerPowerMgmtService, failureLevel, reason, site);
        return Outcome::refused;
    };
    if (isTimeGiven(in, "TimeoutPeriod", status)) {
        return refuse("Use Of Timeout Period Not Supported", operation.atLine());
    }
    if (isTimeGiven(in, "Time", status)) {
        return refuse("Use Of Time Property Not Supported", operation.atLine());
    }
    const CMPIUint16 powerState = CMGetArg(in, "PowerState", status).value.uint16;
    logVariable(loggerPowerMgmtService, "powerState", static_cast<unsigned int>(powerState), operation.atLine());
    const PowerStateChange* const change = findPowerStateChange(powerState);
    if (change == nullptr) {
        return refuse("Requested Power State change Not Supported", operation.atLine());
    }
    const CMPIData element = CMGetArg(in, "ManagedElement", status);
    CMPIObjectPath* const managedElement = isObjectType(element.type) ? element.value.ref : nullptr;
    if (!isNull(managedElement)) {
        Instrumentation instrumentation;
        changePowerState(instrumentation, *change, operation);
        CMRelease(managedElement);
    }
    return Outcome::answered;
}

ORV_FIXED_OPERATION(PowerManagementService_MethodCleanup, CMPI_RC_OK, CMPIMethodMI*, const CMPIContext*, CMPIBoolean)

static CMPIStatus PowerManagementService_InvokeMethod(CMPIMethodMI*, const CMPIContext*, const CMPIResult* result,
                                                      const CMPIObjectPath* objectPath, const char* methodName,
                                                      const CMPIArgs* in, CMPIArgs*) {
    Operation operation(loggerPowerMgmtService, Site::here());
    const CMPIString* const className = CMGetClassName(objectPath, &operation.status);
    const PowerStateManagementObjFactory factory(key);

    if (isText(textOf(className), powerManagementServiceClass) && isText(methodName, requestPowerStateChangeMethod) &&
        requestPowerStateChange(in, &operation.status, operation.site()) == Outcome::refused) {
        return operation.status;
    }

    // The method reports success whether or not the machine accepted the change.
    CMPIValue value = {};
    value.uint32 = 0;
    operation.markExit();
    CMReturnData(result, &value, CMPI_uint32);
    CMReturnDone(result);
    return operation.status;
}

CMInstanceMIStub(PowerManagementService_, PowerManagementServiceProvider, broker, CMNoHook)
CMMethodMIStub(PowerManagementService_, PowerManagementServiceProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

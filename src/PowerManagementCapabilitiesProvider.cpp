/**
 * TALVO_PowerManagementCapabilities: the power states and power changes that each service advertises
 * (CIM_PowerManagementCapabilities, DMTF DSP1027).
 */
#include "ProviderSupport.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerPowerCapabilities = "Corvane.PowerMgmtCapabilitiesProvider";
static constexpr const char* key = "InstanceID";

static const ElementProvider provider = {
    loggerPowerCapabilities,
    key,
    &PowerStateManagementObjFactory::getAllPMCapCMPIObjPaths,
    &PowerStateManagementObjFactory::getAllPMCapCMPIInstances,
    &PowerStateManagementObjFactory::getOnePMCapCMPIInstance,
    "*** getOnePMCapCMPIInstance Failed :No Instance found***",
    "getAllPMCapCMPIInstances Failed",
};

ORV_FIXED_INSTANCE_OPERATIONS(PowerManagementCapabilities)

static CMPIStatus PowerManagementCapabilities_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext*,
                                                                const CMPIResult* result,
                                                                const CMPIObjectPath* objectPath) {
    return enumInstanceNames(provider, broker, result, objectPath);
}

static CMPIStatus PowerManagementCapabilities_EnumInstances(CMPIInstanceMI*, const CMPIContext*,
                                                            const CMPIResult* result, const CMPIObjectPath* objectPath,
                                                            char const** properties) {
    return enumInstances(provider, broker, result, objectPath, properties);
}

static CMPIStatus PowerManagementCapabilities_GetInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                                                          const CMPIObjectPath* objectPath, char const** properties) {
    return getInstance(provider, broker, result, objectPath, properties);
}

CMInstanceMIStub(PowerManagementCapabilities_, PowerManagementCapabilitiesProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

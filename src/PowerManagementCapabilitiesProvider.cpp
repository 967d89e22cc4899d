/**
 * TALVO_PowerManagementCapabilities: the power states and power changes that each service advertises
 * (CIM_PowerManagementCapabilities, DMTF DSP1027).
 */
#include "ElementOperations.h"

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

ORV_ELEMENT_OPERATIONS(PowerManagementCapabilities)

CMInstanceMIStub(PowerManagementCapabilities_, PowerManagementCapabilitiesProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

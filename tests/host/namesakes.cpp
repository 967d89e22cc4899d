/**
 * A library with the same names of functions and objects as the provider library: those of its factories and of its
 * hidden symbols. The provider library must never call these.
 */
#include "PowerStateManagement.h"
#include "cmpift.h"

#define NAMESAKE_FACTORY(name, MI)                                                                                     \
    MI* name(const CMPIBroker*, const CMPIContext*, CMPIStatus*) {                                                     \
        ++namesakeCalls;                                                                                               \
        return nullptr;                                                                                                \
    }

extern "C" {

int namesakeCalls = 0;

NAMESAKE_FACTORY(PowerManagementServiceProvider_Create_InstanceMI, CMPIInstanceMI)
NAMESAKE_FACTORY(PowerManagementServiceProvider_Create_MethodMI, CMPIMethodMI)
NAMESAKE_FACTORY(PowerManagementCapabilitiesProvider_Create_InstanceMI, CMPIInstanceMI)
NAMESAKE_FACTORY(AssociatedPowerManagementServiceProvider_Create_InstanceMI, CMPIInstanceMI)
NAMESAKE_FACTORY(AssociatedPowerManagementServiceProvider_Create_AssociationMI, CMPIAssociationMI)
NAMESAKE_FACTORY(PowerManagementElementCapabilitiesProvider_Create_InstanceMI, CMPIInstanceMI)
NAMESAKE_FACTORY(PowerManagementElementCapabilitiesProvider_Create_AssociationMI, CMPIAssociationMI)
NAMESAKE_FACTORY(PowerManagementHostedServiceProvider_Create_InstanceMI, CMPIInstanceMI)
NAMESAKE_FACTORY(PowerManagementHostedServiceProvider_Create_AssociationMI, CMPIAssociationMI)

} // extern "C"

namespace Norv::PowerStateManagementServiceProvider {

unsigned short getPowerStateManagementInstances(std::map<std::string, PowerStateManagement>&, std::string) {
    ++namesakeCalls;
    return 1;
}

bool PowerStateManagement::setName(std::string) {
    ++namesakeCalls;
    return false;
}

std::string PowerStateManagement::getName() {
    ++namesakeCalls;
    return {};
}

} // namespace Norv::PowerStateManagementServiceProvider

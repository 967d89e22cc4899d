/**
 * TALVO_AssociatedPowerManagementService: links each computer system to each service that manages its power, with the
 * current and the requested power state (CIM_AssociatedPowerManagementService, DMTF DSP1027).
 */
#include "AssociationOperations.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerAssociatedPower = "Corvane.AssociatedPowerMgmtProvider";

static const char* filterKeys[] = {"ServiceProvided", "UserOfService", nullptr};

static constexpr const char* servicesNotAvailable =
    "***Can't get Power Management Service ObjectPaths.             Exiting EnumerateInstanceNames***";

static unsigned short AssociatedPowerManagementServiceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                                                    const CMPIContext* ctx,
                                                                    std::vector<CMPIInstance*>& instances);

static const AssociationProvider provider = {
    .category = loggerAssociatedPower,
    .className = associatedPowerManagementServiceClass,
    .build = AssociatedPowerManagementServiceCMPIInstances,
    .first =
        {
            .className = powerManagementServiceClass,
            .role = "ServiceProvided",
            .source = ObjectSource::services,
            .notAvailable = serviceEndNotAvailable,
            .placedByAssociatorNames = true,
            .inReferences = PowerStates::firstRecord,
        },
    .second =
        {
            .className = computerSystemClass,
            .role = "UserOfService",
            .source = ObjectSource::objectManager,
            .notAvailable = computerSystemEndNotAvailable,
            .inReferences = PowerStates::everyRecord,
        },
    .filterKeys = filterKeys,
    .instances =
        {
            .servicesNotAvailable = servicesNotAvailable,
            .servicePathNull = servicePathNull,
            .associationPathFailed =
                "Create CMPIObjectPath failed for                      TALVO_AssociatedPowerManagementService.",
        },
    .names =
        {
            .servicesNotAvailable = servicesNotAvailable,
            .servicePathNull = servicePathNull,
            .associationPathFailed =
                "Create CMPIObjectPath failed for                     TALVO_AssociatedPowerManagementService.",
        },
    .targetNull = targetNullTexts,
    .inInstances = PowerStates::firstRecord,
};

static unsigned short AssociatedPowerManagementServiceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                                                    const CMPIContext* ctx,
                                                                    std::vector<CMPIInstance*>& instances) {
    return buildAssociations(provider, broker, ctx, ref, properties, instances);
}

ORV_ASSOCIATION_OPERATIONS(AssociatedPowerManagementService)

CMInstanceMIStub(AssociatedPowerManagementService_, AssociatedPowerManagementServiceProvider, broker, CMNoHook)
CMAssociationMIStub(AssociatedPowerManagementService_, AssociatedPowerManagementServiceProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

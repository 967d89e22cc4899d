/**
 * TALVO_PowerManagementHostedService: links each computer system to each service that it hosts (CIM_HostedService, DMTF
 * DSP1027).
 */
#include "AssociationOperations.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerPowerMgmtHostedService = "Corvane.PowerMgmtHostedSvcProvider";

/** These are not the names of this class's properties, so a client's property list can leave out either end. */
static const char* filterKeys[] = {"GroupComponent", "PartComponent", nullptr};

static unsigned short PowerManagementHostedServiceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                                                const CMPIContext* ctx,
                                                                std::vector<CMPIInstance*>& instances);

static const AssociationProvider provider = {
    .category = loggerPowerMgmtHostedService,
    .className = powerManagementHostedServiceClass,
    .build = PowerManagementHostedServiceCMPIInstances,
    .first =
        {
            .className = computerSystemClass,
            .role = "Antecedent",
            .source = ObjectSource::objectManager,
            .notAvailable = computerSystemEndNotAvailable,
            .resultClassAlias = "CIM_ComputerSystem",
        },
    .second =
        {
            .className = powerManagementServiceClass,
            .role = "Dependent",
            .source = ObjectSource::services,
            .notAvailable = serviceEndNotAvailable,
            .placedByAssociatorNames = true,
            .resultClassAlias = "CIM_PowerManagementService",
        },
    .filterKeys = filterKeys,
    .instances =
        {
            .servicesNotAvailable =
                "***Can't get Power Management Service ObjectPaths.                 Exiting EnumerateInstanceNames***",
            .servicePathNull = "CMPIObjectPath is NULL for Power Management service",
            .associationPathFailed =
                "Create CMPIObjectPath failed for                      TALVO_PowerManagementHostedService.",
        },
    .names =
        {
            .servicesNotAvailable =
                "***Can't get Power Management Service ObjectPaths.                Exiting EnumerateInstanceNames***",
            .servicePathNull = servicePathNull,
            .associationPathFailed =
                "Create CMPIObjectPath failed for                      TALVO_PowerManagementHostedService",
        },
    .targetNull = targetNullTexts,
    .namesCloseBeforeExit = true,
};

static unsigned short PowerManagementHostedServiceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                                                const CMPIContext* ctx,
                                                                std::vector<CMPIInstance*>& instances) {
    return buildAssociations(provider, broker, ctx, ref, properties, instances);
}

ORV_ASSOCIATION_OPERATIONS(PowerManagementHostedService)

CMInstanceMIStub(PowerManagementHostedService_, PowerManagementHostedServiceProvider, broker, CMNoHook)
CMAssociationMIStub(PowerManagementHostedService_, PowerManagementHostedServiceProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

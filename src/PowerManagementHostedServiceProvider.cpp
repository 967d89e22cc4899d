/**
 * TALVO_PowerManagementHostedService: ties each computer system to each service that it hosts (CIM_HostedService, DMTF
 * DSP1027).
 */
#include "ProviderSupport.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerPowerMgmtHostedService = "Corvane.PowerMgmtHostedSvcProvider";

/** No properties of this class, so that a client's property list can leave out either end. */
static const char* filterKeys[] = {"GroupComponent", "PartComponent", nullptr};

static const AssociationProvider provider = {
    .category = loggerPowerMgmtHostedService,
    .className = powerManagementHostedServiceClass,
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

ORV_FIXED_INSTANCE_OPERATIONS(PowerManagementHostedService)
ORV_FIXED_ASSOCIATION_OPERATIONS(PowerManagementHostedService)

static unsigned short PowerManagementHostedServiceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                                                const CMPIContext* ctx,
                                                                std::vector<CMPIInstance*>& instances) {
    return buildAssociations(provider, broker, ctx, ref, properties, instances);
}

static CMPIStatus PowerManagementHostedService_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext* ctx,
                                                                 const CMPIResult* rslt, const CMPIObjectPath* ref) {
    return enumAssociationNames(provider, broker, ctx, rslt, ref);
}

static CMPIStatus PowerManagementHostedService_EnumInstances(CMPIInstanceMI*, const CMPIContext* ctx,
                                                             const CMPIResult* rslt, const CMPIObjectPath* ref,
                                                             const char** properties) {
    return enumAssociations(provider, rslt, [=](std::vector<CMPIInstance*>& instances) {
        return PowerManagementHostedServiceCMPIInstances(ref, properties, ctx, instances);
    });
}

static CMPIStatus PowerManagementHostedService_GetInstance(CMPIInstanceMI*, const CMPIContext* ctx,
                                                           const CMPIResult* rslt, const CMPIObjectPath* ref,
                                                           const char** properties) {
    return getAssociation(provider, rslt, ref, [=](std::vector<CMPIInstance*>& instances) {
        return PowerManagementHostedServiceCMPIInstances(ref, properties, ctx, instances);
    });
}

static CMPIStatus PowerManagementHostedService_Associators(CMPIAssociationMI*, const CMPIContext* ctx,
                                                           const CMPIResult* rslt, const CMPIObjectPath* op,
                                                           const char* assocClass, const char* resultClass, const char*,
                                                           const char*, const char** properties) {
    return associators(provider, broker, ctx, rslt, op, assocClass, resultClass, properties);
}

static CMPIStatus PowerManagementHostedService_AssociatorNames(CMPIAssociationMI*, const CMPIContext* ctx,
                                                               const CMPIResult* rslt, const CMPIObjectPath* op,
                                                               const char* assocClass, const char* resultClass,
                                                               const char*, const char*) {
    return associatorNames(provider, broker, ctx, rslt, op, assocClass, resultClass);
}

static CMPIStatus PowerManagementHostedService_References(CMPIAssociationMI*, const CMPIContext* ctx,
                                                          const CMPIResult* rslt, const CMPIObjectPath* op, const char*,
                                                          const char*, const char** properties) {
    // Where the client names properties, of the services only the keys are made: their paths are all that counts.
    return references(provider, broker, ctx, rslt, op, properties != nullptr);
}

static CMPIStatus PowerManagementHostedService_ReferenceNames(CMPIAssociationMI*, const CMPIContext* ctx,
                                                              const CMPIResult* rslt, const CMPIObjectPath* op,
                                                              const char*, const char*) {
    return referenceNames(provider, broker, ctx, rslt, op);
}

CMInstanceMIStub(PowerManagementHostedService_, PowerManagementHostedServiceProvider, broker, CMNoHook)
CMAssociationMIStub(PowerManagementHostedService_, PowerManagementHostedServiceProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

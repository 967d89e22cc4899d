/**
 * TALVO_AssociatedPowerManagementService: ties each computer system to each service that manages its power, with the
 * current and the requested power state (CIM_AssociatedPowerManagementService, DMTF DSP1027).
 */
#include "ProviderSupport.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerAssociatedPower = "Corvane.AssociatedPowerMgmtProvider";

static const char* filterKeys[] = {"ServiceProvided", "UserOfService", nullptr};

static constexpr const char* servicesNotAvailable =
    "***Can't get Power Management Service ObjectPaths.             Exiting EnumerateInstanceNames***";

static const AssociationProvider provider = {
    .category = loggerAssociatedPower,
    .className = associatedPowerManagementServiceClass,
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

ORV_FIXED_INSTANCE_OPERATIONS(AssociatedPowerManagementService)
ORV_FIXED_ASSOCIATION_OPERATIONS(AssociatedPowerManagementService)

static unsigned short AssociatedPowerManagementServiceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                                                    const CMPIContext* ctx,
                                                                    std::vector<CMPIInstance*>& instances) {
    return buildAssociations(provider, broker, ctx, ref, properties, instances);
}

static CMPIStatus AssociatedPowerManagementService_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext* ctx,
                                                                     const CMPIResult* rslt,
                                                                     const CMPIObjectPath* ref) {
    return enumAssociationNames(provider, broker, ctx, rslt, ref);
}

static CMPIStatus AssociatedPowerManagementService_EnumInstances(CMPIInstanceMI*, const CMPIContext* ctx,
                                                                 const CMPIResult* rslt, const CMPIObjectPath* ref,
                                                                 const char** properties) {
    return enumAssociations(provider, rslt, [=](std::vector<CMPIInstance*>& instances) {
        return AssociatedPowerManagementServiceCMPIInstances(ref, properties, ctx, instances);
    });
}

static CMPIStatus AssociatedPowerManagementService_GetInstance(CMPIInstanceMI*, const CMPIContext* ctx,
                                                               const CMPIResult* rslt, const CMPIObjectPath* ref,
                                                               const char** properties) {
    return getAssociation(provider, rslt, ref, [=](std::vector<CMPIInstance*>& instances) {
        return AssociatedPowerManagementServiceCMPIInstances(ref, properties, ctx, instances);
    });
}

static CMPIStatus AssociatedPowerManagementService_Associators(CMPIAssociationMI*, const CMPIContext* ctx,
                                                               const CMPIResult* rslt, const CMPIObjectPath* op,
                                                               const char* assocClass, const char* resultClass,
                                                               const char*, const char*, const char** properties) {
    return associators(provider, broker, ctx, rslt, op, assocClass, resultClass, properties);
}

static CMPIStatus AssociatedPowerManagementService_AssociatorNames(CMPIAssociationMI*, const CMPIContext* ctx,
                                                                   const CMPIResult* rslt, const CMPIObjectPath* op,
                                                                   const char* assocClass, const char* resultClass,
                                                                   const char*, const char*) {
    return associatorNames(provider, broker, ctx, rslt, op, assocClass, resultClass);
}

static CMPIStatus AssociatedPowerManagementService_References(CMPIAssociationMI*, const CMPIContext* ctx,
                                                              const CMPIResult* rslt, const CMPIObjectPath* op,
                                                              const char*, const char*, const char** properties) {
    // Where the client names properties, of the services only the keys are made: their paths are all that counts.
    return references(provider, broker, ctx, rslt, op, properties != nullptr);
}

static CMPIStatus AssociatedPowerManagementService_ReferenceNames(CMPIAssociationMI*, const CMPIContext* ctx,
                                                                  const CMPIResult* rslt, const CMPIObjectPath* op,
                                                                  const char*, const char*) {
    return referenceNames(provider, broker, ctx, rslt, op);
}

CMInstanceMIStub(AssociatedPowerManagementService_, AssociatedPowerManagementServiceProvider, broker, CMNoHook)
CMAssociationMIStub(AssociatedPowerManagementService_, AssociatedPowerManagementServiceProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

/**
 * TALVO_PowerManagementElementCapabilities: links each service to each capabilities object (CIM_ElementCapabilities,
 * DMTF DSP1027). Neither end is a computer system, so this provider makes no up-calls.
 */
#include "AssociationOperations.h"

namespace Norv::PowerStateManagementServiceProvider {

static const CMPIBroker* broker = nullptr;
static const std::string loggerPowerElementCapabilities = "Corvane.PowerElementCapProvider";

static const char* filterKeys[] = {"ManagedElement", "Capabilities", nullptr};

static constexpr const char* capabilitiesNotAvailable =
    "***Can't get ObjectPaths for PowerManagementCapabilities.                 Exiting EnumerateInstanceNames***";
static constexpr const char* capabilitiesPathNull = "CMPIObjectPath is NULL for PowerManagementCapabilities";
static constexpr const char* associationPathFailed =
    "Create CMPIObjectPath failed for                     PowerManagementElementCapabilities.";

/**
 * This is the only failure of an association that reaches the client as an error. Its text has no period at the end.
 */
static void onNamesPathFailed(const CMPIBroker* mb, CMPIStatus* status) {
    CMSetStatusWithChars(mb, status, CMPI_RC_ERR_FAILED,
                         "Create CMPIObjectPath failed for                     PowerManagementElementCapabilities");
    CMTraceMessage(mb, CMPI_LEV_INFO, "PowerManagementElementCapabilitiesProvider", associationPathFailed, nullptr);
}

static unsigned short PowerManagementElementCapabilities(const CMPIObjectPath* ref, const char** properties,
                                                         std::vector<CMPIInstance*>& instances);

static const AssociationProvider provider = {
    .category = loggerPowerElementCapabilities,
    .className = powerManagementElementCapabilitiesClass,
    .build =
        [](const CMPIObjectPath* ref, char const** properties, const CMPIContext*,
           std::vector<CMPIInstance*>& instances) {
            return PowerManagementElementCapabilities(ref, properties, instances);
        },
    .first =
        {
            .className = powerManagementServiceClass,
            .role = "ManagedElement",
            .source = ObjectSource::services,
            .notAvailable =
                {
                    .associatorNames = "getAllPMCMPIObjPaths Failed For powerManagementServiceClass",
                    .associators = "getAllPMCMPIInstances Failed For powerManagementServiceClass",
                    .referenceNames = "getAllPMCMPIObjPaths Failed for powerManagementServiceClass",
                    .references = "getAllPMCMPIInstances Failed for powerManagementServiceClass",
                },
        },
    .second =
        {
            .className = powerManagementCapabilitiesClass,
            .role = "Capabilities",
            .source = ObjectSource::capabilities,
            .notAvailable =
                {
                    .associatorNames = "getAllPMCMPIObjPaths Failed For powerManagementCapabilitiesClass",
                    .associators = " getAllPMCapCMPIInstances Failed for powerManagementCapabilitiesClass class",
                    .referenceNames = "getAllPMCapCMPIObjPaths Failed for powerManagementCapabilitiesClass",
                    .references = "getAllPMCapCMPIInstances Failed for powerManagementCapabilitiesClass",
                },
        },
    .filterKeys = filterKeys,
    .instances =
        {
            .servicesNotAvailable =
                "***Can't get Power Management Service ObjectPaths.             Exiting EnumerateInstanceNames***",
            .servicePathNull = servicePathNull,
            .associationPathFailed = associationPathFailed,
            .capabilitiesNotAvailable = capabilitiesNotAvailable,
            .capabilitiesPathNull = capabilitiesPathNull,
        },
    .names =
        {
            .servicesNotAvailable =
                "***Can't get Power Management Service ObjectPaths.           Exiting EnumerateInstanceNames***",
            .servicePathNull = servicePathNull,
            .associationPathFailed = associationPathFailed,
            .capabilitiesNotAvailable = capabilitiesNotAvailable,
            .capabilitiesPathNull = capabilitiesPathNull,
        },
    .targetNull =
        {
            .associatorNames = targetNullTexts.associatorNames,
            .associators = "Object Path is NULL in Associations.",
            .referenceNames = targetNullTexts.referenceNames,
            .references = targetNullTexts.references,
        },
    .onNamesPathFailed = onNamesPathFailed,
    .referencesOfKeysOnly = true,
};

static unsigned short PowerManagementElementCapabilities(const CMPIObjectPath* ref, const char** properties,
                                                         std::vector<CMPIInstance*>& instances) {
    return buildAssociations(provider, broker, nullptr, ref, properties, instances);
}

ORV_ASSOCIATION_OPERATIONS(PowerManagementElementCapabilities)

CMInstanceMIStub(PowerManagementElementCapabilities_, PowerManagementElementCapabilitiesProvider, broker, CMNoHook)
CMAssociationMIStub(PowerManagementElementCapabilities_, PowerManagementElementCapabilitiesProvider, broker, CMNoHook)

} // namespace Norv::PowerStateManagementServiceProvider

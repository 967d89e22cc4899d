/**
 * The operations of the three associations.
 */
#ifndef ASSOCIATIONOPERATIONS_H
#define ASSOCIATIONOPERATIONS_H

#include "FixedOperations.h"
#include "PowerStateManagementObjFactory.h"
#include "Trace.h"

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <string>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

/** The source of the objects at one end of an association. */
enum class ObjectSource {
    /** Another provider, which is asked through the object manager. */
    objectManager,
    services,
    capabilities,
};

/** The record whose power states an association has. The choices differ only if there are several records. */
enum class PowerStates {
    none,
    firstRecord,
    /**
     * The states of each record are set in turn, so those of the last one stay. Without records, there is no
     * association.
     */
    everyRecord,
};

/** One text for each of the association operations. */
struct AssociationTexts {
    const char* associatorNames;
    const char* associators;
    const char* referenceNames;
    const char* references;
};

/** One end of an association. */
struct AssociationEnd {
    const char* className;
    /** The association's property that refers to this end. */
    const char* role;
    ObjectSource source;
    /** The texts that are reported if this end is the far one and its objects are not available. */
    AssociationTexts notAvailable;
    /** Whether AssociatorNames sets the namespace and the host name of this end's paths. */
    bool placedByAssociatorNames = false;
    /** Another class name that clients may use as result class for this end; null if result classes are ignored. */
    const char* resultClassAlias = nullptr;
    /** The power states that References sets in an association whose far end is this one. */
    PowerStates inReferences = PowerStates::none;
};

/** The texts that are reported if the walk over an association's pairs fails. */
struct PairTexts {
    const char* servicesNotAvailable;
    const char* servicePathNull;
    const char* associationPathFailed;
    /* Null if neither end is a capabilities object. */
    const char* capabilitiesNotAvailable = nullptr;
    const char* capabilitiesPathNull = nullptr;
};

/**
 * Appends an association's instances for a request.
 *
 * @param context for the up-calls to other providers.
 * @return CMPI_RC_OK or CMPI_RC_ERR_FAILED.
 */
using AssociationBuilder = unsigned short (*)(const CMPIObjectPath* ref, char const** properties,
                                              const CMPIContext* context, std::vector<CMPIInstance*>& instances);

/** What is particular to the provider of one association. */
struct AssociationProvider {
    const std::string& category;
    const char* className;
    /**
     * Calls `buildAssociations`. It is a function of the provider's own file, since log records name the function and
     * file.
     */
    AssociationBuilder build;
    /**
     * The two ends. The outer loop over pairs walks the first end, the inner loop the second; their properties are set
     * in this order.
     */
    AssociationEnd first;
    AssociationEnd second;
    /** The key names that are given to an instance's property filter; the array ends with a null. */
    const char** filterKeys;
    PairTexts instances;
    PairTexts names;
    /** The texts that are reported if the association does not link the class of the source. */
    AssociationTexts targetNull;
    /** The power states that an enumerated instance has. */
    PowerStates inInstances = PowerStates::none;
    /** Called by EnumInstanceNames, after its report, if the association's path cannot be made; may be null. */
    void (*onNamesPathFailed)(const CMPIBroker* broker, CMPIStatus* status) = nullptr;
    /** Whether EnumInstanceNames closes its result before it marks its exit; else it does so afterwards. */
    bool namesCloseBeforeExit = false;
    /**
     * References needs only the paths of the instances at the far end. True: these instances always have their keys
     * only; false: only if the client names properties.
     */
    bool referencesOfKeysOnly = false;
};

/* Texts that several of the associations report. */
inline constexpr const char* servicePathNull = "CMPIObjectPath is NULL for Power Management Service";
inline constexpr const char* computerSystemsNotAvailable = "CBEnumInstanceNames Failed for the target Class";
inline constexpr AssociationTexts computerSystemEndNotAvailable = {
    computerSystemsNotAvailable,
    computerSystemsNotAvailable,
    computerSystemsNotAvailable,
    computerSystemsNotAvailable,
};
inline constexpr const char* serviceReferencesNotAvailable =
    "***Can't get Power Management Service instances                 Exiting References***";
inline constexpr AssociationTexts serviceEndNotAvailable = {
    .associatorNames = "***Can't get Service processor ObjectPaths.                     Exiting AssociatorNames***",
    .associators = "***Can't get Power Management Service ObjectPaths.                  Exiting Associators***",
    .referenceNames = serviceReferencesNotAvailable,
    .references = serviceReferencesNotAvailable,
};
inline constexpr AssociationTexts targetNullTexts = {
    .associatorNames = "Object Path is NULL in AssociatorNames.",
    .associators = "Object Path is NULL in Associators.",
    .referenceNames = "Object Path is NULL in ReferenceNames.",
    .references = "Object Path is NULL in References.",
};

/*
 * The operations of an association. Each logs under the name and place of its caller. An operation that fails leaves
 * its result open and marks no exit. The last four never close their result.
 */

/** Appends an instance for each pair. @return CMPI_RC_OK or CMPI_RC_ERR_FAILED. */
unsigned short buildAssociations(const AssociationProvider& provider, const CMPIBroker* broker,
                                 const CMPIContext* context, const CMPIObjectPath* ref, char const** properties,
                                 std::vector<CMPIInstance*>& instances, const Site& site = Site::here());

CMPIStatus enumAssociationNames(const AssociationProvider& provider, const CMPIBroker* broker,
                                const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* ref,
                                const Site& site = Site::here());

/** If the builder fails, the result is closed without instances, and the status does not tell of the failure. */
CMPIStatus enumAssociations(const AssociationProvider& provider, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* ref, char const** properties, const Site& site = Site::here());

/** Returns the first instance with an equal path. If there is none, that is not an error. */
CMPIStatus getAssociation(const AssociationProvider& provider, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* ref, char const** properties, const Site& site = Site::here());

/** A null association class asks for this provider's own. An empty one is a name that no class has. */
CMPIStatus associatorNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                           const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                           const char* resultClass, const Site& site = Site::here());
CMPIStatus associators(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                       const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                       const char* resultClass, char const** properties, const Site& site = Site::here());

CMPIStatus referenceNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                          const CMPIResult* result, const CMPIObjectPath* op, const Site& site = Site::here());

/**
 * @param properties the request's property list. References have all their properties, whatever it lists. It only
 * decides whether the instances at the far end are made with their keys only.
 */
CMPIStatus references(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                      const CMPIResult* result, const CMPIObjectPath* op, char const** properties,
                      const Site& site = Site::here());

} // namespace Norv::PowerStateManagementServiceProvider

/**
 * Defines the operations of an association's class. It is used in the class's own file, since log records name the
 * operation and its file. Uses the file's variables `provider` and `broker`.
 */
#define ORV_ASSOCIATION_OPERATIONS(Class)                                                                              \
    ORV_FIXED_INSTANCE_OPERATIONS(Class)                                                                               \
    ORV_FIXED_ASSOCIATION_OPERATIONS(Class)                                                                            \
    static CMPIStatus Class##_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext* ctx, const CMPIResult* rslt,       \
                                                const CMPIObjectPath* ref) {                                           \
        return enumAssociationNames(provider, broker, ctx, rslt, ref);                                                 \
    }                                                                                                                  \
    static CMPIStatus Class##_EnumInstances(CMPIInstanceMI*, const CMPIContext* ctx, const CMPIResult* rslt,           \
                                            const CMPIObjectPath* ref, const char** properties) {                      \
        return enumAssociations(provider, ctx, rslt, ref, properties);                                                 \
    }                                                                                                                  \
    static CMPIStatus Class##_GetInstance(CMPIInstanceMI*, const CMPIContext* ctx, const CMPIResult* rslt,             \
                                          const CMPIObjectPath* ref, const char** properties) {                        \
        return getAssociation(provider, ctx, rslt, ref, properties);                                                   \
    }                                                                                                                  \
    static CMPIStatus Class##_Associators(CMPIAssociationMI*, const CMPIContext* ctx, const CMPIResult* rslt,          \
                                          const CMPIObjectPath* op, const char* assocClass, const char* resultClass,   \
                                          const char*, const char*, const char** properties) {                         \
        return associators(provider, broker, ctx, rslt, op, assocClass, resultClass, properties);                      \
    }                                                                                                                  \
    static CMPIStatus Class##_AssociatorNames(CMPIAssociationMI*, const CMPIContext* ctx, const CMPIResult* rslt,      \
                                              const CMPIObjectPath* op, const char* assocClass,                        \
                                              const char* resultClass, const char*, const char*) {                     \
        return associatorNames(provider, broker, ctx, rslt, op, assocClass, resultClass);                              \
    }                                                                                                                  \
    static CMPIStatus Class##_References(CMPIAssociationMI*, const CMPIContext* ctx, const CMPIResult* rslt,           \
                                         const CMPIObjectPath* op, const char*, const char*,                           \
                                         const char** properties) {                                                    \
        return references(provider, broker, ctx, rslt, op, properties);                                                \
    }                                                                                                                  \
    static CMPIStatus Class##_ReferenceNames(CMPIAssociationMI*, const CMPIContext* ctx, const CMPIResult* rslt,       \
                                             const CMPIObjectPath* op, const char*, const char*) {                     \
        return referenceNames(provider, broker, ctx, rslt, op);                                                        \
    }

#endif

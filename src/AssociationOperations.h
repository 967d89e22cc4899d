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

/** Where the objects at one end of an association come from. */
enum class ObjectSource {
    /** From another provider, through the object manager. */
    objectManager,
    services,
    capabilities,
};

/** The records whose power states an association carries; the choices differ where there are several records. */
enum class PowerStates {
    none,
    firstRecord,
    /** Every record's in turn, so that the last one's stay; without records, there is no association. */
    everyRecord,
};

/** A text for each of the association operations. */
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
    /** The text reported where this end is the far one and its objects cannot be had. */
    AssociationTexts notAvailable;
    /** Whether AssociatorNames sets the namespace and the host name of this end's paths. */
    bool placedByAssociatorNames = false;
    /** The second class name that a client's result class may have; null where result classes are not looked at. */
    const char* resultClassAlias = nullptr;
    /** What References puts into an association whose far end is this one. */
    PowerStates inReferences = PowerStates::none;
};

/** The texts reported where the walk over an association's pairs fails. */
struct PairTexts {
    const char* servicesNotAvailable;
    const char* servicePathNull;
    const char* associationPathFailed;
    /* Null where neither end is a capabilities object. */
    const char* capabilitiesNotAvailable = nullptr;
    const char* capabilitiesPathNull = nullptr;
};

/**
 * Appends an association's instances for a request.
 *
 * @param context where the objects of other providers are asked for.
 * @return CMPI_RC_OK or CMPI_RC_ERR_FAILED.
 */
using AssociationBuilder = unsigned short (*)(const CMPIObjectPath* ref, char const** properties,
                                              const CMPIContext* context, std::vector<CMPIInstance*>& instances);

/** What distinguishes the provider of one association from those of the others. */
struct AssociationProvider {
    const std::string& category;
    const char* className;
    /** A function of the provider's own file, since its records name it; calls `buildAssociations`. */
    AssociationBuilder build;
    /** Pairs are walked with the first end outside and the second inside; properties are set in the same order. */
    AssociationEnd first;
    AssociationEnd second;
    /** The names that an instance's property filter is told to spare, ended by a null. */
    const char** filterKeys;
    PairTexts instances;
    PairTexts names;
    /** The texts reported where the association does not link the class of the source. */
    AssociationTexts targetNull;
    /** What an enumerated instance carries. */
    PowerStates inInstances = PowerStates::none;
    /** What EnumInstanceNames does, besides reporting, where the association's path cannot be made; may be null. */
    void (*onNamesPathFailed)(const CMPIBroker* broker, CMPIStatus* status) = nullptr;
    /** Whether EnumInstanceNames closes its result before it marks its exit, or after. */
    bool namesCloseBeforeExit = false;
    /**
     * Whether References has the instances at the far end, of which only the paths count, always built with keys
     * alone; otherwise they are where the client names properties.
     */
    bool referencesOfKeysOnly = false;
};

/* What several of the associations report alike. */
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
 * The operations of an association. As those of an element class, each reports under the name and place of its caller,
 * and fails with its result open and no exit marked; the last four never close their result.
 */

/** Appends an instance for each pair; CMPI_RC_OK or CMPI_RC_ERR_FAILED. */
unsigned short buildAssociations(const AssociationProvider& provider, const CMPIBroker* broker,
                                 const CMPIContext* context, const CMPIObjectPath* ref, char const** properties,
                                 std::vector<CMPIInstance*>& instances, const Site& site = Site::here());

CMPIStatus enumAssociationNames(const AssociationProvider& provider, const CMPIBroker* broker,
                                const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* ref,
                                const Site& site = Site::here());

/** A failure of the builder closes an empty result and does not reach the status. */
CMPIStatus enumAssociations(const AssociationProvider& provider, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* ref, char const** properties, const Site& site = Site::here());

/** Returns the first instance with an equal path; an association that does not exist is no error. */
CMPIStatus getAssociation(const AssociationProvider& provider, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* ref, char const** properties, const Site& site = Site::here());

/** An association class that is null asks for this provider's own; an empty one is a name that no class has. */
CMPIStatus associatorNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                           const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                           const char* resultClass, const Site& site = Site::here());
CMPIStatus associators(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                       const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                       const char* resultClass, char const** properties, const Site& site = Site::here());

CMPIStatus referenceNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                          const CMPIResult* result, const CMPIObjectPath* op, const Site& site = Site::here());

/**
 * @param properties the request's property list. The references have all their properties, whatever it lists; it
 * decides whether the instances that they refer to are built with keys alone.
 */
CMPIStatus references(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                      const CMPIResult* result, const CMPIObjectPath* op, char const** properties,
                      const Site& site = Site::here());

} // namespace Norv::PowerStateManagementServiceProvider

/**
 * Defines the operations of an association's class in the class's own file, of which records name the operation and the
 * file. Uses the file's `provider` and `broker`.
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

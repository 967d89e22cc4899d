/**
 * What the library's source files share: how they log, the operations that every class refuses, the operations of the
 * two element classes, whose instances stand for the power-managed elements, and those of the three associations.
 */
#ifndef PROVIDERSUPPORT_H
#define PROVIDERSUPPORT_H

#include "PowerStateManagementObjFactory.h"
#include "Trace.h"

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <cstring>
#include <functional>
#include <map>
#include <string>
#include <tuple>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

/** Records by the key that a factory was made with. */
using Records = std::map<std::string, PowerStateManagement>;

/** Writes a free text under the caller's category. */
void logMessage(const std::string& category, int level, const char* text, const Site& site = Site::here());

/** Writes a variable's value at the level of operations. */
void logVariable(const std::string& category, const char* variable, const char* value, const Site& site = Site::here());
void logVariable(const std::string& category, const char* variable, unsigned int value,
                 const Site& site = Site::here());

/**
 * The entry and exit records of a call with parameters. The parts are labels and values in turn: pointers are written
 * as addresses, and a null text ends the list.
 */
template <typename... Parts>
class CallTrace {
public:
    explicit CallTrace(const std::string& category, Parts... parts) : _category(category), _parts(parts...) {}

    void entering(const Site& site = Site::here()) const { write(ENTERING, site); }
    void exiting(const Site& site = Site::here()) const { write(EXITING, site); }

private:
    void write(MessageType type, const Site& site) const {
        OrvLog::OrvMessageBuffer buffer;
        std::ostream& stream = buffer;
        std::apply([&](const Parts&... parts) { (stream << ... << parts); }, _parts);
        const std::string& parameters = OrvLog::OrvMessageBuffer::str(stream);
        writeRecord(_category, progressLevel, site,
                    [&] { return tracepara(site.function, site.file, site.line, parameters.c_str(), type); });
    }

    const std::string& _category;
    std::tuple<Parts...> _parts;
};

/**
 * One run of a provider's operation: marked as entered when it is made. What it reports carries the place where the
 * provider's file entered it, since the work may be done in code that providers share.
 */
class Operation {
public:
    Operation(const std::string& category, const Site& site) : _category(category), _site(site) {
        markProviderEntry(_category, _site.function, _site.file, _site.line);
    }

    /** What the operation returns: handed to every call of the broker and the factory, which write it. */
    CMPIStatus status{CMPI_RC_OK, nullptr};

    const Site& site() const { return _site; }

    void report(const char* failure) const { logMessage(_category, failureLevel, failure, _site); }

    void markExit() const { markProviderExit(_category, _site.function, _site.file, _site.line); }

    /** Ends the operation as failed: the result stays open and no exit is marked. */
    CMPIStatus fail(const char* failure) const {
        report(failure);
        return status;
    }

    /** Ends the operation with its result closed. */
    CMPIStatus complete(const CMPIResult* result) const {
        CMReturnDone(result);
        markExit();
        return status;
    }

private:
    const std::string& _category;
    Site _site;
};

/** The text of a string that the broker gave; null where it gave none. */
inline const char* textOf(const CMPIString* string) {
    return CMIsNullObject(string) ? nullptr : CMGetCharPtr(string);
}

/** Whether a text, which may be null, is this one to the letter. */
inline bool isText(const char* text, const char* expected) {
    return text != nullptr && std::strcmp(text, expected) == 0;
}

/** The string in a value; null where the value is of another type. */
inline CMPIString* stringOf(const CMPIData& data) {
    return data.type == CMPI_string ? data.value.string : nullptr;
}

/** Whether a value of this type is a pointer to a CMPI object. All of them begin with a handle and a function table. */
inline bool isObjectType(CMPIType type) {
    switch (type) {
    case CMPI_instance:
    case CMPI_ref:
    case CMPI_args:
    case CMPI_filter:
    case CMPI_enumeration:
    case CMPI_string:
    case CMPI_dateTime:
        return true;
    default:
        return (type & CMPI_ARRAY) != 0;
    }
}

/**
 * A path of a class, without keys, in a namespace and on the managed system; null where the broker cannot make it.
 *
 * @param nameSpace may be null where the request has none.
 */
CMPIObjectPath* newClassPath(const CMPIBroker* broker, const char* nameSpace, const char* className,
                             CMPIStatus* status);

/** What tells the provider of one element class from that of the other. */
struct ElementProvider {
    using AllObjectPaths = unsigned short (PowerStateManagementObjFactory::*)(const CMPIBroker*, const CMPIObjectPath*,
                                                                              std::vector<CMPIObjectPath*>&,
                                                                              CMPIStatus*);
    using AllInstances = unsigned short (PowerStateManagementObjFactory::*)(const CMPIBroker*, const CMPIObjectPath*,
                                                                            char const**, bool,
                                                                            std::vector<CMPIInstance*>&, CMPIStatus*);
    using OneInstance = unsigned short (PowerStateManagementObjFactory::*)(const CMPIBroker*, const CMPIObjectPath*,
                                                                           CMPIString*, char const**,
                                                                           std::vector<CMPIInstance*>&, CMPIStatus*);

    const std::string& category;
    /** The key property that names an element. */
    const char* key;
    AllObjectPaths allObjectPaths;
    AllInstances allInstances;
    OneInstance oneInstance;
    const char* lookupFailed;
    const char* scanFailed;
};

/*
 * The operations of an element class. Each builds its own factory, returns the status that the last call of the broker
 * or the factory left, and reports under the name and place of its caller. Where the factory fails, the result stays
 * open and no exit is marked.
 */

CMPIStatus enumInstanceNames(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                             const CMPIObjectPath* objectPath, const Site& site = Site::here());

CMPIStatus enumInstances(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                         const CMPIObjectPath* objectPath, char const** properties, const Site& site = Site::here());

/** Looks the element up by its key; where the path lacks that key, the first instance with an equal path is it. */
CMPIStatus getInstance(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                       const CMPIObjectPath* objectPath, char const** properties, const Site& site = Site::here());

/** Where the objects at one end of an association come from. */
enum class ObjectSource {
    /** From another provider, through the object manager. */
    objectManager,
    services,
    capabilities,
};

/** The records whose power states an association carries. Where there are several records, it matters. */
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
    /** Reported where this end is the far one and its objects cannot be had. */
    AssociationTexts notAvailable;
    /** Whether AssociatorNames sets the namespace and the host name of this end's paths. */
    bool placedByAssociatorNames = false;
    /** The second class name that a client's result class may have; null where result classes are not looked at. */
    const char* resultClassAlias = nullptr;
    /** What References puts into an association whose far end is this one. */
    PowerStates inReferences = PowerStates::none;
};

/** Reported where the walk over an association's pairs fails. */
struct PairTexts {
    const char* servicesNotAvailable;
    const char* servicePathNull;
    const char* associationPathFailed;
    /* Null where neither end is a capabilities object. */
    const char* capabilitiesNotAvailable = nullptr;
    const char* capabilitiesPathNull = nullptr;
};

/** What tells the provider of one association from those of the others. */
struct AssociationProvider {
    const std::string& category;
    const char* className;
    /** Pairs are walked with the first end outside and the second inside; properties are set in the same order. */
    AssociationEnd first;
    AssociationEnd second;
    /** The names that an instance's property filter is told to spare, ended by a null. */
    const char** filterKeys;
    PairTexts instances;
    PairTexts names;
    /** Reported where source and association do not belong together. */
    AssociationTexts targetNull;
    /** What an enumerated instance carries. */
    PowerStates inInstances = PowerStates::none;
    /** What EnumInstanceNames does, besides reporting, where the association's path cannot be made; may be null. */
    void (*onNamesPathFailed)(const CMPIBroker* broker, CMPIStatus* status) = nullptr;
    /** Whether EnumInstanceNames closes its result before it marks its exit, or after. */
    bool namesCloseBeforeExit = false;
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

/** Appends an association's instances; 0 where it could. */
using AssociationBuilder = std::function<unsigned short(std::vector<CMPIInstance*>& instances)>;

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
CMPIStatus enumAssociations(const AssociationProvider& provider, const CMPIResult* result,
                            const AssociationBuilder& build, const Site& site = Site::here());

/** Returns the first instance with an equal path; an association that does not exist is no error. */
CMPIStatus getAssociation(const AssociationProvider& provider, const CMPIResult* result, const CMPIObjectPath* ref,
                          const AssociationBuilder& build, const Site& site = Site::here());

/** An association class that is null or empty asks for this provider's own. */
CMPIStatus associatorNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                           const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                           const char* resultClass, const Site& site = Site::here());
CMPIStatus associators(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                       const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                       const char* resultClass, char const** properties, const Site& site = Site::here());

CMPIStatus referenceNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                          const CMPIResult* result, const CMPIObjectPath* op, const Site& site = Site::here());

/** @param keysOnly whether the instances at the far end, of which only the paths count, are built with keys alone. */
CMPIStatus references(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                      const CMPIResult* result, const CMPIObjectPath* op, bool keysOnly,
                      const Site& site = Site::here());

} // namespace Norv::PowerStateManagementServiceProvider

/** Defines a provider's operation that takes these arguments, uses none of them and returns this code. */
#define ORV_FIXED_OPERATION(name, code, ...)                                                                           \
    static CMPIStatus name(__VA_ARGS__) {                                                                              \
        return CMPIStatus{code, nullptr};                                                                              \
    }

/** The operations of an instance provider that are the same for every class: instances are never made or changed. */
#define ORV_FIXED_INSTANCE_OPERATIONS(Class)                                                                           \
    ORV_FIXED_OPERATION(Class##_Cleanup, CMPI_RC_OK, CMPIInstanceMI*, const CMPIContext*, CMPIBoolean)                 \
    ORV_FIXED_OPERATION(Class##_CreateInstance, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,        \
                        const CMPIResult*, const CMPIObjectPath*, const CMPIInstance*)                                 \
    ORV_FIXED_OPERATION(Class##_ModifyInstance, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,        \
                        const CMPIResult*, const CMPIObjectPath*, const CMPIInstance*, const char**)                   \
    ORV_FIXED_OPERATION(Class##_DeleteInstance, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,        \
                        const CMPIResult*, const CMPIObjectPath*)                                                      \
    ORV_FIXED_OPERATION(Class##_ExecQuery, CMPI_RC_ERR_NOT_SUPPORTED, CMPIInstanceMI*, const CMPIContext*,             \
                        const CMPIResult*, const CMPIObjectPath*, const char*, const char*)

/** The operation of an association provider that is the same for every class. */
#define ORV_FIXED_ASSOCIATION_OPERATIONS(Class)                                                                        \
    ORV_FIXED_OPERATION(Class##_AssociationCleanup, CMPI_RC_OK, CMPIAssociationMI*, const CMPIContext*, CMPIBoolean)

#endif

/**
 * The operations of the two element classes, whose instances represent the power-managed elements.
 */
#ifndef ELEMENTOPERATIONS_H
#define ELEMENTOPERATIONS_H

#include "FixedOperations.h"
#include "PowerStateManagementObjFactory.h"
#include "Trace.h"

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <string>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

/** What is particular to the provider of one element class. */
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
    /** The name of the key property. */
    const char* key;
    AllObjectPaths allObjectPaths;
    AllInstances allInstances;
    OneInstance oneInstance;
    const char* lookupFailed;
    const char* scanFailed;
};

/*
 * The operations of an element class. Each makes its own factory, returns the status that the last call of the broker
 * or the factory left, and logs under the name and place of its caller. If the factory fails, the operation leaves its
 * result open and marks no exit.
 */

CMPIStatus enumInstanceNames(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                             const CMPIObjectPath* objectPath, const Site& site = Site::here());

CMPIStatus enumInstances(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                         const CMPIObjectPath* objectPath, char const** properties, const Site& site = Site::here());

/** Returns the element with the path's key; if the path lacks that key, the first instance with an equal path. */
CMPIStatus getInstance(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                       const CMPIObjectPath* objectPath, char const** properties, const Site& site = Site::here());

} // namespace Norv::PowerStateManagementServiceProvider

/**
 * Defines the operations of an element class. It is used in the class's own file, since log records name the operation
 * and its file. Uses the file's variables `provider` and `broker`.
 */
#define ORV_ELEMENT_OPERATIONS(Class)                                                                                  \
    ORV_FIXED_INSTANCE_OPERATIONS(Class)                                                                               \
    static CMPIStatus Class##_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,         \
                                                const CMPIObjectPath* objectPath) {                                    \
        return enumInstanceNames(provider, broker, result, objectPath);                                                \
    }                                                                                                                  \
    static CMPIStatus Class##_EnumInstances(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,             \
                                            const CMPIObjectPath* objectPath, char const** properties) {               \
        return enumInstances(provider, broker, result, objectPath, properties);                                        \
    }                                                                                                                  \
    static CMPIStatus Class##_GetInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,               \
                                          const CMPIObjectPath* objectPath, char const** properties) {                 \
        return getInstance(provider, broker, result, objectPath, properties);                                          \
    }

#endif

#include "ElementOperations.h"

#include "BrokerObjects.h"
#include "Operation.h"

namespace Norv::PowerStateManagementServiceProvider {

CMPIStatus enumInstanceNames(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                             const CMPIObjectPath* objectPath, const Site& site) {
    Operation operation(provider.category, site);
    PowerStateManagementObjFactory factory(provider.key);
    std::vector<CMPIObjectPath*> paths;
    paths.reserve(factory.getNumberOfInstances());
    if ((factory.*provider.allObjectPaths)(broker, objectPath, paths, &operation.status) != 0) {
        return operation.fail("***Can't get ObjectPaths.                     Exiting EnumerateInstanceNames***");
    }
    returnAll(result, paths);
    return operation.complete(result);
}

CMPIStatus enumInstances(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                         const CMPIObjectPath* objectPath, char const** properties, const Site& site) {
    Operation operation(provider.category, site);
    PowerStateManagementObjFactory factory(provider.key);
    std::vector<CMPIInstance*> instances;
    instances.reserve(factory.getNumberOfInstances());
    if ((factory.*provider.allInstances)(broker, objectPath, properties, false, instances, &operation.status) != 0) {
        return operation.fail("***Could not get instances,                      exiting EnumerateInstance***");
    }
    returnAll(result, instances);
    return operation.complete(result);
}

CMPIStatus getInstance(const ElementProvider& provider, const CMPIBroker* broker, const CMPIResult* result,
                       const CMPIObjectPath* objectPath, char const** properties, const Site& site) {
    Operation operation(provider.category, site);
    if (CMGetKeyCount(objectPath, &operation.status) == 0) {
        operation.report("At least one key should be passed");
        return operation.complete(result);
    }

    CMPIString* const key = stringOf(CMGetKey(objectPath, provider.key, &operation.status));
    PowerStateManagementObjFactory factory(provider.key);
    std::vector<CMPIInstance*> instances;
    instances.reserve(factory.getNumberOfInstances());
    if (!isNull(key)) {
        if ((factory.*provider.oneInstance)(broker, objectPath, key, properties, instances, &operation.status) != 0) {
            return operation.fail(provider.lookupFailed);
        }
        returnAll(result, instances);
    } else {
        if ((factory.*provider.allInstances)(broker, objectPath, properties, false, instances, &operation.status) !=
            0) {
            return operation.fail(provider.scanFailed);
        }
        returnFirstMatch(result, instances, objectPath, false, &operation.status);
    }
    return operation.complete(result);
}

} // namespace Norv::PowerStateManagementServiceProvider

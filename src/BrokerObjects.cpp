#include "BrokerObjects.h"

#include "Norv/Common.h"

namespace Norv::PowerStateManagementServiceProvider {

CMPIObjectPath* newClassPath(const CMPIBroker* broker, const char* nameSpace, const char* className,
                             CMPIStatus* status) {
    CMPIObjectPath* const path = CMNewObjectPath(broker, nameSpace, className, status);
    if (CMIsNullObject(path)) {
        return nullptr;
    }
    CMSetNameSpace(path, nameSpace);
    CMSetHostname(path, getSystemName().c_str());
    return path;
}

void returnAll(const CMPIResult* result, const std::vector<CMPIObjectPath*>& paths) {
    forEach(paths, [result](const CMPIObjectPath* path) {
        CMReturnObjectPath(result, path);
        return true;
    });
}

void returnAll(const CMPIResult* result, const std::vector<CMPIInstance*>& instances) {
    forEach(instances, [result](const CMPIInstance* instance) {
        CMReturnInstance(result, instance);
        return true;
    });
}

/** Returns the first of the instances whose path equals the requested one under `flag`, if there is one. */
void returnFirstMatch(const CMPIResult* result, const std::vector<CMPIInstance*>& instances,
                      const CMPIObjectPath* objectPath, bool flag, CMPIStatus* status) {
    forEach(instances, [&](const CMPIInstance* instance) {
        if (CMIsNullObject(instance)) {
            return true;
        }
        const CMPIObjectPath* const path = CMGetObjectPath(instance, status);
        if (!isObjPathsEqual(objectPath, path, flag)) {
            return true;
        }
        CMReturnInstance(result, instance);
        return false;
    });
}

} // namespace Norv::PowerStateManagementServiceProvider

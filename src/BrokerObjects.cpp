#include "BrokerObjects.h"

#include "Norv/Common.h"

namespace Norv::PowerStateManagementServiceProvider {

CMPIObjectPath* newClassPath(const CMPIBroker* broker, const char* nameSpace, const char* className,
                             CMPIStatus* status) {
    CMPIObjectPath* const path = CMNewObjectPath(broker, nameSpace, className, status);
    if (isNull(path)) {
        return nullptr;
    }
    CMSetNameSpace(path, nameSpace);
    CMSetHostname(path, getSystemName().c_str());
    return path;
}

namespace {

/** For the type CMPI_chars, the pointer to the value is a pointer to the text. */
const CMPIValue* textValue(const char* text) {
    return reinterpret_cast<const CMPIValue*>(text);
}

/** A value that refers to `path`. The broker copies the path when it takes the value. */
CMPIValue referenceValue(const CMPIObjectPath* path) {
    CMPIValue value = {};
    value.ref = const_cast<CMPIObjectPath*>(path);
    return value;
}

} // namespace

void addKey(CMPIObjectPath* path, const char* name, const char* text) {
    CMAddKey(path, name, textValue(text), CMPI_chars);
}

void addKey(CMPIObjectPath* path, const char* name, const CMPIObjectPath* reference) {
    const CMPIValue value = referenceValue(reference);
    CMAddKey(path, name, &value, CMPI_ref);
}

void setProperty(const CMPIInstance* instance, const char* name, const char* text) {
    CMSetProperty(instance, name, textValue(text), CMPI_chars);
}

void setProperty(const CMPIInstance* instance, const char* name, CMPIUint16 number) {
    CMPIValue value = {};
    value.uint16 = number;
    CMSetProperty(instance, name, &value, CMPI_uint16);
}

void setProperty(const CMPIInstance* instance, const char* name, const CMPIObjectPath* reference) {
    const CMPIValue value = referenceValue(reference);
    CMSetProperty(instance, name, &value, CMPI_ref);
}

void setProperty(const CMPIInstance* instance, const char* name, CMPIArray* array) {
    CMPIValue value = {};
    value.array = array;
    CMSetProperty(instance, name, &value, CMPI_uint16A);
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

void returnFirstMatch(const CMPIResult* result, const std::vector<CMPIInstance*>& instances,
                      const CMPIObjectPath* objectPath, bool flag, CMPIStatus* status) {
    forEach(instances, [&](const CMPIInstance* instance) {
        if (isNull(instance)) {
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

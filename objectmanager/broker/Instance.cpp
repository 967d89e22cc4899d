#include "broker/Objects.h"

#include <algorithm>

namespace ObjectManager {

namespace {

bool contains(const Names& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [&](const Text& text) { return equalNames(text, name); });
}

/** Puts copies of a null-ended list's names in place of those in `names`. */
void assignNames(Names& names, const char** list) {
    names.clear();
    for (; list != nullptr && *list != nullptr; ++list) {
        names.emplace_back(*list);
    }
}

CMPIData getProperty(const CMPIInstance* self, const char* name, CMPIStatus* rc) {
    CMPIStatus status;
    const InstanceContent* instance = contentOf(self, &status);
    return instance != nullptr ? namedValue(instance->instance.properties, name, CMPI_goodValue, rc)
                               : noData(rc, status.rc);
}

CMPIData getPropertyAt(const CMPIInstance* self, CMPICount index, CMPIString** name, CMPIStatus* rc) {
    CMPIStatus status;
    const InstanceContent* instance = contentOf(self, &status);
    return instance != nullptr ? namedValueAt(instance->instance.properties, index, name, CMPI_goodValue, rc)
                               : noData(rc, status.rc);
}

CMPICount getPropertyCount(const CMPIInstance* self, CMPIStatus* rc) {
    const InstanceContent* instance = contentOf(self, rc);
    return instance != nullptr ? static_cast<CMPICount>(instance->instance.properties.size()) : 0;
}

/** A property that the filter leaves out is not kept, and that is no failure. */
CMPIStatus setProperty(const CMPIInstance* self, const char* name, const CMPIValue* value, CMPIType type) {
    CMPIStatus status;
    InstanceContent* instance = changeableContentOf(self, &status);
    if (instance == nullptr) {
        return status;
    }
    if (name != nullptr && instance->filtered && !contains(instance->wanted, name) &&
        !contains(instance->keyNames, name)) {
        return status;
    }
    return setNamedValue(instance->instance.properties, name, value, type);
}

CMPIObjectPath* getObjectPath(const CMPIInstance* self, CMPIStatus* rc) {
    const InstanceContent* instance = contentOf(self, rc);
    Request* request = instance != nullptr ? requestFor(rc) : nullptr;
    if (request == nullptr) {
        return nullptr;
    }
    auto* path = place<ObjectPath>(request->memory(), instance->instance.path);
    completePath(*path, *instance, request->broker().classes());
    return adopted<CMPIObjectPath>(*request, path);
}

CMPIStatus setPropertyFilter(const CMPIInstance* self, const char** properties, const char** keys) {
    CMPIStatus status;
    InstanceContent* instance = changeableContentOf(self, &status);
    if (instance != nullptr) {
        instance->filtered = properties != nullptr;
        assignNames(instance->wanted, properties);
        assignNames(instance->keyNames, keys);
    }
    return status;
}

CMPIStatus setObjectPath(const CMPIInstance* self, const CMPIObjectPath* path) {
    CMPIStatus status;
    InstanceContent* instance = changeableContentOf(self, &status);
    const ObjectPath* given = instance != nullptr ? contentOf(path, &status) : nullptr;
    if (given != nullptr) {
        instance->instance.path = ObjectPath(*given, instance->wanted.get_allocator());
    }
    return status;
}

/** The class of origin is ignored: the schema says where a property was declared. */
CMPIStatus setPropertyWithOrigin(const CMPIInstance* self, const char* name, const CMPIValue* value,
                                 const CMPIType type, const char*) {
    return setProperty(self, name, value, type);
}

} // namespace

const CMPIInstanceFT instanceTable = {
    CMPIVersion200, release<CMPIInstance>, clone<CMPIInstance>, getProperty,   getPropertyAt,         getPropertyCount,
    setProperty,    getObjectPath,         setPropertyFilter,   setObjectPath, setPropertyWithOrigin,
};

} // namespace ObjectManager

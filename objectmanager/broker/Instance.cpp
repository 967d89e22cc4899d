#include "broker/Objects.h"

namespace ObjectManager {

namespace {

bool contains(const List<Text>& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [&](const char* text) { return equalNames(text, name); });
}

/** Replaces `names` by copies of the names in `list`, which a null pointer ends; a null `list` has no names. */
void assignNames(Memory& memory, List<Text>& names, const char** list) {
    std::for_each(names.begin(), names.end(), [&](Text name) { dropText(memory, name); });
    names.size = 0;
    for (; list != nullptr && *list != nullptr; ++list) {
        names.append(memory, copyText(memory, *list));
    }
}

CMPIData getProperty(const CMPIInstance* self, const char* name, CMPIStatus* rc) {
    CMPIStatus status;
    const InstanceContent* instance = contentOf(self, &status);
    return instance != nullptr ? namedValue(instance->properties, name, CMPI_goodValue, rc) : noData(rc, status.rc);
}

CMPIData getPropertyAt(const CMPIInstance* self, CMPICount index, CMPIString** name, CMPIStatus* rc) {
    CMPIStatus status;
    const InstanceContent* instance = contentOf(self, &status);
    return instance != nullptr ? namedValueAt(instance->properties, index, name, CMPI_goodValue, rc)
                               : noData(rc, status.rc);
}

CMPICount getPropertyCount(const CMPIInstance* self, CMPIStatus* rc) {
    const InstanceContent* instance = contentOf(self, rc);
    return instance != nullptr ? instance->properties.size : 0;
}

/** Ignores a property that the filter excludes, and reports success then (setPropertyFilter). */
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
    return setNamedValue(*headerOf(self).memory, instance->properties, name, value, type);
}

CMPIObjectPath* getObjectPath(const CMPIInstance* self, CMPIStatus* rc) {
    const InstanceContent* instance = contentOf(self, rc);
    Request* request = instance != nullptr ? requestFor(rc) : nullptr;
    if (request == nullptr) {
        return nullptr;
    }
    return newObjectOf<CMPIObjectPath>(*request, fullPath(request->memory(), *instance, request->broker().classes()));
}

CMPIStatus setPropertyFilter(const CMPIInstance* self, const char** properties, const char** keys) {
    CMPIStatus status;
    InstanceContent* instance = changeableContentOf(self, &status);
    if (instance != nullptr) {
        Memory& memory = *headerOf(self).memory;
        instance->filtered = properties != nullptr;
        assignNames(memory, instance->wanted, properties);
        assignNames(memory, instance->keyNames, keys);
    }
    return status;
}

CMPIStatus setObjectPath(const CMPIInstance* self, const CMPIObjectPath* path) {
    CMPIStatus status;
    InstanceContent* instance = changeableContentOf(self, &status);
    const PathContent* content = instance != nullptr ? contentOf(path, &status) : nullptr;
    if (content != nullptr) {
        Memory& memory = *headerOf(self).memory;
        drop(memory, instance->path);
        instance->path = copy(memory, *content);
    }
    return status;
}

/** Ignores the class of origin, since the schema tells which class declared a property. */
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

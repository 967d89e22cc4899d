#include "broker/Objects.h"

namespace ObjectManager {

namespace {

/** Sets one text of a path. */
CMPIStatus setText(const CMPIObjectPath* self, Text PathContent::*member, const char* text) {
    CMPIStatus status;
    PathContent* path = changeableContentOf(self, &status);
    if (path == nullptr) {
        return status;
    }
    if (text == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    assignText(*headerOf(self).memory, path->*member, text);
    return status;
}

CMPIString* getText(const CMPIObjectPath* self, Text PathContent::*member, CMPIStatus* rc) {
    const PathContent* path = contentOf(self, rc);
    return path != nullptr ? returnedString(path->*member, rc) : nullptr;
}

CMPIStatus setNameSpace(const CMPIObjectPath* self, const char* nameSpace) {
    return setText(self, &PathContent::nameSpace, nameSpace);
}

CMPIString* getNameSpace(const CMPIObjectPath* self, CMPIStatus* rc) {
    return getText(self, &PathContent::nameSpace, rc);
}

CMPIStatus setHostname(const CMPIObjectPath* self, const char* host) {
    return setText(self, &PathContent::host, host);
}

CMPIString* getHostname(const CMPIObjectPath* self, CMPIStatus* rc) {
    return getText(self, &PathContent::host, rc);
}

CMPIStatus setClassName(const CMPIObjectPath* self, const char* className) {
    return setText(self, &PathContent::className, className);
}

CMPIString* getClassName(const CMPIObjectPath* self, CMPIStatus* rc) {
    return getText(self, &PathContent::className, rc);
}

CMPIStatus addKey(const CMPIObjectPath* self, const char* name, const CMPIValue* value, const CMPIType type) {
    CMPIStatus status;
    PathContent* path = changeableContentOf(self, &status);
    return path != nullptr ? setNamedValue(*headerOf(self).memory, path->keys, name, value, type) : status;
}

CMPIData getKey(const CMPIObjectPath* self, const char* name, CMPIStatus* rc) {
    CMPIStatus status;
    const PathContent* path = contentOf(self, &status);
    return path != nullptr ? namedValue(path->keys, name, CMPI_keyValue, rc) : noData(rc, status.rc);
}

CMPIData getKeyAt(const CMPIObjectPath* self, CMPICount index, CMPIString** name, CMPIStatus* rc) {
    CMPIStatus status;
    const PathContent* path = contentOf(self, &status);
    return path != nullptr ? namedValueAt(path->keys, index, name, CMPI_keyValue, rc) : noData(rc, status.rc);
}

CMPICount getKeyCount(const CMPIObjectPath* self, CMPIStatus* rc) {
    const PathContent* path = contentOf(self, rc);
    return path != nullptr ? path->keys.size : 0;
}

CMPIStatus setNameSpaceFromObjectPath(const CMPIObjectPath* self, const CMPIObjectPath* source) {
    CMPIStatus status;
    const PathContent* path = contentOf(source, &status);
    return path != nullptr ? setNameSpace(self, orEmpty(path->nameSpace)) : status;
}

CMPIStatus setHostAndNameSpaceFromObjectPath(const CMPIObjectPath* self, const CMPIObjectPath* source) {
    CMPIStatus status = setNameSpaceFromObjectPath(self, source);
    return status.rc == CMPI_RC_OK ? setHostname(self, orEmpty(contentOf(source, nullptr)->host)) : status;
}

/** Reports that qualifiers are not supported: only higher layers know the declarations of classes. */
CMPIData qualifier(const CMPIObjectPath* self, CMPIStatus* rc) {
    CMPIStatus status;
    return noData(rc, contentOf(self, &status) != nullptr ? CMPI_RC_ERR_NOT_SUPPORTED : status.rc);
}

CMPIData getClassQualifier(const CMPIObjectPath* self, const char*, CMPIStatus* rc) {
    return qualifier(self, rc);
}

CMPIData getPropertyQualifier(const CMPIObjectPath* self, const char*, const char*, CMPIStatus* rc) {
    return qualifier(self, rc);
}

CMPIData getMethodQualifier(const CMPIObjectPath* self, const char*, const char*, CMPIStatus* rc) {
    return qualifier(self, rc);
}

CMPIData getParameterQualifier(const CMPIObjectPath* self, const char*, const char*, const char*, CMPIStatus* rc) {
    return qualifier(self, rc);
}

CMPIString* toString(const CMPIObjectPath* self, CMPIStatus* rc) {
    return factoryTable.toString(nullptr, self, rc);
}

} // namespace

const CMPIObjectPathFT objectPathTable = {
    CMPIVersion200,
    release<CMPIObjectPath>,
    clone<CMPIObjectPath>,
    setNameSpace,
    getNameSpace,
    setHostname,
    getHostname,
    setClassName,
    getClassName,
    addKey,
    getKey,
    getKeyAt,
    getKeyCount,
    setNameSpaceFromObjectPath,
    setHostAndNameSpaceFromObjectPath,
    getClassQualifier,
    getPropertyQualifier,
    getMethodQualifier,
    getParameterQualifier,
    toString,
};

} // namespace ObjectManager

/* Arrays and enumerations: both consist of elements of one type. */
#include "broker/Objects.h"

namespace ObjectManager {

namespace {

CMPICount getSize(const CMPIArray* self, CMPIStatus* rc) {
    const ArrayContent* array = contentOf(self, rc);
    return array != nullptr ? array->count : 0;
}

CMPIType getSimpleType(const CMPIArray* self, CMPIStatus* rc) {
    const ArrayContent* array = contentOf(self, rc);
    return array != nullptr ? array->elementType : CMPIType{CMPI_null};
}

CMPIData getElementAt(const CMPIArray* self, CMPICount index, CMPIStatus* rc) {
    CMPIStatus status;
    const ArrayContent* array = contentOf(self, &status);
    if (array == nullptr) {
        return noData(rc, status.rc);
    }
    return index < array->count ? dataOf(array->elements[index], CMPI_goodValue, rc)
                                : noData(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

CMPIStatus setElementAt(const CMPIArray* self, CMPICount index, const CMPIValue* value, CMPIType type) {
    CMPIStatus status;
    ArrayContent* array = contentOf(self, &status);
    if (array == nullptr) {
        return status;
    }
    if (index >= array->count) {
        return statusOf(CMPI_RC_ERR_NO_SUCH_PROPERTY);
    }
    Memory& memory = *headerOf(self).memory;
    Item item;
    status.rc = readValue(memory, value, type, item);
    if (status.rc != CMPI_RC_OK) {
        return status;
    }
    // CMPI_chars and CMPI_string are not converted into each other, since some object managers do not convert them: a
    // provider that works here works with those, too.
    const CMPIType expected = array->takesChars ? CMPIType{CMPI_chars} : array->elementType;
    if (type != expected && type != CMPI_null) {
        drop(memory, item);
        return statusOf(CMPI_RC_ERR_TYPE_MISMATCH);
    }
    item.type = array->elementType;
    std::swap(array->elements[index], item);
    drop(memory, item);
    return status;
}

CMPIData getNext(const CMPIEnumeration* self, CMPIStatus* rc) {
    CMPIStatus status;
    EnumerationContent* enumeration = contentOf(self, &status);
    if (enumeration == nullptr) {
        return noData(rc, status.rc);
    }
    if (enumeration->next == enumeration->elements.count) {
        return noData(rc, CMPI_RC_ERR_NOT_FOUND);
    }
    return dataOf(enumeration->elements.elements[enumeration->next++], CMPI_goodValue, rc);
}

CMPIBoolean hasNext(const CMPIEnumeration* self, CMPIStatus* rc) {
    const EnumerationContent* enumeration = contentOf(self, rc);
    return enumeration != nullptr && enumeration->next < enumeration->elements.count ? 1 : 0;
}

/** Returns all elements, including those that getNext has already returned. */
CMPIArray* toArray(const CMPIEnumeration* self, CMPIStatus* rc) {
    const EnumerationContent* enumeration = contentOf(self, rc);
    return enumeration != nullptr ? returnedCopy<CMPIArray>(enumeration->elements, rc) : nullptr;
}

} // namespace

const CMPIArrayFT arrayTable = {
    CMPIVersion200, release<CMPIArray>, clone<CMPIArray>, getSize, getSimpleType, getElementAt, setElementAt,
};

const CMPIEnumerationFT enumerationTable = {
    CMPIVersion200, release<CMPIEnumeration>, clone<CMPIEnumeration>, getNext, hasNext, toArray,
};

} // namespace ObjectManager

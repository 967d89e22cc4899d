/**
 * Functions for the broker's objects that several operations use.
 *
 * The CMPI headers of other object managers take the same objects, but without const: so an object that is changed is
 * passed as the non-const pointer that the broker returned. A value is always passed as a whole CMPIValue, since some
 * brokers copy all of it; only a text is passed as a pointer to its characters.
 */
#ifndef BROKEROBJECTS_H
#define BROKEROBJECTS_H

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <cstring>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

/** Whether the pointer is null or its object holds nothing. CMIsNullObject of some headers checks only the pointer. */
template <typename Object>
bool isNull(const Object* object) {
    return object == nullptr || object->hdl == nullptr;
}

/** The text of a string that the broker returned; null if it returned none. */
inline const char* textOf(const CMPIString* string) {
    return isNull(string) ? nullptr : CMGetCharPtr(string);
}

/** Whether a text, which may be null, is equal to another one, letter case included. */
inline bool isText(const char* text, const char* expected) {
    return text != nullptr && std::strcmp(text, expected) == 0;
}

/** The string in a value; null if the value is of another type. */
inline CMPIString* stringOf(const CMPIData& data) {
    return data.type == CMPI_string ? data.value.string : nullptr;
}

/** Whether a value of this type is a pointer to a CMPI object, which begins with a handle and a function table. */
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
 * Makes a path of a class, without keys, with a namespace and the managed system's host name; null if the broker cannot
 * make it.
 *
 * @param nameSpace may be null if the request has none.
 */
CMPIObjectPath* newClassPath(const CMPIBroker* broker, const char* nameSpace, const char* className,
                             CMPIStatus* status);

void addKey(CMPIObjectPath* path, const char* name, const char* text);
void addKey(CMPIObjectPath* path, const char* name, const CMPIObjectPath* reference);

void setProperty(const CMPIInstance* instance, const char* name, const char* text);
void setProperty(const CMPIInstance* instance, const char* name, CMPIUint16 number);
void setProperty(const CMPIInstance* instance, const char* name, const CMPIObjectPath* reference);

/** Sets a property to an array of CMPI_uint16. */
void setProperty(const CMPIInstance* instance, const char* name, CMPIArray* array);

/** Visits the objects in order until a visit returns false. @return whether no visit did. The index has 16 bits. */
template <typename Object, typename Visit>
bool forEach(const std::vector<Object*>& objects, Visit visit) {
    const auto count = static_cast<unsigned short>(objects.size());
    for (unsigned short i = 0; i < count; ++i) {
        if (!visit(objects.at(i))) {
            return false;
        }
    }
    return true;
}

void returnAll(const CMPIResult* result, const std::vector<CMPIObjectPath*>& paths);
void returnAll(const CMPIResult* result, const std::vector<CMPIInstance*>& instances);

/**
 * Returns to `result` the first instance whose path equals the requested one (isObjPathsEqual with `flag`), if there is
 * one.
 */
void returnFirstMatch(const CMPIResult* result, const std::vector<CMPIInstance*>& instances,
                      const CMPIObjectPath* objectPath, bool flag, CMPIStatus* status);

} // namespace Norv::PowerStateManagementServiceProvider

#endif

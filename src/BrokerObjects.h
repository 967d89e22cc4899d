/**
 * What several operations do with the broker's objects.
 *
 * The headers of other object managers take the same objects as these, but not const: a path or instance that is
 * changed is handed over as what the broker made. A value is handed over as a whole CMPIValue, since some brokers copy
 * all of it, and a text as such.
 */
#ifndef BROKEROBJECTS_H
#define BROKEROBJECTS_H

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <cstring>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

/** Whether there is no object or one that holds nothing; CMIsNullObject of some headers looks at the pointer only. */
template <typename Object>
bool isNull(const Object* object) {
    return object == nullptr || object->hdl == nullptr;
}

/** The text of a string that the broker gave; null where it gave none. */
inline const char* textOf(const CMPIString* string) {
    return isNull(string) ? nullptr : CMGetCharPtr(string);
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

void addKey(CMPIObjectPath* path, const char* name, const char* text);
void addKey(CMPIObjectPath* path, const char* name, const CMPIObjectPath* reference);

void setProperty(const CMPIInstance* instance, const char* name, const char* text);
void setProperty(const CMPIInstance* instance, const char* name, CMPIUint16 number);
void setProperty(const CMPIInstance* instance, const char* name, const CMPIObjectPath* reference);

/** Sets an array of CMPI_uint16. */
void setProperty(const CMPIInstance* instance, const char* name, CMPIArray* array);

/** Visits the objects in order until a visit returns false; whether none did. Objects are counted in 16 bits. */
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

/** Returns the first of the instances whose path equals the requested one under `flag`, if there is one. */
void returnFirstMatch(const CMPIResult* result, const std::vector<CMPIInstance*>& instances,
                      const CMPIObjectPath* objectPath, bool flag, CMPIStatus* status);

} // namespace Norv::PowerStateManagementServiceProvider

#endif

/**
 * What several operations do with the broker's objects.
 */
#ifndef BROKEROBJECTS_H
#define BROKEROBJECTS_H

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <cstring>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

/** The text of a string that the broker gave; null where it gave none. */
inline const char* textOf(const CMPIString* string) {
    return CMIsNullObject(string) ? nullptr : CMGetCharPtr(string);
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

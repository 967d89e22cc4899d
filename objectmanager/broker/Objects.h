/**
 * CMPI objects: the handles that providers hold, and what all kinds of them have in common.
 *
 * The rules of every slot: an object or argument that is null gives CMPI_RC_ERR_INVALID_HANDLE or
 * CMPI_RC_ERR_INVALID_PARAMETER; so does an object that somebody else made. An object that was released gives
 * CMPI_RC_ERR_INVALID_HANDLE, and the current request learns of it. What a slot returns is an object of its own in the
 * current request, never a part of another object.
 */
#ifndef BROKER_OBJECTS_H
#define BROKER_OBJECTS_H

#include "broker/Content.h"
#include "broker/Request.h"
#include "broker/Result.h"

#include "cmpift.h"

#include <cstring>
#include <new>
#include <string>
#include <type_traits>

namespace ObjectManager {

extern const CMPIObjectPathFT objectPathTable;
extern const CMPIInstanceFT instanceTable;
extern const CMPIArgsFT argsTable;
extern const CMPIContextFT contextTable;
extern const CMPIStringFT stringTable;
extern const CMPIArrayFT arrayTable;
extern const CMPIEnumerationFT enumerationTable;
extern const CMPIDateTimeFT dateTimeTable;
extern const CMPIErrorFT errorTable;
extern const CMPIResultFT resultTable;

extern const CMPIBrokerFT upCallTable;
extern const CMPIBrokerEncFT factoryTable;
extern const CMPIBrokerExtFT operatingSystemTable;
extern const CMPIBrokerMemFT memoryTable;

/** Of a handle type: what its `hdl` points to, its function table and its name. */
template <typename Handle>
struct Kind;

template <typename ContentType, const auto& functionTable>
struct KindOf {
    using Content = ContentType;
    static constexpr const auto& table = functionTable;
};

template <>
struct Kind<CMPIObjectPath> : KindOf<PathContent, objectPathTable> {
    static constexpr const char* name = "CMPIObjectPath";
};
template <>
struct Kind<CMPIInstance> : KindOf<InstanceContent, instanceTable> {
    static constexpr const char* name = "CMPIInstance";
};
template <>
struct Kind<CMPIArgs> : KindOf<NamedItemsContent, argsTable> {
    static constexpr const char* name = "CMPIArgs";
};
template <>
struct Kind<CMPIContext> : KindOf<NamedItemsContent, contextTable> {
    static constexpr const char* name = "CMPIContext";
};
/** `hdl` is the text itself. */
template <>
struct Kind<CMPIString> : KindOf<char, stringTable> {
    static constexpr const char* name = "CMPIString";
};
template <>
struct Kind<CMPIArray> : KindOf<ArrayContent, arrayTable> {
    static constexpr const char* name = "CMPIArray";
};
template <>
struct Kind<CMPIEnumeration> : KindOf<EnumerationContent, enumerationTable> {
    static constexpr const char* name = "CMPIEnumeration";
};
template <>
struct Kind<CMPIDateTime> : KindOf<DateTimeContent, dateTimeTable> {
    static constexpr const char* name = "CMPIDateTime";
};
template <>
struct Kind<CMPIError> : KindOf<ErrorContent, errorTable> {
    static constexpr const char* name = "CMPIError";
};
/** `hdl` is the embedder's object, which is not dropped with the handle. */
template <>
struct Kind<CMPIResult> : KindOf<Result, resultTable> {
    static constexpr const char* name = "CMPIResult";
};

/** How every handle begins. */
struct ObjectHeader {
    /** Null once the object was released. */
    void* hdl;
    const void* ft;
    /** Where content lies: the request's arena, or the heap for a clone, which belongs to no request. */
    Memory* memory;
    /** The object that the request adopted before this one, or the clone buried before it. */
    ObjectHeader* previous;
};

/** The handle that providers hold, and behind it what is ours; laid out as ObjectHeader. */
template <typename Handle>
struct Shell {
    Handle handle;
    Memory* memory;
    ObjectHeader* previous;
};

template <typename Handle>
Handle* newShell(Memory& memory, void* content) {
    static_assert(sizeof(Shell<Handle>) == sizeof(ObjectHeader) && alignof(Shell<Handle>) == alignof(ObjectHeader));
    auto* shell = new (memory.allocate(sizeof(ObjectHeader), alignof(ObjectHeader)))
        Shell<Handle>{{content, &Kind<Handle>::table}, &memory, nullptr};
    return &shell->handle;
}

template <typename Handle>
ObjectHeader& headerOf(const Handle* object) {
    return *reinterpret_cast<ObjectHeader*>(const_cast<Handle*>(object));
}

inline bool isClone(const ObjectHeader& object) {
    return object.memory == std::pmr::new_delete_resource();
}

inline CMPIStatus statusOf(CMPIrc code) {
    return {code, nullptr};
}

inline void setStatus(CMPIStatus* rc, CMPIrc code) {
    if (rc != nullptr) {
        *rc = statusOf(code);
    }
}

/** Sets the code and gives null: the usual end of a slot that failed. */
inline std::nullptr_t failure(CMPIStatus* rc, CMPIrc code) {
    setStatus(rc, code);
    return nullptr;
}

/** What a slot gives back as data where there is none. */
inline CMPIData noData(CMPIStatus* rc, CMPIrc code) {
    setStatus(rc, code);
    CMPIData data{};
    data.state = CMPI_nullValue | (code == CMPI_RC_ERR_NO_SUCH_PROPERTY ? CMPI_notFound : 0);
    return data;
}

/** Tells the current request, where there is one, that the provider broke a rule. */
void reportMisuse(const std::string& what);

/** What the object holds; null, with `rc` set, where it holds nothing. Sets `rc` to CMPI_RC_OK otherwise. */
template <typename Handle>
typename Kind<Handle>::Content* contentOf(const Handle* object, CMPIStatus* rc) {
    if (object == nullptr || object->ft != &Kind<Handle>::table) {
        return failure(rc, CMPI_RC_ERR_INVALID_HANDLE);
    }
    if (object->hdl == nullptr) {
        reportMisuse(std::string("used a ") + Kind<Handle>::name + " after it was released");
        return failure(rc, CMPI_RC_ERR_INVALID_HANDLE);
    }
    setStatus(rc, CMPI_RC_OK);
    return static_cast<typename Kind<Handle>::Content*>(object->hdl);
}

/** As `contentOf`, of a path or instance that is to be changed: what a result keeps of it stays as it is. */
template <typename Handle>
typename Kind<Handle>::Content* changeableContentOf(const Handle* object, CMPIStatus* rc) {
    auto* content = contentOf(object, rc);
    if (content == nullptr || !content->returned) {
        return content;
    }
    ObjectHeader& header = headerOf(object);
    content = place(*header.memory, *content);
    header.hdl = content;
    return content;
}

/** An object of the current request that takes over `content`, which lies in the request's memory. */
template <typename Handle>
Handle* newObject(Request& request, typename Kind<Handle>::Content* content) {
    auto* object = newShell<Handle>(request.memory(), content);
    request.adopt(headerOf(object));
    return object;
}

/** An object of the current request that takes over what `content` points to. */
template <typename Handle>
Handle* newObjectOf(Request& request, const typename Kind<Handle>::Content& content) {
    using Content = typename Kind<Handle>::Content;
    return newObject<Handle>(request,
                             new (request.memory().allocate(sizeof(Content), alignof(Content))) Content(content));
}

CMPIString* newString(Request& request, std::string_view text);

/** The current request; null, with `rc` set to CMPI_RC_ERR_FAILED, where the thread has none. */
Request* requestFor(CMPIStatus* rc);

/** A new string, or null with `rc` set where the thread has no request. */
CMPIString* returnedString(const char* text, CMPIStatus* rc);

/** An object of its own with a copy of `content`, or null with `rc` set where the thread has no request. */
template <typename Handle>
Handle* returnedCopy(const typename Kind<Handle>::Content& content, CMPIStatus* rc) {
    Request* request = requestFor(rc);
    return request != nullptr ? newObject<Handle>(*request, place(request->memory(), content)) : nullptr;
}

/** Gives back what an object holds and nobody else keeps. */
template <typename Handle>
void dropContent(ObjectHeader& object) {
    auto* content = static_cast<typename Kind<Handle>::Content*>(std::exchange(object.hdl, nullptr));
    if constexpr (std::is_same_v<Handle, CMPIString>) {
        dropText(*object.memory, content);
    } else if constexpr (std::is_same_v<Handle, CMPIObjectPath> || std::is_same_v<Handle, CMPIInstance>) {
        if (!content->returned) {
            displace(*object.memory, content);
        }
    } else if constexpr (!std::is_same_v<Handle, CMPIResult>) {
        displace(*object.memory, content);
    }
}

/** Ends a clone whose content is gone: its shell goes with the current request, at once where there is none. */
void endClone(ObjectHeader& clone);
/** Ends a clone's shell. */
void deleteShell(ObjectHeader& clone);

/* The slots that are the same for every kind. */

template <typename Handle>
CMPIStatus release(Handle* object) {
    if (object == nullptr || object->ft != &Kind<Handle>::table) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    ObjectHeader& header = headerOf(object);
    if (header.hdl == nullptr) {
        reportMisuse(std::string("released a ") + Kind<Handle>::name + " twice");
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    dropContent<Handle>(header);
    if (isClone(header)) {
        endClone(header);
    }
    return statusOf(CMPI_RC_OK);
}

template <typename Handle>
Handle* clone(const Handle* object, CMPIStatus* rc) {
    const auto* content = contentOf(object, rc);
    if (content == nullptr) {
        return nullptr;
    }
    Memory& heap = *std::pmr::new_delete_resource();
    void* copied = nullptr;
    if constexpr (std::is_same_v<Handle, CMPIString>) {
        copied = copyText(heap, content);
    } else {
        copied = place(heap, *content);
    }
    return newShell<Handle>(heap, copied);
}

/** Calls `visit` with the object as what it is; whether it is a CMPI object of ours. */
template <typename Visitor>
bool visitObject(const void* object, Visitor visit) {
    struct {
        void* hdl;
        const void* ft;
    } handle{};
    if (object == nullptr) {
        return false;
    }
    std::memcpy(&handle, object, sizeof handle);
    const auto tryKind = [&]<typename Handle>(const Handle*) {
        if (handle.ft != &Kind<Handle>::table) {
            return false;
        }
        visit(static_cast<const Handle*>(object));
        return true;
    };
    return tryKind(static_cast<const CMPIString*>(nullptr)) || tryKind(static_cast<const CMPIObjectPath*>(nullptr)) ||
           tryKind(static_cast<const CMPIInstance*>(nullptr)) || tryKind(static_cast<const CMPIArray*>(nullptr)) ||
           tryKind(static_cast<const CMPIArgs*>(nullptr)) || tryKind(static_cast<const CMPIContext*>(nullptr)) ||
           tryKind(static_cast<const CMPIEnumeration*>(nullptr)) ||
           tryKind(static_cast<const CMPIDateTime*>(nullptr)) || tryKind(static_cast<const CMPIError*>(nullptr)) ||
           tryKind(static_cast<const CMPIResult*>(nullptr));
}

/* Values as they pass through the slots. */

/**
 * Reads `value` as `type` says (cmpidt.h) into an item in `memory`. A null pointer is a null value.
 *
 * CMPI_RC_ERR_INVALID_DATA_TYPE for types that cannot be kept, CMPI_RC_ERR_TYPE_MISMATCH for an array of another type,
 * CMPI_RC_ERR_INVALID_HANDLE for an object that holds nothing; `item` is untouched then.
 */
CMPIrc readValue(Memory& memory, const CMPIValue* value, CMPIType type, Item& item);

/** The value as data whose objects belong to the current request. `rc` is set. */
CMPIData dataOf(const Item& item, CMPIValueState state, CMPIStatus* rc);

/** Reads a value and puts it under `name`. */
CMPIStatus setNamedValue(Memory& memory, NamedItems& items, const char* name, const CMPIValue* value, CMPIType type);
/** The value under `name`, or CMPI_RC_ERR_NO_SUCH_PROPERTY. */
CMPIData namedValue(const NamedItems& items, const char* name, CMPIValueState state, CMPIStatus* rc);
/** The value at `index`, with its name where `name` is not null, or CMPI_RC_ERR_NO_SUCH_PROPERTY. */
CMPIData namedValueAt(const NamedItems& items, CMPICount index, CMPIString** name, CMPIValueState state,
                      CMPIStatus* rc);

/*
 * An instance's path, and the instance with it, where a path without keys takes them from the properties: those that
 * the class names as its keys, or where it is not known those of the filter's key list, if all of them are set.
 */

PathContent fullPath(Memory& memory, const InstanceContent& instance, const ClassInformation* classes);
Instance fullInstance(const InstanceContent& instance, const ClassInformation* classes);

/** A null-ended list of a provider's as values; nothing where it is null. */
PropertyList propertyListOf(const char** properties);

} // namespace ObjectManager

#endif

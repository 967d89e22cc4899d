/**
 * CMPI objects (The Open Group, C061): the handles that providers hold, and the functions that all kinds of objects
 * have in common.
 *
 * These rules hold for every slot that reports a status. If an object is null, or is not one of this object manager's
 * objects of the right kind, the slot reports CMPI_RC_ERR_INVALID_HANDLE; if another pointer is null that must not be
 * null, it reports CMPI_RC_ERR_INVALID_PARAMETER. If an object was released, the slot reports
 * CMPI_RC_ERR_INVALID_HANDLE, and the current request learns that the provider broke a rule. A slot returns an object
 * as a new one of the current request, never as a part of another object; only a clone belongs to no request.
 *
 * If the request may not have the memory for an object, the slot throws the exception of `Request::memory`, which
 * passes through the code of the provider to its caller.
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

/** What is particular to a type of handle: the content to which its `hdl` points, its function table and its name. */
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
/** `hdl` points to the characters, which a null character ends. */
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
/** `hdl` points to the Result of the operation, which is not dropped when the handle is released. */
template <>
struct Kind<CMPIResult> : KindOf<Result, resultTable> {
    static constexpr const char* name = "CMPIResult";
};

/** An object of any kind: the two members of every CMPI handle, and the members of the broker behind them. */
struct ObjectHeader {
    /** The content; null once the object was released. */
    void* hdl;
    /** The function table, which tells the kind of the object. */
    const void* ft;
    /** The memory of the object and of its content: the request's arena or, for a clone, the heap. */
    Memory* memory;
    /** The object that the request adopted before this one. For a buried clone: the clone that was buried before it. */
    ObjectHeader* previous;
};

/** An object of one kind: the handle that providers hold, and the broker's members. It has ObjectHeader's layout. */
template <typename Handle>
struct Shell {
    Handle handle;
    Memory* memory;
    ObjectHeader* previous;
};

/** Makes an object in `memory`. It takes over `content`, which lies in the same memory. */
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

/** Sets the code, and returns null, as a slot does that fails to return an object. `rc` may be null. */
inline std::nullptr_t failure(CMPIStatus* rc, CMPIrc code) {
    setStatus(rc, code);
    return nullptr;
}

/** Sets the code, and returns the data that a slot returns if it has no value. `rc` may be null. */
inline CMPIData noData(CMPIStatus* rc, CMPIrc code) {
    setStatus(rc, code);
    CMPIData data{};
    data.state = CMPI_nullValue | (code == CMPI_RC_ERR_NO_SUCH_PROPERTY ? CMPI_notFound : 0);
    return data;
}

/** Reports a breach of the rules by a provider to the current request, if the thread has one (`Request::misuse`). */
void reportMisuse(const std::string& what);

/**
 * The content of an object.
 *
 * @param rc is set to CMPI_RC_OK or, if there is no content, to CMPI_RC_ERR_INVALID_HANDLE; may be null.
 * @return null if the object is null, is of another kind, or was released.
 */
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

/**
 * Does what `contentOf` does, for a path or instance that is going to be changed. If a result keeps the content, the
 * object gets a copy of it first, so that the result does not change.
 */
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

/** Makes an object of the request. It takes over `content`, which must lie in the request's memory. */
template <typename Handle>
Handle* newObject(Request& request, typename Kind<Handle>::Content* content) {
    auto* object = newShell<Handle>(request.memory(), content);
    request.adopt(headerOf(object));
    return object;
}

/** Makes an object of the request. It takes over the parts of `content`, which must lie in the request's memory. */
template <typename Handle>
Handle* newObjectOf(Request& request, const typename Kind<Handle>::Content& content) {
    using Content = typename Kind<Handle>::Content;
    return newObject<Handle>(request,
                             new (request.memory().allocate(sizeof(Content), alignof(Content))) Content(content));
}

/** Makes a string of the request with a copy of `text`. */
CMPIString* newString(Request& request, std::string_view text);

/** The current request. @return null if the thread has none; `rc` is set to CMPI_RC_ERR_FAILED unless it is null. */
Request* requestFor(CMPIStatus* rc);

/** Makes a string of the current request; a null text counts as an empty one. Without a request, see `requestFor`. */
CMPIString* returnedString(const char* text, CMPIStatus* rc);

/** Makes an object of the current request with a copy of `content`. Without a request, see `requestFor`. */
template <typename Handle>
Handle* returnedCopy(const typename Kind<Handle>::Content& content, CMPIStatus* rc) {
    Request* request = requestFor(rc);
    return request != nullptr ? newObject<Handle>(*request, place(request->memory(), content)) : nullptr;
}

/** Takes the content from an object, and gives the content back unless a result keeps it. */
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

/**
 * Ends a clone whose content was given back. Its shell stays until the current request ends; if there is none, the
 * shell is deleted at once.
 */
void endClone(ObjectHeader& clone);
/** Gives back the memory of a clone's shell. */
void deleteShell(ObjectHeader& clone);

/* These slots are the same for every kind of object. */

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

/** Calls `visit` with the object as a handle of its type. @return false if it is not one of this broker's objects. */
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

/* These convert the values that pass through the slots. */

/**
 * Copies a provider's value into an item.
 *
 * @param memory gets the parts of the item.
 * @param value,type are in the form of CMPI: for CMPI_chars, the pointer is the text itself; a null pointer is a null
 *        value.
 * @param item does not change if the value cannot be read. The content that it had is not dropped.
 * @return CMPI_RC_OK; CMPI_RC_ERR_INVALID_DATA_TYPE if the type is none of those that `Value` (Model.h) can have;
 *         CMPI_RC_ERR_TYPE_MISMATCH if the array is of another type; CMPI_RC_ERR_INVALID_HANDLE if the object has no
 *         content.
 */
CMPIrc readValue(Memory& memory, const CMPIValue* value, CMPIType type, Item& item);

/**
 * The value in the form of CMPI; its object, if it has one, is a new one of the current request.
 *
 * @param state the value's state; CMPI_nullValue is added to it if the value is null.
 * @param rc is set to CMPI_RC_OK or, if the value needs an object and the thread has no request, to CMPI_RC_ERR_FAILED;
 *        may be null.
 */
CMPIData dataOf(const Item& item, CMPIValueState state, CMPIStatus* rc);

/**
 * Reads a value as `readValue` does, and stores it under `name`.
 *
 * @return the code of `readValue`; CMPI_RC_ERR_INVALID_PARAMETER if `name` is null.
 */
CMPIStatus setNamedValue(Memory& memory, NamedItems& items, const char* name, const CMPIValue* value, CMPIType type);
/**
 * The value called `name`, as `dataOf` gives it. If there is none, `rc` is set to CMPI_RC_ERR_NO_SUCH_PROPERTY; if
 * `name` is null, to CMPI_RC_ERR_INVALID_PARAMETER.
 */
CMPIData namedValue(const NamedItems& items, const char* name, CMPIValueState state, CMPIStatus* rc);
/**
 * The value at `index`, as `dataOf` gives it. Its name is stored in `name`, unless that is null. If there is no such
 * value, `rc` is set to CMPI_RC_ERR_NO_SUCH_PROPERTY.
 */
CMPIData namedValueAt(const NamedItems& items, CMPICount index, CMPIString** name, CMPIValueState state,
                      CMPIStatus* rc);

/*
 * The full path of an instance, and the instance with its full path. A path without keys gets them from the properties
 * of the instance: from the properties that the class declares as keys or, if no keys of the class are known, from
 * those in the key list of setPropertyFilter. If one of these properties is not set, the path stays without keys.
 */

/** @param classes may be null. @return a path in `memory`, which the caller owns. */
PathContent fullPath(Memory& memory, const InstanceContent& instance, const ClassInformation* classes);
/** @param classes may be null. */
Instance fullInstance(const InstanceContent& instance, const ClassInformation* classes);

/** The names in a provider's list, which a null pointer ends; no value if the list itself is null. */
PropertyList propertyListOf(const char** properties);

} // namespace ObjectManager

#endif

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

#include "broker/Request.h"
#include "broker/Result.h"
#include "model/Model.h"

#include "cmpift.h"

#include <cstring>
#include <memory_resource>
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

using Memory = std::pmr::memory_resource;

/* What handles hold beside model values. All of it lies in the memory of the handle. */

using Names = std::pmr::vector<Text>;

struct InstanceContent {
    using allocator_type = Allocator;

    Instance instance;
    /** The key list and the property list of the filter; the latter holds where `filtered` is set. */
    Names keyNames;
    Names wanted;
    bool filtered = false;

    InstanceContent(const Instance& given, Allocator allocator)
        : instance(given, allocator), keyNames(allocator), wanted(allocator) {}
    /** An instance without properties. */
    InstanceContent(const ObjectPath& path, Allocator allocator)
        : instance(allocator), keyNames(allocator), wanted(allocator) {
        instance.path = ObjectPath(path, allocator);
    }
    InstanceContent(const InstanceContent& other, Allocator allocator)
        : instance(other.instance, allocator), keyNames(other.keyNames, allocator), wanted(other.wanted, allocator),
          filtered(other.filtered) {}
};

struct ArrayContent {
    using allocator_type = Allocator;

    /** Without CMPI_ARRAY. */
    CMPIType elementType;
    Value::Array elements;
    /** Whether it was made for CMPI_chars: its elements, which are strings then, have to be handed over as such. */
    bool takesChars = false;

    ArrayContent(CMPIType type, Allocator allocator) : elementType(type), elements(allocator) {}
    ArrayContent(CMPIType type, const Value::Array& given, Allocator allocator)
        : elementType(type), elements(given, allocator) {}
    ArrayContent(const ArrayContent& other, Allocator allocator)
        : elementType(other.elementType), elements(other.elements, allocator), takesChars(other.takesChars) {}
};

struct EnumerationContent : ArrayContent {
    using ArrayContent::ArrayContent;
    EnumerationContent(const EnumerationContent& other, Allocator allocator)
        : ArrayContent(other, allocator), next(other.next) {}

    std::size_t next = 0;
};

struct ErrorCodes {
    CMPIErrorType type = UnknownErrorType;
    CMPIErrorSeverity severity = ErrorSevUnknown;
    CMPIErrorProbableCause probableCause = ErrorProbCauseUnknown;
    CMPIErrorSrcFormat sourceFormat = CIMErrorSrcFormatUnknown;
    CMPIrc code = CMPI_RC_OK;
};

struct ErrorContent : ErrorCodes {
    using allocator_type = Allocator;

    enum TextOf {
        otherType,
        owningEntity,
        messageId,
        message,
        probableCauseDescription,
        source,
        otherSourceFormat,
        codeDescription,
        textCount,
    };

    Names texts;
    /* Of strings. */
    ArrayContent recommendedActions;
    ArrayContent messageArguments;

    ErrorContent(const ErrorCodes& codes, Allocator allocator)
        : ErrorCodes(codes), texts(textCount, allocator), recommendedActions(CMPI_string, allocator),
          messageArguments(CMPI_string, allocator) {}
    ErrorContent(const ErrorContent& other, Allocator allocator)
        : ErrorCodes(other), texts(other.texts, allocator), recommendedActions(other.recommendedActions, allocator),
          messageArguments(other.messageArguments, allocator) {}
};

/** Makes an object in a block of its own. */
template <typename T, typename... Arguments>
T* place(Memory& memory, Arguments&&... arguments) {
    return Allocator(&memory).new_object<T>(std::forward<Arguments>(arguments)...);
}

inline const char* orEmpty(const char* text) {
    return text != nullptr ? text : "";
}

/** The text up to its first null character, with one at the end. */
char* copyText(Memory& memory, std::string_view text);
void dropText(Memory& memory, char* text);

/** Of a handle type: what its `hdl` points to, its function table and its name. */
template <typename Handle>
struct Kind;

template <typename ContentType, const auto& functionTable>
struct KindOf {
    using Content = ContentType;
    static constexpr const auto& table = functionTable;
};

template <>
struct Kind<CMPIObjectPath> : KindOf<ObjectPath, objectPathTable> {
    static constexpr const char* name = "CMPIObjectPath";
};
template <>
struct Kind<CMPIInstance> : KindOf<InstanceContent, instanceTable> {
    static constexpr const char* name = "CMPIInstance";
};
template <>
struct Kind<CMPIArgs> : KindOf<NamedValues, argsTable> {
    static constexpr const char* name = "CMPIArgs";
};
template <>
struct Kind<CMPIContext> : KindOf<NamedValues, contextTable> {
    static constexpr const char* name = "CMPIContext";
};
/** `hdl` is the text itself: in the headers that many providers are compiled with, CMGetCharPtr reads it there. */
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
struct Kind<CMPIDateTime> : KindOf<Text, dateTimeTable> {
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
    /** Whether a result keeps the content, which nobody may change any more. */
    bool returned;
};

/** The handle that providers hold, and behind it what is ours; laid out as ObjectHeader. */
template <typename Handle>
struct Shell {
    Handle handle;
    Memory* memory;
    ObjectHeader* previous;
    bool returned;
};

template <typename Handle>
Handle* newShell(Memory& memory, void* content) {
    static_assert(sizeof(Shell<Handle>) == sizeof(ObjectHeader) && alignof(Shell<Handle>) == alignof(ObjectHeader));
    auto* shell = new (memory.allocate(sizeof(ObjectHeader), alignof(ObjectHeader)))
        Shell<Handle>{{content, &Kind<Handle>::table}, &memory, nullptr, false};
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
    if (content == nullptr || !headerOf(object).returned) {
        return content;
    }
    ObjectHeader& header = headerOf(object);
    content = place<typename Kind<Handle>::Content>(*header.memory, *content);
    header.hdl = content;
    header.returned = false;
    return content;
}

/** An object of the current request that holds `content`, which lies in the request's memory or is a Result. */
template <typename Handle>
Handle* adopted(Request& request, typename Kind<Handle>::Content* content) {
    auto* object = newShell<Handle>(request.memory(), content);
    request.adopt(headerOf(object));
    return object;
}

/** An object of the current request; what it holds is made of `arguments` in the request's memory. */
template <typename Handle, typename... Arguments>
Handle* newObject(Request& request, Arguments&&... arguments) {
    return adopted<Handle>(
        request, place<typename Kind<Handle>::Content>(request.memory(), std::forward<Arguments>(arguments)...));
}

CMPIString* newString(Request& request, std::string_view text);

/** The current request; null, with `rc` set to CMPI_RC_ERR_FAILED, where the thread has none. */
Request* requestFor(CMPIStatus* rc);

/** A new string, or null with `rc` set where the thread has no request. */
CMPIString* returnedString(std::string_view text, CMPIStatus* rc);

/** An object of its own with a copy of `content`, or null with `rc` set where the thread has no request. */
template <typename Handle>
Handle* returnedCopy(const typename Kind<Handle>::Content& content, CMPIStatus* rc) {
    Request* request = requestFor(rc);
    return request != nullptr ? newObject<Handle>(*request, content) : nullptr;
}

/** Gives back what an object holds and nobody else keeps. */
template <typename Handle>
void dropContent(ObjectHeader& object) {
    auto* content = static_cast<typename Kind<Handle>::Content*>(std::exchange(object.hdl, nullptr));
    if constexpr (std::is_same_v<Handle, CMPIString>) {
        dropText(*object.memory, content);
    } else if constexpr (!std::is_same_v<Handle, CMPIResult>) {
        if (!object.returned) {
            Allocator(object.memory).delete_object(content);
        }
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
    if constexpr (std::is_same_v<Handle, CMPIString>) {
        return newShell<Handle>(heap, copyText(heap, content));
    } else {
        return newShell<Handle>(heap, place<typename Kind<Handle>::Content>(heap, *content));
    }
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

/** Whether values of this type stand in a CMPIValue themselves. */
bool isScalar(CMPIType type);

/**
 * Reads `given` as `type` says (cmpidt.h) into a value in the memory of `allocator`. A null pointer is a null value.
 *
 * CMPI_RC_ERR_INVALID_DATA_TYPE for types that cannot be kept, CMPI_RC_ERR_TYPE_MISMATCH for an array of another type,
 * CMPI_RC_ERR_INVALID_HANDLE for an object that holds nothing; `value` is untouched then.
 */
CMPIrc readValue(Allocator allocator, const CMPIValue* given, CMPIType type, Value& value);

/** The value as data whose objects belong to the current request. `rc` is set. */
CMPIData dataOf(const Value& value, CMPIValueState state, CMPIStatus* rc);

/** Puts a value under `name`, in place of the one that has the name. A value from other memory is copied. */
void setValue(NamedValues& values, std::string_view name, Value&& value);

/** Reads a value and puts it under `name`. */
CMPIStatus setNamedValue(NamedValues& values, const char* name, const CMPIValue* given, CMPIType type);
/** The value under `name`, or CMPI_RC_ERR_NO_SUCH_PROPERTY. */
CMPIData namedValue(const NamedValues& values, const char* name, CMPIValueState state, CMPIStatus* rc);
/** The value at `index`, with its name where `name` is not null, or CMPI_RC_ERR_NO_SUCH_PROPERTY. */
CMPIData namedValueAt(const NamedValues& values, CMPICount index, CMPIString** name, CMPIValueState state,
                      CMPIStatus* rc);

/**
 * Gives `path`, which is the instance's or a copy of it, the keys that it lacks: a path without keys takes them from
 * the properties, those that the class names as its keys, or where it is not known those of the filter's key list, if
 * all of them are set.
 */
void completePath(ObjectPath& path, const InstanceContent& instance, const ClassInformation* classes);

/** A null-ended list of a provider's as values; nothing where it is null. */
PropertyList propertyListOf(const char** properties);

} // namespace ObjectManager

#endif

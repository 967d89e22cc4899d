/**
 * What CMPI objects hold. Everything is plain data in a memory of its owner: an object's content is copied in, shared
 * with no other object, and either dropped piece by piece or left to its memory's end.
 */
#ifndef BROKER_CONTENT_H
#define BROKER_CONTENT_H

#include "model/Model.h"

#include <algorithm>
#include <cstdint>
#include <memory>
#include <memory_resource>
#include <string_view>
#include <utility>

namespace ObjectManager {

using Memory = std::pmr::memory_resource;

/** Ends with a null character; where nothing was set yet, the pointer is null and the text is empty. */
using Text = char*;

inline const char* orEmpty(const char* text) {
    return text != nullptr ? text : "";
}

/** A null character ends the text. */
Text copyText(Memory& memory, std::string_view text);
void dropText(Memory& memory, Text text);
/** Puts a copy of `text` in place of what `target` held. */
void assignText(Memory& memory, Text& target, std::string_view text);

/** A growing array. */
template <typename T>
struct List {
    T* items = nullptr;
    std::uint32_t size = 0;
    std::uint32_t capacity = 0;

    const T* begin() const { return items; }
    const T* end() const { return items + size; }
    T* begin() { return items; }
    T* end() { return items + size; }

    void reserve(Memory& memory, std::uint32_t wanted) {
        if (wanted <= capacity) {
            return;
        }
        T* grown = static_cast<T*>(memory.allocate(wanted * sizeof(T), alignof(T)));
        std::uninitialized_copy(begin(), end(), grown);
        dropStorage(memory);
        items = grown;
        capacity = wanted;
    }

    void append(Memory& memory, const T& item) {
        if (size == capacity) {
            reserve(memory, std::max<std::uint32_t>(4, capacity * 2));
        }
        new (items + size) T(item);
        ++size;
    }

    /** Gives back the array, not what its elements point to. */
    void dropStorage(Memory& memory) {
        if (items != nullptr) {
            memory.deallocate(items, capacity * sizeof(T), alignof(T));
        }
    }
};

struct PathContent;
struct InstanceContent;
struct Item;

/** A value as `Value` in Model.h describes it. */
struct Item {
    CMPIType type = CMPI_null;
    bool null = true;
    /** How many elements there are, where the value is an array. */
    std::uint32_t count = 0;
    union Content {
        /** A scalar, at the address of the CMPIValue member of its type. */
        CMPIUint64 scalar = 0;
        /** Of a string or a datetime. */
        Text text;
        PathContent* path;
        InstanceContent* instance;
        Item* elements;
    } content;
};

struct NamedItem {
    Text name = nullptr;
    Item item;
};

using NamedItems = List<NamedItem>;

struct PathContent {
    Text host = nullptr;
    Text nameSpace = nullptr;
    Text className = nullptr;
    NamedItems keys;
    /** Kept by a result, which nobody may change any more. */
    bool returned = false;
};

struct InstanceContent {
    PathContent path;
    NamedItems properties;
    /** The key list and the property list of the filter; the latter holds where `filtered` is set. */
    List<Text> keyNames;
    List<Text> wanted;
    bool filtered = false;
    /** As in PathContent. */
    bool returned = false;
};

/** Arguments, or the entries of a context. */
struct NamedItemsContent {
    NamedItems items;
};

struct ArrayContent {
    /** Without CMPI_ARRAY. */
    CMPIType elementType = CMPI_null;
    std::uint32_t count = 0;
    Item* elements = nullptr;
    /** Whether it was made for CMPI_chars: its elements, which are strings then, have to be handed over as such. */
    bool takesChars = false;
};

struct EnumerationContent {
    ArrayContent elements;
    std::uint32_t next = 0;
};

struct DateTimeContent {
    Text text = nullptr;
};

struct ErrorContent {
    CMPIErrorType type = UnknownErrorType;
    CMPIErrorSeverity severity = ErrorSevUnknown;
    CMPIErrorProbableCause probableCause = ErrorProbCauseUnknown;
    CMPIErrorSrcFormat sourceFormat = CIMErrorSrcFormatUnknown;
    CMPIrc code = CMPI_RC_OK;
    Text otherType = nullptr;
    Text owningEntity = nullptr;
    Text messageId = nullptr;
    Text message = nullptr;
    Text probableCauseDescription = nullptr;
    Text source = nullptr;
    Text otherSourceFormat = nullptr;
    Text codeDescription = nullptr;
    ArrayContent recommendedActions;
    ArrayContent messageArguments;
};

/** The size of the CMPIValue member of a scalar type; 0 where the type is none. */
std::size_t scalarSize(CMPIType type);

/** Letter case is ignored. */
NamedItem* findItem(const NamedItems& items, std::string_view name);
/** Takes over `item`, in place of what stands under this name. */
void setItem(Memory& memory, NamedItems& items, std::string_view name, const Item& item);

/** Null items of an array. */
Item* newElements(Memory& memory, std::uint32_t count);

/* Copies into a memory, and what gives them back to it. Items go without CMPIValue's other pointers. */

Item copy(Memory& memory, const Item& item);
PathContent copy(Memory& memory, const PathContent& path);
InstanceContent copy(Memory& memory, const InstanceContent& instance);
NamedItemsContent copy(Memory& memory, const NamedItemsContent& items);
ArrayContent copy(Memory& memory, const ArrayContent& array);
EnumerationContent copy(Memory& memory, const EnumerationContent& enumeration);
DateTimeContent copy(Memory& memory, const DateTimeContent& dateTime);
ErrorContent copy(Memory& memory, const ErrorContent& error);
void drop(Memory& memory, Item& item);
void drop(Memory& memory, PathContent& path);
void drop(Memory& memory, InstanceContent& instance);
void drop(Memory& memory, NamedItemsContent& items);
void drop(Memory& memory, ArrayContent& array);
void drop(Memory& memory, EnumerationContent& enumeration);
void drop(Memory& memory, DateTimeContent& dateTime);
void drop(Memory& memory, ErrorContent& error);

/** A copy of `content` in a block of its own. */
template <typename T>
T* place(Memory& memory, const T& content) {
    return new (memory.allocate(sizeof(T), alignof(T))) T(copy(memory, content));
}

/** Drops `content` and its block. */
template <typename T>
void displace(Memory& memory, T* content) {
    drop(memory, *content);
    memory.deallocate(content, sizeof(T), alignof(T));
}

/* To and from values. */

Item fromModel(Memory& memory, const Value& value);
PathContent fromModel(Memory& memory, const ObjectPath& path);
InstanceContent fromModel(Memory& memory, const Instance& instance);
NamedItems fromModel(Memory& memory, const std::vector<NamedValue>& values);
Value toModel(const Item& item);
ObjectPath toModel(const PathContent& path);
Instance toModel(const InstanceContent& instance);
std::vector<NamedValue> toModel(const NamedItems& items);

} // namespace ObjectManager

#endif

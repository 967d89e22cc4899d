/**
 * The contents of CMPI objects: plain data without destructors, in a memory resource that the owner chooses. A content
 * is a copy of the data that it was made from, and no two objects share one. Its owner either drops it, which gives its
 * memory back at once, or leaves it to the end of the memory resource.
 *
 * A function that allocates throws what the memory resource throws: std::bad_alloc, or what a MemoryMeter throws.
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

/** A text that ends with a null character. Null if no text was set: it counts as an empty text then. */
using Text = char*;

inline const char* orEmpty(const char* text) {
    return text != nullptr ? text : "";
}

/** A copy of `text` up to its first null character. The caller owns the copy. */
Text copyText(Memory& memory, std::string_view text);
/** Gives back a text that `copyText` made in `memory`; null is permitted. */
void dropText(Memory& memory, Text text);
/** Replaces the text `target`, which lies in `memory`, by a copy of `text`. */
void assignText(Memory& memory, Text& target, std::string_view text);

/** A growing array in a memory resource. It has no destructor, and copies of a list share its elements. */
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

    /** Gives back the memory of the array, but not the data to which its elements point. */
    void dropStorage(Memory& memory) {
        if (items != nullptr) {
            memory.deallocate(items, capacity * sizeof(T), alignof(T));
        }
    }
};

struct PathContent;
struct InstanceContent;
struct Item;

/** The same as a `Value` of Model.h, but as plain data. */
struct Item {
    CMPIType type = CMPI_null;
    bool null = true;
    /** The number of elements if the value is an array. */
    std::uint32_t count = 0;
    union Content {
        /** A scalar: its bytes lie where CMPIValue has the member of the type. */
        CMPIUint64 scalar = 0;
        /** The characters of a string or of a datetime. */
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
    /** Whether a result keeps this content: it must not be changed then. */
    bool returned = false;
};

struct InstanceContent {
    PathContent path;
    NamedItems properties;
    /** The names of keys that the provider gave to setPropertyFilter. */
    List<Text> keyNames;
    /** The names of properties that the provider gave to setPropertyFilter; they restrict it if `filtered` is set. */
    List<Text> wanted;
    bool filtered = false;
    /** Whether a result keeps this content: it must not be changed then. */
    bool returned = false;
};

/** The arguments of a method, or the entries of a context. */
struct NamedItemsContent {
    NamedItems items;
};

struct ArrayContent {
    /** The type of each element; it does not include CMPI_ARRAY. */
    CMPIType elementType = CMPI_null;
    std::uint32_t count = 0;
    Item* elements = nullptr;
    /** Whether the array was made for the type CMPI_chars: its elements are strings, but are set with this type. */
    bool takesChars = false;
};

struct EnumerationContent {
    ArrayContent elements;
    /** The index of the element that getNext returns next. */
    std::uint32_t next = 0;
};

struct DateTimeContent {
    /** The 25 characters of DSP0004. */
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

/** The size in bytes of the CMPIValue member of a scalar type; 0 if the type is not a scalar one. */
std::size_t scalarSize(CMPIType type);

/** The item called `name`, letter case ignored; null if there is none. */
NamedItem* findItem(const NamedItems& items, std::string_view name);
/** Stores `item`, which the list takes over, under `name`. An item that had this name is dropped. */
void setItem(Memory& memory, NamedItems& items, std::string_view name, const Item& item);

/** Makes the elements of an array: `count` items, all null; a null pointer if `count` is 0. */
Item* newElements(Memory& memory, std::uint32_t count);

/*
 * `copy` returns a copy in `memory` with copies of all parts; the caller owns it, and it is not marked as returned.
 * `drop` gives the parts of a content back to the memory in which they lie.
 */

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

/** A copy of `content` in a new block of `memory`. The caller owns both. */
template <typename T>
T* place(Memory& memory, const T& content) {
    return new (memory.allocate(sizeof(T), alignof(T))) T(copy(memory, content));
}

/** Drops `content`, and gives back the block that `place` made for it. */
template <typename T>
void displace(Memory& memory, T* content) {
    drop(memory, *content);
    memory.deallocate(content, sizeof(T), alignof(T));
}

/* Conversions of values into contents in `memory`, which the caller owns, and of contents into values. */

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

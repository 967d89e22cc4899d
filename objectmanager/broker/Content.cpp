#include "broker/Content.h"

#include <cstring>

namespace ObjectManager {

namespace {

template <typename T>
T scalarOf(const Item& item) {
    T value{};
    std::memcpy(&value, &item.content.scalar, sizeof value);
    return value;
}

template <typename T>
Item scalarItem(CMPIType type, T value) {
    Item item{type, false, 0, {}};
    std::memcpy(&item.content.scalar, &value, sizeof value);
    return item;
}

Item unsignedItem(CMPIType type, std::uint64_t value) {
    switch (type) {
    case CMPI_uint8:
        return scalarItem(type, static_cast<CMPIUint8>(value));
    case CMPI_uint16:
        return scalarItem(type, static_cast<CMPIUint16>(value));
    case CMPI_uint32:
        return scalarItem(type, static_cast<CMPIUint32>(value));
    default:
        return scalarItem(type, static_cast<CMPIUint64>(value));
    }
}

Item signedItem(CMPIType type, std::int64_t value) {
    switch (type) {
    case CMPI_sint8:
        return scalarItem(type, static_cast<CMPISint8>(value));
    case CMPI_sint16:
        return scalarItem(type, static_cast<CMPISint16>(value));
    case CMPI_sint32:
        return scalarItem(type, static_cast<CMPISint32>(value));
    default:
        return scalarItem(type, static_cast<CMPISint64>(value));
    }
}

void dropElements(Memory& memory, Item* elements, std::uint32_t count) {
    if (elements == nullptr) {
        return;
    }
    for (std::uint32_t i = 0; i < count; ++i) {
        drop(memory, elements[i]);
    }
    memory.deallocate(elements, count * sizeof(Item), alignof(Item));
}

Item* copyElements(Memory& memory, const Item* elements, std::uint32_t count) {
    Item* copies = newElements(memory, count);
    std::transform(elements, elements + count, copies, [&](const Item& item) { return copy(memory, item); });
    return copies;
}

NamedItems copyItems(Memory& memory, const NamedItems& items) {
    NamedItems copies;
    copies.reserve(memory, items.size);
    for (const NamedItem& item : items) {
        copies.append(memory, {copyText(memory, item.name), copy(memory, item.item)});
    }
    return copies;
}

void dropItems(Memory& memory, NamedItems& items) {
    for (NamedItem& item : items) {
        dropText(memory, item.name);
        drop(memory, item.item);
    }
    items.dropStorage(memory);
}

List<Text> copyTexts(Memory& memory, const List<Text>& texts) {
    List<Text> copies;
    copies.reserve(memory, texts.size);
    for (Text text : texts) {
        copies.append(memory, copyText(memory, text));
    }
    return copies;
}

Text copyOrNull(Memory& memory, const char* text) {
    return text != nullptr ? copyText(memory, text) : nullptr;
}

} // namespace

Text copyText(Memory& memory, std::string_view text) {
    text = text.substr(0, text.find('\0'));
    Text copy = static_cast<Text>(memory.allocate(text.size() + 1, 1));
    *std::copy(text.begin(), text.end(), copy) = '\0';
    return copy;
}

void dropText(Memory& memory, Text text) {
    if (text != nullptr) {
        memory.deallocate(text, std::strlen(text) + 1, 1);
    }
}

void assignText(Memory& memory, Text& target, std::string_view text) {
    Text replaced = std::exchange(target, copyText(memory, text));
    dropText(memory, replaced);
}

std::size_t scalarSize(CMPIType type) {
    switch (type) {
    case CMPI_boolean:
    case CMPI_uint8:
    case CMPI_sint8:
        return 1;
    case CMPI_char16:
    case CMPI_uint16:
    case CMPI_sint16:
        return 2;
    case CMPI_uint32:
    case CMPI_sint32:
    case CMPI_real32:
        return 4;
    case CMPI_uint64:
    case CMPI_sint64:
    case CMPI_real64:
        return 8;
    default:
        return 0;
    }
}

NamedItem* findItem(const NamedItems& items, std::string_view name) {
    for (std::uint32_t i = 0; i < items.size; ++i) {
        if (equalNames(items.items[i].name, name)) {
            return items.items + i;
        }
    }
    return nullptr;
}

void setItem(Memory& memory, NamedItems& items, std::string_view name, const Item& item) {
    if (NamedItem* present = findItem(items, name); present != nullptr) {
        Item replaced = std::exchange(present->item, item);
        drop(memory, replaced);
    } else {
        items.append(memory, {copyText(memory, name), item});
    }
}

Item* newElements(Memory& memory, std::uint32_t count) {
    if (count == 0) {
        return nullptr;
    }
    auto* elements = static_cast<Item*>(memory.allocate(count * sizeof(Item), alignof(Item)));
    std::uninitialized_fill_n(elements, count, Item{});
    return elements;
}

Item copy(Memory& memory, const Item& item) {
    Item copied = item;
    if (item.null) {
        return copied;
    }
    if ((item.type & CMPI_ARRAY) != 0) {
        copied.content.elements = copyElements(memory, item.content.elements, item.count);
    } else if (item.type == CMPI_string || item.type == CMPI_dateTime) {
        copied.content.text = copyText(memory, item.content.text);
    } else if (item.type == CMPI_ref) {
        copied.content.path = place(memory, *item.content.path);
    } else if (item.type == CMPI_instance) {
        copied.content.instance = place(memory, *item.content.instance);
    }
    return copied;
}

PathContent copy(Memory& memory, const PathContent& path) {
    return {copyOrNull(memory, path.host), copyOrNull(memory, path.nameSpace), copyOrNull(memory, path.className),
            copyItems(memory, path.keys), false};
}

InstanceContent copy(Memory& memory, const InstanceContent& instance) {
    return {copy(memory, instance.path),
            copyItems(memory, instance.properties),
            copyTexts(memory, instance.keyNames),
            copyTexts(memory, instance.wanted),
            instance.filtered,
            false};
}

NamedItemsContent copy(Memory& memory, const NamedItemsContent& items) {
    return {copyItems(memory, items.items)};
}

ArrayContent copy(Memory& memory, const ArrayContent& array) {
    return {array.elementType, array.count, copyElements(memory, array.elements, array.count), array.takesChars};
}

EnumerationContent copy(Memory& memory, const EnumerationContent& enumeration) {
    return {copy(memory, enumeration.elements), enumeration.next};
}

DateTimeContent copy(Memory& memory, const DateTimeContent& dateTime) {
    return {copyText(memory, dateTime.text)};
}

ErrorContent copy(Memory& memory, const ErrorContent& error) {
    ErrorContent copied = error;
    for (Text* text :
         {&copied.otherType, &copied.owningEntity, &copied.messageId, &copied.message, &copied.probableCauseDescription,
          &copied.source, &copied.otherSourceFormat, &copied.codeDescription}) {
        *text = copyOrNull(memory, *text);
    }
    copied.recommendedActions = copy(memory, error.recommendedActions);
    copied.messageArguments = copy(memory, error.messageArguments);
    return copied;
}

void drop(Memory& memory, Item& item) {
    if (item.null) {
        return;
    }
    if ((item.type & CMPI_ARRAY) != 0) {
        dropElements(memory, item.content.elements, item.count);
    } else if (item.type == CMPI_string || item.type == CMPI_dateTime) {
        dropText(memory, item.content.text);
    } else if (item.type == CMPI_ref) {
        displace(memory, item.content.path);
    } else if (item.type == CMPI_instance) {
        displace(memory, item.content.instance);
    }
}

void drop(Memory& memory, PathContent& path) {
    dropText(memory, path.host);
    dropText(memory, path.nameSpace);
    dropText(memory, path.className);
    dropItems(memory, path.keys);
}

void drop(Memory& memory, InstanceContent& instance) {
    drop(memory, instance.path);
    dropItems(memory, instance.properties);
    for (List<Text>* texts : {&instance.keyNames, &instance.wanted}) {
        for (Text text : *texts) {
            dropText(memory, text);
        }
        texts->dropStorage(memory);
    }
}

void drop(Memory& memory, NamedItemsContent& items) {
    dropItems(memory, items.items);
}

void drop(Memory& memory, ArrayContent& array) {
    dropElements(memory, array.elements, array.count);
}

void drop(Memory& memory, EnumerationContent& enumeration) {
    drop(memory, enumeration.elements);
}

void drop(Memory& memory, DateTimeContent& dateTime) {
    dropText(memory, dateTime.text);
}

void drop(Memory& memory, ErrorContent& error) {
    for (Text text : {error.otherType, error.owningEntity, error.messageId, error.message,
                      error.probableCauseDescription, error.source, error.otherSourceFormat, error.codeDescription}) {
        dropText(memory, text);
    }
    drop(memory, error.recommendedActions);
    drop(memory, error.messageArguments);
}

Item fromModel(Memory& memory, const Value& value) {
    Item item{value.type, false, 0, {}};
    struct Visitor {
        Memory& memory;
        Item& item;

        void operator()(std::monostate) const { item.null = true; }
        void operator()(bool content) const { item = scalarItem(item.type, static_cast<CMPIBoolean>(content)); }
        void operator()(char16_t content) const { item = scalarItem(item.type, static_cast<CMPIChar16>(content)); }
        void operator()(std::uint64_t content) const { item = unsignedItem(item.type, content); }
        void operator()(std::int64_t content) const { item = signedItem(item.type, content); }
        void operator()(double content) const {
            item = item.type == CMPI_real32 ? scalarItem(item.type, static_cast<CMPIReal32>(content))
                                            : scalarItem(item.type, content);
        }
        void operator()(const std::string& content) const { item.content.text = copyText(memory, content); }
        void operator()(const std::shared_ptr<const ObjectPath>& content) const {
            item.content.path = new (memory.allocate(sizeof(PathContent), alignof(PathContent)))
                PathContent(fromModel(memory, *content));
        }
        void operator()(const std::shared_ptr<const Instance>& content) const {
            item.content.instance = new (memory.allocate(sizeof(InstanceContent), alignof(InstanceContent)))
                InstanceContent(fromModel(memory, *content));
        }
        void operator()(const Value::Array& content) const {
            item.count = static_cast<std::uint32_t>(content.size());
            item.content.elements = newElements(memory, item.count);
            std::transform(content.begin(), content.end(), item.content.elements,
                           [&](const Value& element) { return fromModel(memory, element); });
        }
    };
    std::visit(Visitor{memory, item}, value.content);
    return item;
}

NamedItems fromModel(Memory& memory, const std::vector<NamedValue>& values) {
    NamedItems items;
    items.reserve(memory, static_cast<std::uint32_t>(values.size()));
    for (const NamedValue& value : values) {
        items.append(memory, {copyText(memory, value.name), fromModel(memory, value.value)});
    }
    return items;
}

PathContent fromModel(Memory& memory, const ObjectPath& path) {
    return {copyText(memory, path.host), copyText(memory, path.nameSpace), copyText(memory, path.className),
            fromModel(memory, path.keys), false};
}

InstanceContent fromModel(Memory& memory, const Instance& instance) {
    return {fromModel(memory, instance.path), fromModel(memory, instance.properties), {}, {}, false, false};
}

Value toModel(const Item& item) {
    if (item.null) {
        return nullValue(item.type);
    }
    if ((item.type & CMPI_ARRAY) != 0) {
        Value::Array elements;
        elements.reserve(item.count);
        std::transform(item.content.elements, item.content.elements + item.count, std::back_inserter(elements),
                       [](const Item& element) { return toModel(element); });
        return {item.type, std::move(elements)};
    }
    switch (item.type) {
    case CMPI_boolean:
        return booleanValue(scalarOf<CMPIBoolean>(item) != 0);
    case CMPI_char16:
        return {item.type, static_cast<char16_t>(scalarOf<CMPIChar16>(item))};
    case CMPI_uint8:
        return unsignedValue(item.type, scalarOf<CMPIUint8>(item));
    case CMPI_uint16:
        return unsignedValue(item.type, scalarOf<CMPIUint16>(item));
    case CMPI_uint32:
        return unsignedValue(item.type, scalarOf<CMPIUint32>(item));
    case CMPI_uint64:
        return unsignedValue(item.type, scalarOf<CMPIUint64>(item));
    case CMPI_sint8:
        return signedValue(item.type, scalarOf<CMPISint8>(item));
    case CMPI_sint16:
        return signedValue(item.type, scalarOf<CMPISint16>(item));
    case CMPI_sint32:
        return signedValue(item.type, scalarOf<CMPISint32>(item));
    case CMPI_sint64:
        return signedValue(item.type, scalarOf<CMPISint64>(item));
    case CMPI_real32:
        return realValue(item.type, scalarOf<CMPIReal32>(item));
    case CMPI_real64:
        return realValue(item.type, scalarOf<CMPIReal64>(item));
    case CMPI_ref:
        return referenceValue(toModel(*item.content.path));
    case CMPI_instance:
        return {item.type, std::make_shared<const Instance>(toModel(*item.content.instance))};
    default: // CMPI_string and CMPI_dateTime, since no other types become items
        return {item.type, std::string(item.content.text)};
    }
}

std::vector<NamedValue> toModel(const NamedItems& items) {
    std::vector<NamedValue> values;
    values.reserve(items.size);
    for (const NamedItem& item : items) {
        values.push_back({item.name, toModel(item.item)});
    }
    return values;
}

ObjectPath toModel(const PathContent& path) {
    return {orEmpty(path.host), orEmpty(path.nameSpace), orEmpty(path.className), toModel(path.keys)};
}

Instance toModel(const InstanceContent& instance) {
    return {toModel(instance.path), toModel(instance.properties)};
}

} // namespace ObjectManager

#include "broker/Objects.h"

namespace ObjectManager {

void reportMisuse(const std::string& what) {
    if (Request* request = Request::current(); request != nullptr) {
        request->reportMisuse(what);
    }
}

Request* requestFor(CMPIStatus* rc) {
    Request* request = Request::current();
    setStatus(rc, request != nullptr ? CMPI_RC_OK : CMPI_RC_ERR_FAILED);
    return request;
}

CMPIString* newString(Request& request, std::string_view text) {
    return newObject<CMPIString>(request, copyText(request.memory(), text));
}

CMPIString* returnedString(const char* text, CMPIStatus* rc) {
    Request* request = requestFor(rc);
    return request != nullptr ? newString(*request, orEmpty(text)) : nullptr;
}

void endClone(ObjectHeader& clone) {
    if (Request* request = Request::current(); request != nullptr) {
        request->bury(clone);
    } else {
        deleteShell(clone);
    }
}

void deleteShell(ObjectHeader& clone) {
    clone.memory->deallocate(&clone, sizeof clone, alignof(ObjectHeader));
}

namespace {

CMPIrc readText(Memory& memory, CMPIType type, const char* text, Item& item) {
    item = {type, text == nullptr, 0, {}};
    if (text != nullptr) {
        item.content.text = copyText(memory, text);
    }
    return CMPI_RC_OK;
}

/** Reads an object into an item; `store` copies the object's content into the item. */
template <typename Handle, typename Store>
CMPIrc readObject(CMPIType type, const Handle* object, Item& item, Store store) {
    Item read{type, object == nullptr, 0, {}};
    if (object != nullptr) {
        CMPIStatus status = statusOf(CMPI_RC_OK);
        const auto* content = contentOf(object, &status);
        if (content == nullptr) {
            return status.rc;
        }
        store(read, *content);
    }
    item = read;
    return CMPI_RC_OK;
}

/** The type with which a value is kept: strings instead of CMPI_chars. */
CMPIType keptType(CMPIType type) {
    const auto element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    return element == CMPI_chars ? static_cast<CMPIType>((type & CMPI_ARRAY) | CMPI_string) : type;
}

CMPIrc readArray(Memory& memory, CMPIType type, const CMPIArray* array, Item& item) {
    CMPIStatus status = statusOf(CMPI_RC_OK);
    const ArrayContent* content = array != nullptr ? contentOf(array, &status) : nullptr;
    if (content == nullptr) {
        if (status.rc == CMPI_RC_OK) {
            item = {type, true, 0, {}};
        }
        return status.rc;
    }
    if (content->elementType != static_cast<CMPIType>(type & ~CMPI_ARRAY)) {
        return CMPI_RC_ERR_TYPE_MISMATCH;
    }
    item = {type, false, content->count, {}};
    item.content.elements = copy(memory, *content).elements;
    return CMPI_RC_OK;
}

/** If the path has no keys and every key property is set, calls `add` with each of the key properties. */
template <typename Add>
void forMissingKeys(const InstanceContent& instance, const ClassInformation* classes, Add add) {
    if (instance.path.keys.size != 0) {
        return;
    }
    const auto addAll = [&](const auto& names) {
        const auto property = [&](std::string_view name) { return findItem(instance.properties, name); };
        if (std::all_of(names.begin(), names.end(), property)) {
            std::for_each(names.begin(), names.end(), [&](std::string_view name) { add(*property(name)); });
        }
    };
    const std::span<const std::string> names =
        classes != nullptr ? classes->keyNames(orEmpty(instance.path.className)) : std::span<const std::string>();
    if (names.empty()) {
        addAll(instance.keyNames);
    } else {
        addAll(names);
    }
}

} // namespace

CMPIrc readValue(Memory& memory, const CMPIValue* value, CMPIType type, Item& item) {
    const CMPIType kept = keptType(type);
    if (type == CMPI_chars) {
        return readText(memory, kept, reinterpret_cast<const char*>(value), item);
    }
    if (value == nullptr || type == CMPI_null) {
        item = {kept, true, 0, {}};
        return CMPI_RC_OK;
    }
    if ((type & CMPI_ARRAY) != 0) {
        return readArray(memory, kept, value->array, item);
    }
    if (const std::size_t size = scalarSize(type); size != 0) {
        item = {type, false, 0, {}};
        std::memcpy(&item.content.scalar, value, size);
        return CMPI_RC_OK;
    }
    switch (type) {
    case CMPI_string:
        return readObject(type, value->string, item,
                          [&](Item& read, const char& text) { read.content.text = copyText(memory, &text); });
    case CMPI_dateTime:
        return readObject(type, value->dateTime, item, [&](Item& read, const DateTimeContent& content) {
            read.content.text = copyText(memory, content.text);
        });
    case CMPI_ref:
        return readObject(type, value->ref, item,
                          [&](Item& read, const PathContent& content) { read.content.path = place(memory, content); });
    case CMPI_instance:
        return readObject(type, value->inst, item, [&](Item& read, const InstanceContent& content) {
            read.content.instance = place(memory, content);
        });
    default:
        return CMPI_RC_ERR_INVALID_DATA_TYPE;
    }
}

CMPIData dataOf(const Item& item, CMPIValueState state, CMPIStatus* rc) {
    CMPIData data{};
    data.type = item.type;
    data.state = state;
    setStatus(rc, CMPI_RC_OK);
    if (item.null) {
        data.state |= CMPI_nullValue;
        return data;
    }
    if (scalarSize(item.type) != 0) {
        std::memcpy(&data.value, &item.content.scalar, sizeof item.content.scalar);
        return data;
    }
    Request* request = requestFor(rc);
    if (request == nullptr) {
        return noData(rc, CMPI_RC_ERR_FAILED);
    }
    Memory& memory = request->memory();
    if ((item.type & CMPI_ARRAY) != 0) {
        const ArrayContent array{static_cast<CMPIType>(item.type & ~CMPI_ARRAY), item.count, item.content.elements};
        data.value.array = newObject<CMPIArray>(*request, place(memory, array));
        return data;
    }
    switch (item.type) {
    case CMPI_string:
        data.value.string = newString(*request, item.content.text);
        break;
    case CMPI_dateTime:
        data.value.dateTime = newObject<CMPIDateTime>(*request, place(memory, DateTimeContent{item.content.text}));
        break;
    case CMPI_ref:
        data.value.ref = newObject<CMPIObjectPath>(*request, place(memory, *item.content.path));
        break;
    default: // CMPI_instance, since no other types become items
        data.value.inst = newObject<CMPIInstance>(*request, place(memory, *item.content.instance));
        break;
    }
    return data;
}

CMPIStatus setNamedValue(Memory& memory, NamedItems& items, const char* name, const CMPIValue* value, CMPIType type) {
    if (name == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    Item item;
    const CMPIrc code = readValue(memory, value, type, item);
    if (code == CMPI_RC_OK) {
        setItem(memory, items, name, item);
    }
    return statusOf(code);
}

CMPIData namedValue(const NamedItems& items, const char* name, CMPIValueState state, CMPIStatus* rc) {
    if (name == nullptr) {
        return noData(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    const NamedItem* found = findItem(items, name);
    return found != nullptr ? dataOf(found->item, state, rc) : noData(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

CMPIData namedValueAt(const NamedItems& items, CMPICount index, CMPIString** name, CMPIValueState state,
                      CMPIStatus* rc) {
    if (index >= items.size) {
        return noData(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    }
    const NamedItem& item = items.items[index];
    if (name != nullptr) {
        *name = returnedString(item.name, rc);
    }
    return dataOf(item.item, state, rc);
}

PathContent fullPath(Memory& memory, const InstanceContent& instance, const ClassInformation* classes) {
    PathContent path = copy(memory, instance.path);
    forMissingKeys(instance, classes, [&](const NamedItem& property) {
        path.keys.append(memory, {copyText(memory, property.name), copy(memory, property.item)});
    });
    return path;
}

Instance fullInstance(const InstanceContent& instance, const ClassInformation* classes) {
    Instance full = toModel(instance);
    forMissingKeys(instance, classes, [&](const NamedItem& property) {
        full.path.keys.push_back({property.name, toModel(property.item)});
    });
    return full;
}

PropertyList propertyListOf(const char** properties) {
    if (properties == nullptr) {
        return std::nullopt;
    }
    std::vector<std::string> names;
    for (; *properties != nullptr; ++properties) {
        names.emplace_back(*properties);
    }
    return names;
}

std::vector<NamedValue> argumentsOf(const CMPIArgs* arguments) {
    const NamedItemsContent* content = contentOf(arguments, nullptr);
    return content != nullptr ? toModel(content->items) : std::vector<NamedValue>();
}

std::string textOf(const CMPIString* string) {
    return string != nullptr ? orEmpty(contentOf(string, nullptr)) : "";
}

} // namespace ObjectManager

#include "broker/Objects.h"

#include <algorithm>

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

CMPIString* returnedString(std::string_view text, CMPIStatus* rc) {
    Request* request = requestFor(rc);
    return request != nullptr ? newString(*request, text) : nullptr;
}

CMPIString* newString(Request& request, std::string_view text) {
    return adopted<CMPIString>(request, copyText(request.memory(), text));
}

char* copyText(Memory& memory, std::string_view text) {
    text = text.substr(0, text.find('\0'));
    auto* copy = static_cast<char*>(memory.allocate(text.size() + 1, 1));
    *std::copy(text.begin(), text.end(), copy) = '\0';
    return copy;
}

void dropText(Memory& memory, char* text) {
    memory.deallocate(text, std::strlen(text) + 1, 1);
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

/**
 * Calls `visit` with the member of CMPIValue in which a scalar of this type stands, and a null pointer to the type of
 * its content in a value. Whether there is such a member.
 */
template <typename Visitor>
bool visitScalar(CMPIType type, Visitor visit) {
    constexpr bool* truth = nullptr;
    constexpr char16_t* character = nullptr;
    constexpr std::uint64_t* natural = nullptr;
    constexpr std::int64_t* integer = nullptr;
    constexpr double* real = nullptr;
    switch (type) {
    case CMPI_boolean:
        return visit(&CMPIValue::boolean, truth), true;
    case CMPI_char16:
        return visit(&CMPIValue::char16, character), true;
    case CMPI_uint8:
        return visit(&CMPIValue::uint8, natural), true;
    case CMPI_uint16:
        return visit(&CMPIValue::uint16, natural), true;
    case CMPI_uint32:
        return visit(&CMPIValue::uint32, natural), true;
    case CMPI_uint64:
        return visit(&CMPIValue::uint64, natural), true;
    case CMPI_sint8:
        return visit(&CMPIValue::sint8, integer), true;
    case CMPI_sint16:
        return visit(&CMPIValue::sint16, integer), true;
    case CMPI_sint32:
        return visit(&CMPIValue::sint32, integer), true;
    case CMPI_sint64:
        return visit(&CMPIValue::sint64, integer), true;
    case CMPI_real32:
        return visit(&CMPIValue::real32, real), true;
    case CMPI_real64:
        return visit(&CMPIValue::real64, real), true;
    default:
        return false;
    }
}

/** Reads the object of an encapsulated type: `contentFrom` makes a value's content of what it holds. */
template <typename Handle, typename ContentFrom>
CMPIrc readObject(CMPIType type, const Handle* object, Value& value, ContentFrom contentFrom) {
    if (object == nullptr) {
        value = nullValue(type);
        return CMPI_RC_OK;
    }
    CMPIStatus status = statusOf(CMPI_RC_OK);
    if (const auto* held = contentOf(object, &status); held != nullptr) {
        value = Value(type, contentFrom(held));
    }
    return status.rc;
}

CMPIType keptType(CMPIType type) {
    const auto element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    return element == CMPI_chars ? static_cast<CMPIType>((type & CMPI_ARRAY) | CMPI_string) : type;
}

CMPIrc readArray(Allocator allocator, CMPIType type, const CMPIArray* array, Value& value) {
    CMPIStatus status = statusOf(CMPI_RC_OK);
    const ArrayContent* held = array != nullptr ? contentOf(array, &status) : nullptr;
    if (held == nullptr) {
        if (status.rc == CMPI_RC_OK) {
            value = nullValue(type);
        }
        return status.rc;
    }
    if (held->elementType != static_cast<CMPIType>(type & ~CMPI_ARRAY)) {
        return CMPI_RC_ERR_TYPE_MISMATCH;
    }
    value = Value(type, Value::Array(held->elements, allocator));
    return CMPI_RC_OK;
}

} // namespace

bool isScalar(CMPIType type) {
    return visitScalar(type, [](auto, auto) {});
}

CMPIrc readValue(Allocator allocator, const CMPIValue* given, CMPIType type, Value& value) {
    const CMPIType kept = keptType(type);
    if (given == nullptr || type == CMPI_null) {
        value = nullValue(kept);
        return CMPI_RC_OK;
    }
    if (type == CMPI_chars) {
        value.type = kept;
        value.content.emplace<Text>(reinterpret_cast<const char*>(given), allocator);
        return CMPI_RC_OK;
    }
    if ((type & CMPI_ARRAY) != 0) {
        return readArray(allocator, kept, given->array, value);
    }
    // No more is read than a value of the type has.
    if (visitScalar(type, [&]<typename Member, typename Kept>(Member CMPIValue::*, Kept*) {
            Member scalar{};
            std::memcpy(&scalar, given, sizeof scalar);
            value.type = type;
            value.content.emplace<Kept>(static_cast<Kept>(scalar));
        })) {
        return CMPI_RC_OK;
    }
    switch (type) {
    case CMPI_string:
        return readObject(type, given->string, value, [&](const char* text) { return Text(text, allocator); });
    case CMPI_dateTime:
        return readObject(type, given->dateTime, value, [&](const Text* text) { return Text(*text, allocator); });
    case CMPI_ref:
        return readObject(type, given->ref, value,
                          [&](const ObjectPath* path) { return Box<ObjectPath>(*path, allocator); });
    case CMPI_instance:
        return readObject(type, given->inst, value,
                          [&](const InstanceContent* held) { return Box<Instance>(held->instance, allocator); });
    default:
        return CMPI_RC_ERR_INVALID_DATA_TYPE;
    }
}

CMPIData dataOf(const Value& value, CMPIValueState state, CMPIStatus* rc) {
    CMPIData data{};
    data.type = value.type;
    data.state = state;
    setStatus(rc, CMPI_RC_OK);
    if (value.isNull()) {
        data.state |= CMPI_nullValue;
        return data;
    }
    if (visitScalar(value.type, [&]<typename Member, typename Kept>(Member CMPIValue::*member, Kept*) {
            data.value.*member = static_cast<Member>(std::get<Kept>(value.content));
        })) {
        return data;
    }
    Request* request = requestFor(rc);
    if (request == nullptr) {
        return noData(rc, CMPI_RC_ERR_FAILED);
    }
    if (const auto* elements = std::get_if<Value::Array>(&value.content)) {
        data.value.array = newObject<CMPIArray>(*request, static_cast<CMPIType>(value.type & ~CMPI_ARRAY), *elements);
    } else if (const auto* path = std::get_if<Box<ObjectPath>>(&value.content)) {
        data.value.ref = newObject<CMPIObjectPath>(*request, **path);
    } else if (const auto* instance = std::get_if<Box<Instance>>(&value.content)) {
        data.value.inst = newObject<CMPIInstance>(*request, **instance);
    } else if (value.type == CMPI_dateTime) {
        data.value.dateTime = newObject<CMPIDateTime>(*request, std::get<Text>(value.content));
    } else {
        data.value.string = newString(*request, std::get<Text>(value.content));
    }
    return data;
}

void setValue(NamedValues& values, std::string_view name, Value&& value) {
    const auto present =
        std::find_if(values.begin(), values.end(), [&](const NamedValue& each) { return equalNames(each.name, name); });
    if (present != values.end()) {
        present->value = Value(std::move(value), values.get_allocator());
        return;
    }
    // Most objects get several values, one by one.
    if (values.size() == values.capacity()) {
        values.reserve(std::max<std::size_t>(4, values.capacity() * 2));
    }
    values.emplace_back(name, std::move(value));
}

CMPIStatus setNamedValue(NamedValues& values, const char* name, const CMPIValue* given, CMPIType type) {
    if (name == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    Value value;
    const CMPIrc code = readValue(values.get_allocator(), given, type, value);
    if (code == CMPI_RC_OK) {
        setValue(values, name, std::move(value));
    }
    return statusOf(code);
}

CMPIData namedValue(const NamedValues& values, const char* name, CMPIValueState state, CMPIStatus* rc) {
    if (name == nullptr) {
        return noData(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    const NamedValue* found = find(values, name);
    return found != nullptr ? dataOf(found->value, state, rc) : noData(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

CMPIData namedValueAt(const NamedValues& values, CMPICount index, CMPIString** name, CMPIValueState state,
                      CMPIStatus* rc) {
    if (index >= values.size()) {
        return noData(rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    }
    if (name != nullptr) {
        *name = returnedString(values[index].name, rc);
    }
    return dataOf(values[index].value, state, rc);
}

void completePath(ObjectPath& path, const InstanceContent& instance, const ClassInformation* classes) {
    if (!path.keys.empty()) {
        return;
    }
    const auto addAll = [&](const auto& names) {
        const auto property = [&](std::string_view name) { return find(instance.instance.properties, name); };
        if (std::all_of(names.begin(), names.end(), property)) {
            std::for_each(names.begin(), names.end(),
                          [&](std::string_view name) { path.keys.push_back(*property(name)); });
        }
    };
    const std::span<const std::string> names =
        classes != nullptr ? classes->keyNames(path.className) : std::span<const std::string>();
    if (names.empty()) {
        addAll(instance.keyNames);
    } else {
        addAll(names);
    }
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
    const NamedValues* held = contentOf(arguments, nullptr);
    return held != nullptr ? std::vector<NamedValue>(held->begin(), held->end()) : std::vector<NamedValue>();
}

std::string textOf(const CMPIString* string) {
    const char* text = string != nullptr ? contentOf(string, nullptr) : nullptr;
    return text != nullptr ? text : "";
}

} // namespace ObjectManager

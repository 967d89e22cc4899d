#include "RecordingBroker.h"

#include "Transcript.h"
#include "cmpimacs.h"

#include <algorithm>
#include <cstring>
#include <deque>
#include <stdexcept>
#include <strings.h>
#include <type_traits>

namespace OrvTest {
namespace {

bool sameName(const std::string& left, const std::string& right) {
    return strcasecmp(left.c_str(), right.c_str()) == 0;
}

/** The facts that the broker keeps about an object: the broker that made it, and its name. */
struct Named {
    RecordingBroker* broker;
    std::string name;
};

/** A key, property or argument. */
struct Entry {
    std::string name;
    CMPIData data;
};

using Entries = std::vector<Entry>;

Entry* find(Entries& entries, const std::string& name) {
    const auto found =
        std::find_if(entries.begin(), entries.end(), [&](const Entry& entry) { return sameName(entry.name, name); });
    return found == entries.end() ? nullptr : &*found;
}

void put(Entries& entries, const std::string& name, const CMPIData& data) {
    if (Entry* entry = find(entries, name)) {
        entry->data = data;
    } else {
        entries.push_back({name, data});
    }
}

struct String : CMPIString, Named {
    std::string text;
};

struct Path : CMPIObjectPath, Named {
    String* nameSpace;
    String* host;
    String* className;
    Entries keys;
};

struct Instance : CMPIInstance, Named {
    Path* path;
    Entries properties;
    bool filtered = false;
    Lines wanted;
    Lines keys;
};

struct Array : CMPIArray, Named {
    CMPIType type;
    std::vector<CMPIData> elements;
};

struct Args : CMPIArgs, Named {
    Entries arguments;
};

struct Enumeration : CMPIEnumeration, Named {
    std::vector<CMPIData> elements;
    std::size_t position = 0;
};

struct DateTime : CMPIDateTime, Named {};
struct Context : CMPIContext, Named {};

struct Result : CMPIResult, Named {
    RecordingBroker::Returned returned;
};

String& self(const CMPIString* object) {
    return static_cast<String&>(const_cast<CMPIString&>(*object));
}
Path& self(const CMPIObjectPath* object) {
    return static_cast<Path&>(const_cast<CMPIObjectPath&>(*object));
}
Instance& self(const CMPIInstance* object) {
    return static_cast<Instance&>(const_cast<CMPIInstance&>(*object));
}
Array& self(const CMPIArray* object) {
    return static_cast<Array&>(const_cast<CMPIArray&>(*object));
}
Args& self(const CMPIArgs* object) {
    return static_cast<Args&>(const_cast<CMPIArgs&>(*object));
}
Enumeration& self(const CMPIEnumeration* object) {
    return static_cast<Enumeration&>(const_cast<CMPIEnumeration&>(*object));
}
DateTime& self(const CMPIDateTime* object) {
    return static_cast<DateTime&>(const_cast<CMPIDateTime&>(*object));
}
Context& self(const CMPIContext* object) {
    return static_cast<Context&>(const_cast<CMPIContext&>(*object));
}
Result& self(const CMPIResult* object) {
    return static_cast<Result&>(const_cast<CMPIResult&>(*object));
}

/** The broker to which a slot's argument points. CMPI passes brokers as const pointers. */
RecordingBroker& self(const CMPIBroker* broker) {
    return static_cast<RecordingBroker&>(const_cast<CMPIBroker&>(*broker));
}

/* Texts of the transcript */

std::string shown(const char* text) {
    return text == nullptr ? "null" : '"' + std::string(text) + '"';
}

template <typename Object>
requires(!std::is_same_v<std::remove_cv_t<Object>, char>) std::string shown(Object* object) {
    return Transcript::instance().nameOf(reinterpret_cast<const void*>(object));
}

std::string shown(const char** names) {
    if (names == nullptr) {
        return "null";
    }
    std::string text;
    for (; *names != nullptr; ++names) {
        text += text.empty() ? "" : ", ";
        text += *names;
    }
    return '{' + text + '}';
}

template <typename Number>
requires(std::is_arithmetic_v<Number> || std::is_enum_v<Number>) std::string shown(Number number) {
    return std::to_string(number);
}

const std::map<CMPIType, std::string> typeNames = {
    {CMPI_null, "CMPI_null"},       {CMPI_boolean, "CMPI_boolean"},   {CMPI_char16, "CMPI_char16"},
    {CMPI_real32, "CMPI_real32"},   {CMPI_real64, "CMPI_real64"},     {CMPI_uint8, "CMPI_uint8"},
    {CMPI_uint16, "CMPI_uint16"},   {CMPI_uint32, "CMPI_uint32"},     {CMPI_uint64, "CMPI_uint64"},
    {CMPI_sint8, "CMPI_sint8"},     {CMPI_sint16, "CMPI_sint16"},     {CMPI_sint32, "CMPI_sint32"},
    {CMPI_sint64, "CMPI_sint64"},   {CMPI_instance, "CMPI_instance"}, {CMPI_ref, "CMPI_ref"},
    {CMPI_string, "CMPI_string"},   {CMPI_chars, "CMPI_chars"},       {CMPI_dateTime, "CMPI_dateTime"},
    {CMPI_uint16A, "CMPI_uint16A"}, {CMPI_uint32A, "CMPI_uint32A"},   {CMPI_stringA, "CMPI_stringA"},
    {CMPI_charsA, "CMPI_charsA"},   {CMPI_refA, "CMPI_refA"},
};

std::string shownType(CMPIType type) {
    const auto found = typeNames.find(type);
    return found == typeNames.end() ? "type " + std::to_string(type) : found->second;
}

/** The data for a value; texts are not copied. The whole value is copied, as some object managers do. */
CMPIData plainData(const CMPIValue* value, CMPIType type) {
    CMPIData data = nullValue(type);
    if (value != nullptr && type != CMPI_null) {
        data.state = CMPI_goodValue;
        if (type == CMPI_chars) {
            data.value.chars = reinterpret_cast<char*>(const_cast<CMPIValue*>(value));
        } else {
            data.value = *value;
        }
    }
    return data;
}

std::string shown(const CMPIData& data) {
    if ((data.state & CMPI_notFound) != 0) {
        return "not found";
    }
    if ((data.state & CMPI_nullValue) != 0) {
        return "null";
    }
    switch (data.type) {
    case CMPI_boolean:
        return data.value.boolean != 0 ? "true" : "false";
    case CMPI_uint8:
        return shown(data.value.uint8);
    case CMPI_uint16:
        return shown(data.value.uint16);
    case CMPI_uint32:
        return shown(data.value.uint32);
    case CMPI_uint64:
        return shown(data.value.uint64);
    case CMPI_sint8:
        return shown(data.value.sint8);
    case CMPI_sint16:
        return shown(data.value.sint16);
    case CMPI_sint32:
        return shown(data.value.sint32);
    case CMPI_sint64:
        return shown(data.value.sint64);
    case CMPI_chars:
        return shown(static_cast<const char*>(data.value.chars));
    case CMPI_string:
        return data.value.string == nullptr || data.value.string->hdl == nullptr
                   ? shown(data.value.string)
                   : shown(self(data.value.string).text.c_str());
    default:
        return shown(data.value.string);
    }
}

/* Calls */

/** Whether a call is recorded as a call or as a reading; only the transcript treats them differently. */
enum class Weight { call, reading };

/** One call of the broker or of one of its objects: its line in the transcript, and its fault. */
class Call {
public:
    Call(RecordingBroker& broker, const std::string& object, const char* slot, const std::string& arguments,
         Weight weight = Weight::call)
        : _line(object + '.' + slot + '(' + arguments + ')'), _weight(weight) {
        try {
            _fault = broker.faults.next(slot);
        } catch (...) {
            write(_line + " throws");
            throw;
        }
    }

    const Fault& fault() const { return _fault; }

    /** Ends a call that returns its status. */
    CMPIStatus done(CMPIrc usual = CMPI_RC_OK) {
        write(_line);
        return {_fault.status.value_or(usual), _fault.message};
    }

    /** Ends a call that returns something else. */
    void done(const std::string& outcome, CMPIStatus* status, CMPIrc usual = CMPI_RC_OK) {
        write(_line + " -> " + outcome + (status == nullptr && _weight == Weight::call ? ", no status" : ""));
        if (status != nullptr && !_fault.leavesStatus) {
            *status = {_fault.status.value_or(usual), _fault.message};
        }
    }

private:
    void write(const std::string& line) const {
        if (_weight == Weight::call) {
            Transcript::instance().call(line);
        } else {
            Transcript::instance().reading(line);
        }
    }

    std::string _line;
    Weight _weight;
    Fault _fault;
};

/** A call on an object. */
template <typename Object>
Call callOn(const Object& object, const char* slot, const std::string& arguments) {
    return {*object.broker, object.name, slot, arguments};
}

template <typename Object>
Call readingOf(const Object& object, const char* slot, const std::string& arguments = "") {
    return {*object.broker, object.name, slot, arguments, Weight::reading};
}

/** A slot's name as a template argument. */
template <std::size_t size>
struct SlotName {
    char text[size];
    constexpr SlotName(const char (&name)[size]) { std::copy_n(name, size, text); }
};

template <typename... Arguments>
std::string shownAll(const Arguments&... arguments) {
    std::string text;
    ((text += (text.empty() ? "" : ", ") + shown(arguments)), ...);
    return text;
}

template <typename Value, typename... Arguments>
using Slot = Value (*)(Arguments...);
template <typename Value, typename... Arguments>
using VariadicSlot = Value (*)(Arguments..., ...);

/** Stands for any slot: a function that records its call and reports that it is not supported. */
template <SlotName slot>
struct Unsupported {
    template <typename Value, typename... Arguments>
    static Value function(Arguments... arguments) {
        Transcript::instance().call(std::string(slot.text) + '(' + shownAll(arguments...) + ") is not supported");
        (report(arguments), ...);
        if constexpr (std::is_same_v<Value, CMPIStatus>) {
            return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
        } else if constexpr (!std::is_void_v<Value>) {
            return Value();
        }
    }

    template <typename Value, typename... Arguments>
    static Value variadicFunction(Arguments... arguments, ...) {
        return function<Value, Arguments...>(arguments...);
    }

    template <typename Value, typename... Arguments>
    operator Slot<Value, Arguments...>() const {
        return &function<Value, Arguments...>;
    }

    template <typename Value, typename... Arguments>
    operator VariadicSlot<Value, Arguments...>() const {
        return &variadicFunction<Value, Arguments...>;
    }

private:
    template <typename Argument>
    static void report(Argument argument) {
        if constexpr (std::is_same_v<Argument, CMPIStatus*>) {
            if (argument != nullptr) {
                *argument = {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
            }
        }
    }
};

} // namespace

/** The objects of one broker. They are in deques, since pointers to them must stay valid. */
struct RecordingBroker::Objects {
    RecordingBroker* broker;
    std::string name;
    std::deque<String> strings = {};
    std::deque<Path> paths = {};
    std::deque<Instance> instances = {};
    std::deque<Array> arrays = {};
    std::deque<Args> args = {};
    std::deque<Enumeration> enumerations = {};
    std::deque<DateTime> dateTimes = {};
    std::deque<Context> contexts = {};
    std::deque<Result> results = {};

    /** Gives an object its name and handle, and stores it in its deque. */
    template <typename Object, typename Table>
    Object* keep(std::deque<Object>& objects, const Table& table, const std::string& objectName, Object object = {}) {
        Object& kept = objects.emplace_back(std::move(object));
        kept.broker = broker;
        kept.name = objectName;
        kept.hdl = &kept;
        kept.ft = &table;
        Transcript::instance().name(&kept, objectName);
        return &kept;
    }

    String* newString(const std::string& objectName, const char* text);
    Path* newPath(const std::string& objectName, const char* nameSpace, const char* className);
    Instance* newInstance(const std::string& objectName, const CMPIObjectPath* path);
    Enumeration* newEnumeration(std::vector<CMPIData> elements);

    /** The data that the broker keeps: texts are copied. */
    CMPIData stored(const std::string& owner, const char* entry, CMPIData data);
};

namespace {

/* Functions of every kind of object */

template <typename Object>
CMPIStatus releaseObject(Object* object) {
    Call call = callOn(self(object), "release", "");
    object->hdl = nullptr;
    return call.done();
}

/** Ends a call that makes or returns an object, as its fault says. */
template <typename Object, typename Make>
Object* deliver(Call& call, CMPIStatus* status, Make make) {
    Object* object = call.fault().object == Fault::Object::null ? nullptr : make();
    if (call.fault().object == Fault::Object::withoutHandle) {
        object->hdl = nullptr;
        call.done(shown(object) + " without handle", status);
    } else {
        call.done(shown(object), status);
    }
    return object;
}

CMPIData deliver(Call& call, CMPIStatus* status, Entries& entries, const char* name, CMPIrc missing) {
    const Entry* entry = find(entries, name);
    CMPIData data = nullValue(CMPI_null);
    data.state |= CMPI_notFound;
    if (entry != nullptr && call.fault().object != Fault::Object::null) {
        data = entry->data;
    }
    call.done(shown(data), status, (data.state & CMPI_notFound) != 0 ? missing : CMPI_RC_OK);
    return data;
}

CMPIData deliverAt(Call& call, CMPIStatus* status, RecordingBroker& broker, Entries& entries, CMPICount index,
                   CMPIString** name) {
    if (index >= entries.size()) {
        call.done("not found", status, CMPI_RC_ERR_NO_SUCH_PROPERTY);
        CMPIData data = nullValue(CMPI_null);
        data.state |= CMPI_notFound;
        return data;
    }
    const Entry& entry = entries[index];
    if (name != nullptr) {
        *name = broker.string(entry.name, entry.name);
    }
    call.done(shown(entry.data), status);
    return entry.data;
}

/* Strings */

const char* getCharPtr(const CMPIString* object, CMPIStatus* status) {
    String& string = self(object);
    Call call = readingOf(string, "getCharPtr");
    const char* text = call.fault().object == Fault::Object::null ? nullptr : string.text.c_str();
    call.done(shown(text), status);
    return text;
}

const CMPIStringFT stringTable = {CMPIVersion200, &releaseObject<CMPIString>, Unsupported<"string.clone">(),
                                  &getCharPtr};

/* Object paths */

CMPIStatus setText(String* Path::*member, const CMPIObjectPath* object, const char* slot, const char* text) {
    Path& path = self(object);
    Call call = callOn(path, slot, shown(text));
    (path.*member)->text = text;
    return call.done();
}

CMPIStatus setNameSpace(const CMPIObjectPath* object, const char* text) {
    return setText(&Path::nameSpace, object, "setNameSpace", text);
}

CMPIString* getNameSpace(const CMPIObjectPath* object, CMPIStatus* status) {
    Path& path = self(object);
    Call call = readingOf(path, "getNameSpace");
    return deliver<CMPIString>(call, status, [&] { return path.nameSpace; });
}

CMPIStatus setHostname(const CMPIObjectPath* object, const char* text) {
    return setText(&Path::host, object, "setHostname", text);
}

CMPIString* getHostname(const CMPIObjectPath* object, CMPIStatus* status) {
    Path& path = self(object);
    Call call = readingOf(path, "getHostname");
    return deliver<CMPIString>(call, status, [&] { return path.host; });
}

CMPIStatus setClassName(const CMPIObjectPath* object, const char* text) {
    return setText(&Path::className, object, "setClassName", text);
}

CMPIString* getClassName(const CMPIObjectPath* object, CMPIStatus* status) {
    Path& path = self(object);
    Call call = callOn(path, "getClassName", "");
    return deliver<CMPIString>(call, status, [&] { return path.className; });
}

CMPIStatus addKey(const CMPIObjectPath* object, const char* name, const CMPIValue* value, CMPIType type) {
    Path& path = self(object);
    const CMPIData data = plainData(value, type);
    Call call = callOn(path, "addKey", std::string(name) + ", " + shownType(type) + ", " + shown(data));
    CMPIData key = path.broker->objects().stored(path.name, name, data);
    key.state |= CMPI_keyValue;
    put(path.keys, name, key);
    return call.done();
}

CMPIData getKey(const CMPIObjectPath* object, const char* name, CMPIStatus* status) {
    Path& path = self(object);
    Call call = callOn(path, "getKey", name);
    return deliver(call, status, path.keys, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPIData getKeyAt(const CMPIObjectPath* object, CMPICount index, CMPIString** name, CMPIStatus* status) {
    Path& path = self(object);
    Call call = callOn(path, "getKeyAt", shown(index));
    return deliverAt(call, status, *path.broker, path.keys, index, name);
}

CMPICount getKeyCount(const CMPIObjectPath* object, CMPIStatus* status) {
    Path& path = self(object);
    Call call = callOn(path, "getKeyCount", "");
    const auto count = static_cast<CMPICount>(path.keys.size());
    call.done(shown(count), status);
    return count;
}

CMPIStatus setNameSpaceFromObjectPath(const CMPIObjectPath* object, const CMPIObjectPath* source) {
    Path& path = self(object);
    Call call = callOn(path, "setNameSpaceFromObjectPath", shown(source));
    path.nameSpace->text = self(source).nameSpace->text;
    return call.done();
}

CMPIStatus setHostAndNameSpaceFromObjectPath(const CMPIObjectPath* object, const CMPIObjectPath* source) {
    Path& path = self(object);
    Call call = callOn(path, "setHostAndNameSpaceFromObjectPath", shown(source));
    path.host->text = self(source).host->text;
    path.nameSpace->text = self(source).nameSpace->text;
    return call.done();
}

const CMPIObjectPathFT pathTable = {
    CMPIVersion200,
    &releaseObject<CMPIObjectPath>,
    Unsupported<"path.clone">(),
    &setNameSpace,
    &getNameSpace,
    &setHostname,
    &getHostname,
    &setClassName,
    &getClassName,
    &addKey,
    &getKey,
    &getKeyAt,
    &getKeyCount,
    &setNameSpaceFromObjectPath,
    &setHostAndNameSpaceFromObjectPath,
    Unsupported<"path.getClassQualifier">(),
    Unsupported<"path.getPropertyQualifier">(),
    Unsupported<"path.getMethodQualifier">(),
    Unsupported<"path.getParameterQualifier">(),
    Unsupported<"path.toString">(),
};

/* Instances */

CMPIData getProperty(const CMPIInstance* object, const char* name, CMPIStatus* status) {
    Instance& instance = self(object);
    Call call = callOn(instance, "getProperty", name);
    return deliver(call, status, instance.properties, name, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

CMPIData getPropertyAt(const CMPIInstance* object, CMPICount index, CMPIString** name, CMPIStatus* status) {
    Instance& instance = self(object);
    Call call = callOn(instance, "getPropertyAt", shown(index));
    return deliverAt(call, status, *instance.broker, instance.properties, index, name);
}

CMPICount getPropertyCount(const CMPIInstance* object, CMPIStatus* status) {
    Instance& instance = self(object);
    Call call = callOn(instance, "getPropertyCount", "");
    const auto count = static_cast<CMPICount>(instance.properties.size());
    call.done(shown(count), status);
    return count;
}

bool contains(const Lines& names, const std::string& name) {
    return std::any_of(names.begin(), names.end(), [&](const std::string& each) { return sameName(each, name); });
}

CMPIStatus setProperty(const CMPIInstance* object, const char* name, const CMPIValue* value, CMPIType type) {
    Instance& instance = self(object);
    const CMPIData data = plainData(value, type);
    Call call = callOn(instance, "setProperty", std::string(name) + ", " + shownType(type) + ", " + shown(data));
    if (data.state == CMPI_goodValue && (type & CMPI_ARRAY) != 0 &&
        self(data.value.array).type != (type & ~CMPI_ARRAY)) {
        return call.done(CMPI_RC_ERR_TYPE_MISMATCH);
    }
    const bool isKey = contains(instance.keys, name);
    if (!instance.filtered || isKey || contains(instance.wanted, name)) {
        put(instance.properties, name, instance.broker->objects().stored(instance.name, name, data));
    }
    if (isKey || contains(instance.broker->keyProperties[instance.path->className->text], name)) {
        put(instance.path->keys, name, instance.broker->objects().stored(instance.path->name, name, data));
    }
    return call.done();
}

CMPIObjectPath* getObjectPath(const CMPIInstance* object, CMPIStatus* status) {
    Instance& instance = self(object);
    Call call = callOn(instance, "getObjectPath", "");
    return deliver<CMPIObjectPath>(call, status, [&] { return instance.path; });
}

Lines namesOf(const char** names) {
    Lines result;
    while (names != nullptr && *names != nullptr) {
        result.emplace_back(*names++);
    }
    return result;
}

CMPIStatus setPropertyFilter(const CMPIInstance* object, const char** properties, const char** keys) {
    Instance& instance = self(object);
    Call call = callOn(instance, "setPropertyFilter", shown(properties) + ", " + shown(keys));
    instance.filtered = properties != nullptr;
    instance.wanted = namesOf(properties);
    instance.keys = namesOf(keys);
    return call.done();
}

const CMPIInstanceFT instanceTable = {
    CMPIVersion200,
    &releaseObject<CMPIInstance>,
    Unsupported<"instance.clone">(),
    &getProperty,
    &getPropertyAt,
    &getPropertyCount,
    &setProperty,
    &getObjectPath,
    &setPropertyFilter,
    Unsupported<"instance.setObjectPath">(),
    Unsupported<"instance.setPropertyWithOrigin">(),
};

/* Arguments */

CMPIStatus addArg(const CMPIArgs* object, const char* name, const CMPIValue* value, CMPIType type) {
    Args& args = self(object);
    const CMPIData data = plainData(value, type);
    Call call = callOn(args, "addArg", std::string(name) + ", " + shownType(type) + ", " + shown(data));
    put(args.arguments, name, args.broker->objects().stored(args.name, name, data));
    return call.done();
}

CMPIData getArg(const CMPIArgs* object, const char* name, CMPIStatus* status) {
    Args& args = self(object);
    Call call = callOn(args, "getArg", name);
    return deliver(call, status, args.arguments, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPIData getArgAt(const CMPIArgs* object, CMPICount index, CMPIString** name, CMPIStatus* status) {
    Args& args = self(object);
    Call call = callOn(args, "getArgAt", shown(index));
    return deliverAt(call, status, *args.broker, args.arguments, index, name);
}

CMPICount getArgCount(const CMPIArgs* object, CMPIStatus* status) {
    Args& args = self(object);
    Call call = callOn(args, "getArgCount", "");
    const auto count = static_cast<CMPICount>(args.arguments.size());
    call.done(shown(count), status);
    return count;
}

const CMPIArgsFT argsTable = {
    CMPIVersion200, &releaseObject<CMPIArgs>, Unsupported<"args.clone">(), &addArg, &getArg, &getArgAt, &getArgCount};

/* Arrays */

CMPICount getSize(const CMPIArray* object, CMPIStatus* status) {
    Array& array = self(object);
    Call call = callOn(array, "getSize", "");
    const auto size = static_cast<CMPICount>(array.elements.size());
    call.done(shown(size), status);
    return size;
}

CMPIType getSimpleType(const CMPIArray* object, CMPIStatus* status) {
    Array& array = self(object);
    Call call = callOn(array, "getSimpleType", "");
    call.done(shownType(array.type), status);
    return array.type;
}

CMPIData getElementAt(const CMPIArray* object, CMPICount index, CMPIStatus* status) {
    Array& array = self(object);
    Call call = callOn(array, "getElementAt", shown(index));
    const bool exists = index < array.elements.size();
    const CMPIData data = exists ? array.elements[index] : nullValue(CMPI_null);
    call.done(shown(data), status, exists ? CMPI_RC_OK : CMPI_RC_ERR_NO_SUCH_PROPERTY);
    return data;
}

CMPIStatus setElementAt(const CMPIArray* object, CMPICount index, const CMPIValue* value, CMPIType type) {
    Array& array = self(object);
    const CMPIData data = plainData(value, type);
    Call call = callOn(array, "setElementAt", shown(index) + ", " + shownType(type) + ", " + shown(data));
    if (type != array.type && type != CMPI_null) {
        return call.done(CMPI_RC_ERR_TYPE_MISMATCH);
    }
    if (index >= array.elements.size()) {
        return call.done(CMPI_RC_ERR_NO_SUCH_PROPERTY);
    }
    array.elements[index] = array.broker->objects().stored(array.name, "element", data);
    return call.done();
}

const CMPIArrayFT arrayTable = {
    CMPIVersion200, &releaseObject<CMPIArray>, Unsupported<"array.clone">(), &getSize, &getSimpleType, &getElementAt,
    &setElementAt};

/* Enumerations */

CMPIData getNext(const CMPIEnumeration* object, CMPIStatus* status) {
    Enumeration& enumeration = self(object);
    Call call = callOn(enumeration, "getNext", "");
    const bool exists =
        enumeration.position < enumeration.elements.size() && call.fault().object == Fault::Object::usual;
    const CMPIData data = exists ? enumeration.elements[enumeration.position++] : nullValue(CMPI_null);
    call.done(shown(data), status, exists ? CMPI_RC_OK : CMPI_RC_ERR_NOT_FOUND);
    return data;
}

CMPIBoolean hasNext(const CMPIEnumeration* object, CMPIStatus* status) {
    Enumeration& enumeration = self(object);
    Call call = readingOf(enumeration, "hasNext");
    const bool exists = enumeration.position < enumeration.elements.size();
    call.done(exists ? "true" : "false", status);
    return static_cast<CMPIBoolean>(exists);
}

const CMPIEnumerationFT enumerationTable = {
    CMPIVersion200, &releaseObject<CMPIEnumeration>,     Unsupported<"enumeration.clone">(), &getNext,
    &hasNext,       Unsupported<"enumeration.toArray">()};

/* Date and time, context */

const CMPIDateTimeFT dateTimeTable = {CMPIVersion200,
                                      &releaseObject<CMPIDateTime>,
                                      Unsupported<"dateTime.clone">(),
                                      Unsupported<"dateTime.getBinaryFormat">(),
                                      Unsupported<"dateTime.getStringFormat">(),
                                      Unsupported<"dateTime.isInterval">()};

const CMPIContextFT contextTable = {CMPIVersion200,
                                    &releaseObject<CMPIContext>,
                                    Unsupported<"context.clone">(),
                                    Unsupported<"context.getEntry">(),
                                    Unsupported<"context.getEntryAt">(),
                                    Unsupported<"context.getEntryCount">(),
                                    Unsupported<"context.addEntry">()};

/* Results */

CMPIStatus returnData(const CMPIResult* object, const CMPIValue* value, CMPIType type) {
    Result& result = self(object);
    const CMPIData data = plainData(value, type);
    Call call = callOn(result, "returnData", shownType(type) + ", " + shown(data));
    result.returned.data.push_back(result.broker->objects().stored(result.name, "data", data));
    return call.done();
}

CMPIStatus returnInstance(const CMPIResult* object, const CMPIInstance* instance) {
    Result& result = self(object);
    Call call = callOn(result, "returnInstance", shown(instance));
    result.returned.instances.push_back(instance);
    return call.done();
}

CMPIStatus returnObjectPath(const CMPIResult* object, const CMPIObjectPath* path) {
    Result& result = self(object);
    Call call = callOn(result, "returnObjectPath", shown(path));
    result.returned.paths.push_back(path);
    return call.done();
}

CMPIStatus returnDone(const CMPIResult* object) {
    Result& result = self(object);
    Call call = callOn(result, "returnDone", "");
    ++result.returned.closed;
    return call.done();
}

const CMPIResultFT resultTable = {CMPIVersion200,
                                  &releaseObject<CMPIResult>,
                                  Unsupported<"result.clone">(),
                                  &returnData,
                                  &returnInstance,
                                  &returnObjectPath,
                                  &returnDone,
                                  Unsupported<"result.returnError">()};

/* The broker: new objects */

Call callOn(const CMPIBroker* broker, const char* slot, const std::string& arguments) {
    RecordingBroker& recording = self(broker);
    return {recording, recording.objects().name, slot, arguments};
}

CMPIInstance* newInstance(const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* status) {
    Call call = callOn(broker, "newInstance", shown(path));
    if (path == nullptr) {
        call.done("null", status, CMPI_RC_ERR_INVALID_PARAMETER);
        return nullptr;
    }
    return deliver<CMPIInstance>(call, status, [&] {
        return self(broker).objects().newInstance(Transcript::instance().nextName("instance"), path);
    });
}

CMPIObjectPath* newObjectPath(const CMPIBroker* broker, const char* nameSpace, const char* className,
                              CMPIStatus* status) {
    Call call = callOn(broker, "newObjectPath", shown(nameSpace) + ", " + shown(className));
    return deliver<CMPIObjectPath>(call, status, [&] {
        return self(broker).objects().newPath(Transcript::instance().nextName("path"), nameSpace, className);
    });
}

CMPIArgs* newArgs(const CMPIBroker* broker, CMPIStatus* status) {
    Call call = callOn(broker, "newArgs", "");
    return deliver<CMPIArgs>(call, status, [&] { return self(broker).args(Transcript::instance().nextName("args")); });
}

CMPIString* newString(const CMPIBroker* broker, const char* text, CMPIStatus* status) {
    Call call = callOn(broker, "newString", shown(text));
    return deliver<CMPIString>(call, status, [&] {
        return self(broker).objects().newString(Transcript::instance().nextName("string"), text);
    });
}

CMPIArray* newArray(const CMPIBroker* broker, CMPICount size, CMPIType type, CMPIStatus* status) {
    Call call = callOn(broker, "newArray", shown(size) + ", " + shownType(type));
    return deliver<CMPIArray>(call, status, [&] {
        RecordingBroker::Objects& objects = self(broker).objects();
        Array* array = objects.keep(objects.arrays, arrayTable, Transcript::instance().nextName("array"));
        array->type = type;
        array->elements.assign(size, nullValue(type));
        return array;
    });
}

CMPIBoolean classPathIsA(const CMPIBroker* broker, const CMPIObjectPath* path, const char* type, CMPIStatus* status) {
    Call call = callOn(broker, "classPathIsA", shown(path) + ", " + shown(type));
    const bool result = sameName(self(path).className->text, type);
    call.done(result ? "true" : "false", status);
    return static_cast<CMPIBoolean>(result);
}

CMPIStatus logMessage(const CMPIBroker* broker, CMPISeverity severity, const char* id, const char* text,
                      const CMPIString* string) {
    return callOn(broker, "logMessage", shownAll(severity, id, text, string)).done();
}

CMPIStatus traceMessage(const CMPIBroker* broker, CMPILevel level, const char* component, const char* text,
                        const CMPIString* string) {
    return callOn(broker, "trace", shownAll(level, component, text, string)).done();
}

const CMPIBrokerEncFT encapsulatedTable = {
    CMPIVersion200,
    &newInstance,
    &newObjectPath,
    &newArgs,
    &newString,
    &newArray,
    Unsupported<"newDateTime">(),
    Unsupported<"newDateTimeFromBinary">(),
    Unsupported<"newDateTimeFromChars">(),
    Unsupported<"newSelectExp">(),
    &classPathIsA,
    Unsupported<"toString">(),
    Unsupported<"isOfType">(),
    Unsupported<"getType">(),
    Unsupported<"getMessage">(),
    &logMessage,
    &traceMessage,
    Unsupported<"newCMPIError">(),
    Unsupported<"openMessageFile">(),
    Unsupported<"closeMessageFile">(),
    Unsupported<"getMessage2">(),
};

/* The broker: up-calls */

template <typename Object>
CMPIEnumeration* enumerate(Call& call, const CMPIBroker* broker, const CMPIObjectPath* path, CMPIType type,
                           const std::map<std::string, std::vector<Object*>>& script, CMPIStatus* status) {
    return deliver<CMPIEnumeration>(call, status, [&] {
        std::vector<CMPIData> elements;
        const auto found = script.find(self(path).className->text);
        if (found != script.end()) {
            for (Object* object : found->second) {
                CMPIData element = nullValue(type);
                element.state = CMPI_goodValue;
                element.value.dataPtr.ptr = object;
                elements.push_back(element);
            }
        }
        return self(broker).objects().newEnumeration(std::move(elements));
    });
}

CMPIEnumeration* enumerateInstanceNames(const CMPIBroker* broker, const CMPIContext* context,
                                        const CMPIObjectPath* path, CMPIStatus* status) {
    Call call = callOn(broker, "enumerateInstanceNames", shownAll(context, path));
    return enumerate(call, broker, path, CMPI_ref, self(broker).instanceNames, status);
}

CMPIEnumeration* enumerateInstances(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                    const char** properties, CMPIStatus* status) {
    Call call = callOn(broker, "enumerateInstances", shownAll(context, path, properties));
    return enumerate(call, broker, path, CMPI_instance, self(broker).instances, status);
}

const CMPIBrokerFT upCallTable = {
    CMPI_MB_BasicRead,
    CMPIVersion200,
    "recording broker",
    Unsupported<"prepareAttachThread">(),
    Unsupported<"attachThread">(),
    Unsupported<"detachThread">(),
    Unsupported<"deliverIndication">(),
    &enumerateInstanceNames,
    Unsupported<"getInstance">(),
    Unsupported<"createInstance">(),
    Unsupported<"modifyInstance">(),
    Unsupported<"deleteInstance">(),
    Unsupported<"execQuery">(),
    &enumerateInstances,
    Unsupported<"associators">(),
    Unsupported<"associatorNames">(),
    Unsupported<"references">(),
    Unsupported<"referenceNames">(),
    Unsupported<"invokeMethod">(),
    Unsupported<"setProperty">(),
    Unsupported<"getProperty">(),
};

/* The broker: operating system and memory */

const CMPIBrokerExtFT systemTable = {
    CMPIVersion200,
    Unsupported<"resolveFileName">(),
    Unsupported<"newThread">(),
    Unsupported<"joinThread">(),
    Unsupported<"exitThread">(),
    Unsupported<"cancelThread">(),
    Unsupported<"threadSleep">(),
    Unsupported<"threadOnce">(),
    Unsupported<"createThreadKey">(),
    Unsupported<"destroyThreadKey">(),
    Unsupported<"getThreadSpecific">(),
    Unsupported<"setThreadSpecific">(),
    Unsupported<"newMutex">(),
    Unsupported<"destroyMutex">(),
    Unsupported<"lockMutex">(),
    Unsupported<"unlockMutex">(),
    Unsupported<"newCondition">(),
    Unsupported<"destroyCondition">(),
    Unsupported<"condWait">(),
    Unsupported<"timedCondWait">(),
    Unsupported<"signalCondition">(),
};

const CMPIBrokerMemFT memoryTable = {
    CMPIVersion200,
    Unsupported<"mark">(),
    Unsupported<"release">(),
    Unsupported<"cmpiMalloc">(),
    Unsupported<"cmpiCalloc">(),
    Unsupported<"cmpiRealloc">(),
    Unsupported<"cmpiStrDup">(),
    Unsupported<"cmpiFree">(),
    Unsupported<"freeInstance">(),
    Unsupported<"freeObjectPath">(),
    Unsupported<"freeArgs">(),
    Unsupported<"freeString">(),
    Unsupported<"freeArray">(),
    Unsupported<"freeDateTime">(),
    Unsupported<"freeSelectExp">(),
};

} // namespace

String* RecordingBroker::Objects::newString(const std::string& objectName, const char* text) {
    String* string = keep(strings, stringTable, objectName);
    string->text = text == nullptr ? "" : text;
    return string;
}

Path* RecordingBroker::Objects::newPath(const std::string& objectName, const char* nameSpace, const char* className) {
    Path* path = keep(paths, pathTable, objectName);
    path->nameSpace = newString(objectName + ".namespace", nameSpace);
    path->host = newString(objectName + ".host", "");
    path->className = newString(objectName + ".class", className);
    return path;
}

Instance* RecordingBroker::Objects::newInstance(const std::string& objectName, const CMPIObjectPath* path) {
    Instance* instance = keep(instances, instanceTable, objectName);
    const Path& source = self(path);
    instance->path = newPath(objectName + ".path", source.nameSpace->text.c_str(), source.className->text.c_str());
    instance->path->host->text = source.host->text;
    instance->path->keys = source.keys;
    return instance;
}

Enumeration* RecordingBroker::Objects::newEnumeration(std::vector<CMPIData> elements) {
    Enumeration* enumeration = keep(enumerations, enumerationTable, Transcript::instance().nextName("enumeration"));
    enumeration->elements = std::move(elements);
    return enumeration;
}

CMPIData RecordingBroker::Objects::stored(const std::string& owner, const char* entry, CMPIData data) {
    if (data.type == CMPI_chars) {
        const bool isNull = (data.state & CMPI_nullValue) != 0;
        data.type = CMPI_string;
        data.value.string = isNull ? nullptr : newString(owner + '.' + entry, data.value.chars);
    }
    return data;
}

RecordingBroker::RecordingBroker(const std::string& name)
    : CMPIBroker{nullptr, &upCallTable, &encapsulatedTable, &systemTable, &memoryTable},
      _objects(new Objects{.broker = this, .name = name}) {
    hdl = _objects.get();
    Transcript::instance().name(this, name);
}

RecordingBroker::~RecordingBroker() {
    const auto forget = [](const auto& objects) {
        for (const auto& object : objects) {
            Transcript::instance().forget(&object);
        }
    };
    forget(_objects->strings);
    forget(_objects->paths);
    forget(_objects->instances);
    forget(_objects->arrays);
    forget(_objects->args);
    forget(_objects->enumerations);
    forget(_objects->dateTimes);
    forget(_objects->contexts);
    forget(_objects->results);
    Transcript::instance().forget(this);
}

CMPIContext* RecordingBroker::context(const std::string& name) {
    return _objects->keep(_objects->contexts, contextTable, name);
}

CMPIResult* RecordingBroker::result(const std::string& name) {
    return _objects->keep(_objects->results, resultTable, name);
}

const RecordingBroker::Returned& RecordingBroker::returned(const CMPIResult* result) {
    return self(result).returned;
}

CMPIObjectPath* RecordingBroker::path(const std::string& name, const std::string& nameSpace,
                                      const std::string& className,
                                      const std::vector<std::pair<std::string, std::string>>& keys) {
    Path* path = _objects->newPath(name, nameSpace.c_str(), className.c_str());
    for (const auto& [key, value] : keys) {
        std::string keyName = name;
        keyName.append(".").append(key);
        setKey(path, key, stringValue(string(keyName, value)));
    }
    return path;
}

CMPIInstance* RecordingBroker::instance(const std::string& name, const CMPIObjectPath* path) {
    return _objects->newInstance(name, path);
}

CMPIObjectPath* RecordingBroker::pathCalled(const std::string& name) {
    const auto found = std::find_if(_objects->paths.rbegin(), _objects->paths.rend(),
                                    [&](const Path& path) { return path.name == name; });
    if (found != _objects->paths.rend()) {
        return &*found;
    }
    throw std::out_of_range("the broker has no path called " + name);
}

CMPIString* RecordingBroker::string(const std::string& name, const std::string& text) {
    return _objects->newString(name, text.c_str());
}

CMPIDateTime* RecordingBroker::dateTime(const std::string& name) {
    return _objects->keep(_objects->dateTimes, dateTimeTable, name);
}

CMPIArgs* RecordingBroker::args(const std::string& name) {
    return _objects->keep(_objects->args, argsTable, name);
}

void RecordingBroker::setKey(CMPIObjectPath* path, const std::string& key, const CMPIData& data) {
    put(self(path).keys, key, data);
}

void RecordingBroker::setArg(CMPIArgs* args, const std::string& argument, const CMPIData& data) {
    put(self(args).arguments, argument, data);
}

CMPIData nullValue(CMPIType type) {
    CMPIData data = {};
    data.type = type;
    data.state = CMPI_nullValue;
    return data;
}

CMPIData uint16Value(CMPIUint16 value) {
    CMPIData data = nullValue(CMPI_uint16);
    data.state = CMPI_goodValue;
    data.value.uint16 = value;
    return data;
}

CMPIData referenceValue(CMPIObjectPath* path) {
    CMPIData data = nullValue(CMPI_ref);
    data.state = CMPI_goodValue;
    data.value.ref = path;
    return data;
}

CMPIData dateTimeValue(CMPIDateTime* dateTime) {
    CMPIData data = nullValue(CMPI_dateTime);
    data.state = CMPI_goodValue;
    data.value.dateTime = dateTime;
    return data;
}

CMPIData stringValue(CMPIString* string) {
    CMPIData data = nullValue(CMPI_string);
    data.state = CMPI_goodValue;
    data.value.string = string;
    return data;
}

} // namespace OrvTest

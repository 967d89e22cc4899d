#include "broker.h"

#include "cmpimacs.h"

#include <pthread.h>
#include <stdarg.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <strings.h>

/* Memory of the running request */

struct Block {
    struct Block* next;
    /* Aligns the memory behind the head for every type. */
    max_align_t start[];
};

static _Thread_local struct Block* blocks;

static void* make(size_t size) {
    struct Block* block = calloc(1, sizeof *block + size);
    if (block == NULL) {
        abort();
    }
    block->next = blocks;
    blocks = block;
    return block->start;
}

static char* copyOf(const char* text) {
    return text == NULL ? NULL : strcpy(make(strlen(text) + 1), text);
}

void beginRequest(void) {
    if (blocks != NULL) {
        abort();
    }
}

void endRequest(void) {
    while (blocks != NULL) {
        struct Block* next = blocks->next;
        free(blocks);
        blocks = next;
    }
}

/* Objects. Each object begins with the handle that CMPI passes round. */

enum { maxEntries = 32 };

struct Entry {
    char* name;
    CMPIData data;
};

/* A list of values, with or without names: keys, properties, arguments or elements. */
struct Values {
    struct Entry entries[maxEntries];
    CMPICount count;
};

struct Path {
    CMPIObjectPath object;
    const CMPIBroker* broker;
    char* nameSpace;
    char* host;
    char* className;
    struct Values keys;
};

struct Instance {
    CMPIInstance object;
    struct Path* path;
    struct Values properties;
};

struct Arguments {
    CMPIArgs object;
    struct Values values;
};

struct Array {
    CMPIArray object;
    const CMPIBroker* broker;
    CMPIType type;
    struct Values elements;
};

struct Enumeration {
    CMPIEnumeration object;
    CMPIData elements[maxEntries];
    size_t count;
    size_t position;
};

struct Result {
    CMPIResult object;
    char text[16384];
    size_t length;
    int closed;
    CMPIObjectPath* paths[maxEntries];
    size_t pathCount;
    CMPIInstance* instances[maxEntries];
    size_t instanceCount;
};

/* A broker, and the function tables of the objects that it makes. Behind each table lie the slots of later versions. */

enum { laterSlots = 4, maxBrokers = 2 };

#define LATER_TABLE(type, name)                                                                                        \
    struct {                                                                                                           \
        type known;                                                                                                    \
        void (*later[laterSlots])(void);                                                                               \
    } name

struct Broker {
    CMPIBroker broker;
    UpCall* names;
    UpCall* instances;
    LATER_TABLE(CMPIBrokerFT, services);
    LATER_TABLE(CMPIBrokerEncFT, factories);
    LATER_TABLE(CMPIContextFT, context);
    LATER_TABLE(CMPIResultFT, result);
    LATER_TABLE(CMPIObjectPathFT, path);
    LATER_TABLE(CMPIInstanceFT, instance);
    LATER_TABLE(CMPIStringFT, string);
    LATER_TABLE(CMPIArrayFT, array);
    LATER_TABLE(CMPIArgsFT, arguments);
    LATER_TABLE(CMPIEnumerationFT, enumeration);
};

static const struct Broker* tablesOf(const CMPIBroker* broker) {
    return broker->hdl;
}

/* Values */

static void ok(CMPIStatus* status) {
    CMSetStatus(status, CMPI_RC_OK);
}

static const CMPIStatus fine = {CMPI_RC_OK, NULL};

static CMPIString* newString(const CMPIBroker* broker, const char* text, CMPIStatus* status) {
    CMPIString* string = make(sizeof *string);
    string->hdl = copyOf(text);
    string->ft = &tablesOf(broker)->string.known;
    ok(status);
    return string;
}

/* Copies a whole CMPIValue, as some object managers do: a provider must not pass a pointer to anything smaller. */
static CMPIData dataOf(const CMPIBroker* broker, const CMPIValue* value, CMPIType type) {
    CMPIData data = {type, CMPI_goodValue, {0}};
    if (type == CMPI_chars) {
        data.type = CMPI_string;
        data.value.string = newString(broker, (const char*)value, NULL);
    } else {
        data.value = *value;
    }
    return data;
}

static void put(struct Values* values, const CMPIBroker* broker, const char* name, const CMPIValue* value,
                CMPIType type) {
    CMPICount i = 0;
    while (i < values->count && strcasecmp(values->entries[i].name, name) != 0) {
        ++i;
    }
    if (i == maxEntries) {
        abort();
    }
    if (i == values->count) {
        values->entries[values->count++].name = copyOf(name);
    }
    values->entries[i].data = dataOf(broker, value, type);
}

static CMPIData get(const struct Values* values, const char* name, CMPIStatus* status) {
    for (CMPICount i = 0; i < values->count; ++i) {
        if (strcasecmp(values->entries[i].name, name) == 0) {
            ok(status);
            return values->entries[i].data;
        }
    }
    CMSetStatus(status, CMPI_RC_ERR_NOT_FOUND);
    return (CMPIData){CMPI_null, CMPI_notFound | CMPI_nullValue, {0}};
}

/* Texts of returned objects and values */

static void append(struct Result* result, const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    const int length =
        vsnprintf(result->text + result->length, sizeof result->text - result->length, format, arguments);
    va_end(arguments);
    if (length < 0 || (size_t)length >= sizeof result->text - result->length) {
        abort();
    }
    result->length += (size_t)length;
}

static void appendPath(struct Result* result, const struct Path* path);

static void appendData(struct Result* result, const CMPIData* data) {
    switch (data->type) {
    case CMPI_uint16:
        append(result, "%u", (unsigned int)data->value.uint16);
        break;
    case CMPI_uint32:
        append(result, "%u", data->value.uint32);
        break;
    case CMPI_string:
        append(result, "\"%s\"", (const char*)data->value.string->hdl);
        break;
    case CMPI_ref:
        appendPath(result, data->value.ref->hdl);
        break;
    case CMPI_uint16A:
    case CMPI_stringA: {
        const struct Array* array = data->value.array->hdl;
        for (CMPICount i = 0; i < array->elements.count; ++i) {
            append(result, i == 0 ? "{" : " ");
            appendData(result, &array->elements.entries[i].data);
        }
        append(result, "}");
        break;
    }
    default:
        abort();
    }
}

static void appendValues(struct Result* result, const struct Values* values) {
    for (CMPICount i = 0; i < values->count; ++i) {
        append(result, " %s=", values->entries[i].name);
        appendData(result, &values->entries[i].data);
    }
}

static void appendPath(struct Result* result, const struct Path* path) {
    append(result, "//%s/%s:%s(", path->host == NULL ? "" : path->host, path->nameSpace, path->className);
    appendValues(result, &path->keys);
    append(result, " )");
}

/* Slots: paths */

static CMPIObjectPath* newObjectPath(const CMPIBroker* broker, const char* nameSpace, const char* className,
                                     CMPIStatus* status) {
    struct Path* path = make(sizeof *path);
    path->object.hdl = path;
    path->object.ft = &tablesOf(broker)->path.known;
    path->broker = broker;
    path->nameSpace = copyOf(nameSpace);
    path->className = copyOf(className);
    ok(status);
    return &path->object;
}

static struct Path* pathOf(const CMPIObjectPath* object) {
    return (struct Path*)object->hdl;
}

static CMPIStatus releasePath(CMPIObjectPath* object) {
    object->hdl = NULL;
    return fine;
}

static CMPIStatus setNameSpace(const CMPIObjectPath* object, const char* nameSpace) {
    pathOf(object)->nameSpace = copyOf(nameSpace);
    return fine;
}

static CMPIString* getNameSpace(const CMPIObjectPath* object, CMPIStatus* status) {
    return newString(pathOf(object)->broker, pathOf(object)->nameSpace, status);
}

static CMPIStatus setHostname(const CMPIObjectPath* object, const char* host) {
    pathOf(object)->host = copyOf(host);
    return fine;
}

static CMPIString* getHostname(const CMPIObjectPath* object, CMPIStatus* status) {
    return newString(pathOf(object)->broker, pathOf(object)->host, status);
}

static CMPIString* getClassName(const CMPIObjectPath* object, CMPIStatus* status) {
    return newString(pathOf(object)->broker, pathOf(object)->className, status);
}

static CMPIStatus addKey(const CMPIObjectPath* object, const char* name, const CMPIValue* value, const CMPIType type) {
    put(&pathOf(object)->keys, pathOf(object)->broker, name, value, type);
    return fine;
}

static CMPIData getKey(const CMPIObjectPath* object, const char* name, CMPIStatus* status) {
    return get(&pathOf(object)->keys, name, status);
}

static CMPIData getKeyAt(const CMPIObjectPath* object, CMPICount index, CMPIString** name, CMPIStatus* status) {
    const struct Values* keys = &pathOf(object)->keys;
    if (index >= keys->count) {
        CMSetStatus(status, CMPI_RC_ERR_NO_SUCH_PROPERTY);
        return (CMPIData){CMPI_null, CMPI_notFound | CMPI_nullValue, {0}};
    }
    if (name != NULL) {
        *name = newString(pathOf(object)->broker, keys->entries[index].name, NULL);
    }
    ok(status);
    return keys->entries[index].data;
}

static CMPICount getKeyCount(const CMPIObjectPath* object, CMPIStatus* status) {
    ok(status);
    return pathOf(object)->keys.count;
}

/* Slots: instances, arrays, strings, arguments, enumerations */

static CMPIInstance* newInstance(const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* status) {
    struct Instance* instance = make(sizeof *instance);
    instance->object.hdl = instance;
    instance->object.ft = &tablesOf(broker)->instance.known;
    instance->path = make(sizeof *instance->path);
    *instance->path = *pathOf(path);
    instance->path->object.hdl = instance->path;
    ok(status);
    return &instance->object;
}

static CMPIStatus setProperty(const CMPIInstance* object, const char* name, const CMPIValue* value, CMPIType type) {
    struct Instance* instance = (struct Instance*)object->hdl;
    put(&instance->properties, instance->path->broker, name, value, type);
    /* The references of an association are its keys. */
    if (type == CMPI_ref) {
        put(&instance->path->keys, instance->path->broker, name, value, type);
    }
    return fine;
}

static CMPIData getProperty(const CMPIInstance* object, const char* name, CMPIStatus* status) {
    return get(&((const struct Instance*)object->hdl)->properties, name, status);
}

/* Ignores the filter: the host asks for all properties. */
static CMPIStatus setPropertyFilter(const CMPIInstance* object, const char** properties, const char** keys) {
    (void)object, (void)properties, (void)keys;
    return fine;
}

static CMPIObjectPath* getObjectPath(const CMPIInstance* object, CMPIStatus* status) {
    ok(status);
    return &((const struct Instance*)object->hdl)->path->object;
}

static CMPIArray* newArray(const CMPIBroker* broker, CMPICount size, CMPIType type, CMPIStatus* status) {
    struct Array* array = make(sizeof *array);
    array->object.hdl = array;
    array->broker = broker;
    array->type = type;
    array->object.ft = &tablesOf(broker)->array.known;
    if (size > maxEntries) {
        abort();
    }
    array->elements.count = size;
    ok(status);
    return &array->object;
}

static CMPIStatus setElementAt(const CMPIArray* object, CMPICount index, const CMPIValue* value, CMPIType type) {
    struct Array* array = (struct Array*)object->hdl;
    if (index >= array->elements.count || type != array->type) {
        abort();
    }
    array->elements.entries[index].data = dataOf(array->broker, value, type);
    return fine;
}

static const char* getCharPtr(const CMPIString* string, CMPIStatus* status) {
    ok(status);
    return string->hdl;
}

static CMPIStatus addArg(const CMPIArgs* object, const char* name, const CMPIValue* value, const CMPIType type) {
    struct Arguments* arguments = (struct Arguments*)object->hdl;
    put(&arguments->values, NULL, name, value, type);
    return fine;
}

static CMPIData getArg(const CMPIArgs* object, const char* name, CMPIStatus* status) {
    return get(&((const struct Arguments*)object->hdl)->values, name, status);
}

static CMPIData getNext(const CMPIEnumeration* object, CMPIStatus* status) {
    struct Enumeration* enumeration = (struct Enumeration*)object->hdl;
    ok(status);
    return enumeration->elements[enumeration->position++];
}

static CMPIBoolean hasNext(const CMPIEnumeration* object, CMPIStatus* status) {
    const struct Enumeration* enumeration = object->hdl;
    ok(status);
    return enumeration->position < enumeration->count;
}

static struct Result* resultOf(const CMPIResult* object) {
    return (struct Result*)object->hdl;
}

/* The result of an up-call, which is one of its own; it is empty if the broker has no up-call. */
static const struct Result* answerOf(const CMPIBroker* broker, UpCall* upCall, const CMPIContext* context,
                                     const CMPIObjectPath* classPath, CMPIStatus* status) {
    CMPIResult* result = newResult(broker);
    *status = upCall == NULL ? fine : upCall(broker, context, classPath, result);
    return resultOf(result);
}

static struct Enumeration* newEnumeration(const CMPIBroker* broker, size_t count) {
    struct Enumeration* enumeration = make(sizeof *enumeration);
    enumeration->object.hdl = enumeration;
    enumeration->object.ft = &tablesOf(broker)->enumeration.known;
    enumeration->count = count;
    return enumeration;
}

static CMPIEnumeration* enumerateInstanceNames(const CMPIBroker* broker, const CMPIContext* context,
                                               const CMPIObjectPath* classPath, CMPIStatus* status) {
    const struct Result* answer = answerOf(broker, tablesOf(broker)->names, context, classPath, status);
    struct Enumeration* enumeration = newEnumeration(broker, answer->pathCount);
    for (size_t i = 0; i < answer->pathCount; ++i) {
        enumeration->elements[i] = (CMPIData){CMPI_ref, CMPI_goodValue, {.ref = answer->paths[i]}};
    }
    return &enumeration->object;
}

static CMPIEnumeration* enumerateInstances(const CMPIBroker* broker, const CMPIContext* context,
                                           const CMPIObjectPath* classPath, const char** properties,
                                           CMPIStatus* status) {
    (void)properties;
    const struct Result* answer = answerOf(broker, tablesOf(broker)->instances, context, classPath, status);
    struct Enumeration* enumeration = newEnumeration(broker, answer->instanceCount);
    for (size_t i = 0; i < answer->instanceCount; ++i) {
        enumeration->elements[i] = (CMPIData){CMPI_instance, CMPI_goodValue, {.inst = answer->instances[i]}};
    }
    return &enumeration->object;
}

/* Slots: results */

static CMPIStatus returnObjectPath(const CMPIResult* object, const CMPIObjectPath* path) {
    struct Result* result = resultOf(object);
    appendPath(result, pathOf(path));
    append(result, "\n");
    if (result->pathCount == maxEntries) {
        abort();
    }
    result->paths[result->pathCount++] = &pathOf(path)->object;
    return fine;
}

static CMPIStatus returnInstance(const CMPIResult* object, const CMPIInstance* returned) {
    struct Instance* instance = (struct Instance*)returned->hdl;
    struct Result* result = resultOf(object);
    appendPath(result, instance->path);
    appendValues(result, &instance->properties);
    append(result, "\n");
    if (result->instanceCount == maxEntries) {
        abort();
    }
    result->instances[result->instanceCount++] = &instance->object;
    return fine;
}

static CMPIStatus returnData(const CMPIResult* object, const CMPIValue* value, const CMPIType type) {
    const CMPIData data = dataOf(NULL, value, type);
    appendData(resultOf(object), &data);
    append(resultOf(object), "\n");
    return fine;
}

static CMPIStatus returnDone(const CMPIResult* object) {
    resultOf(object)->closed = 1;
    return fine;
}

/* Objects that the host makes */

CMPIContext* newContext(const CMPIBroker* broker) {
    CMPIContext* context = make(sizeof *context);
    context->hdl = context;
    context->ft = &tablesOf(broker)->context.known;
    return context;
}

CMPIResult* newResult(const CMPIBroker* broker) {
    struct Result* result = make(sizeof *result);
    result->object.hdl = result;
    result->object.ft = &tablesOf(broker)->result.known;
    return &result->object;
}

const char* returnedText(const CMPIResult* result) {
    return resultOf(result)->text;
}

int isClosed(const CMPIResult* result) {
    return resultOf(result)->closed;
}

CMPIObjectPath** returnedPaths(const CMPIResult* result, size_t* count) {
    *count = resultOf(result)->pathCount;
    return resultOf(result)->paths;
}

CMPIArgs* newArguments(const CMPIBroker* broker) {
    struct Arguments* arguments = make(sizeof *arguments);
    arguments->object.hdl = arguments;
    arguments->object.ft = &tablesOf(broker)->arguments.known;
    return &arguments->object;
}

const CMPIBroker* newBroker(enum TableLength length, UpCall* names, UpCall* instances) {
    const CMPIVersion version = length == longerTables ? CMPIVersion210 : CMPIVersion200;
    static struct Broker brokers[maxBrokers];
    static int count;
    if (count == maxBrokers) {
        abort();
    }
    struct Broker* broker = &brokers[count++];
    broker->broker = (CMPIBroker){broker, &broker->services.known, &broker->factories.known, NULL, NULL};
    broker->names = names;
    broker->instances = instances;
    broker->services.known = (CMPIBrokerFT){.brokerCapabilities = CMPI_MB_BasicRead,
                                            .brokerVersion = version,
                                            .brokerName = "host",
                                            .enumerateInstanceNames = enumerateInstanceNames,
                                            .enumerateInstances = enumerateInstances};
    broker->factories.known = (CMPIBrokerEncFT){.ftVersion = version,
                                                .newInstance = newInstance,
                                                .newObjectPath = newObjectPath,
                                                .newString = newString,
                                                .newArray = newArray};
    broker->context.known = (CMPIContextFT){.ftVersion = version};
    broker->result.known = (CMPIResultFT){.ftVersion = version,
                                          .returnData = returnData,
                                          .returnInstance = returnInstance,
                                          .returnObjectPath = returnObjectPath,
                                          .returnDone = returnDone};
    broker->path.known = (CMPIObjectPathFT){.ftVersion = version,
                                            .release = releasePath,
                                            .setNameSpace = setNameSpace,
                                            .getNameSpace = getNameSpace,
                                            .setHostname = setHostname,
                                            .getHostname = getHostname,
                                            .getClassName = getClassName,
                                            .addKey = addKey,
                                            .getKey = getKey,
                                            .getKeyAt = getKeyAt,
                                            .getKeyCount = getKeyCount};
    broker->instance.known = (CMPIInstanceFT){.ftVersion = version,
                                              .getProperty = getProperty,
                                              .setProperty = setProperty,
                                              .getObjectPath = getObjectPath,
                                              .setPropertyFilter = setPropertyFilter};
    broker->string.known = (CMPIStringFT){.ftVersion = version, .getCharPtr = getCharPtr};
    broker->array.known = (CMPIArrayFT){.ftVersion = version, .setElementAt = setElementAt};
    broker->arguments.known = (CMPIArgsFT){.ftVersion = version, .addArg = addArg, .getArg = getArg};
    broker->enumeration.known = (CMPIEnumerationFT){.ftVersion = version, .getNext = getNext, .hasNext = hasNext};
    if (length == longerTables) {
        for (size_t i = 0; i < laterSlots; ++i) {
            broker->services.later[i] = broker->factories.later[i] = broker->context.later[i] =
                broker->result.later[i] = broker->path.later[i] = broker->instance.later[i] = broker->string.later[i] =
                    broker->array.later[i] = broker->arguments.later[i] = broker->enumeration.later[i] = abort;
        }
    }
    return &broker->broker;
}

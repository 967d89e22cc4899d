/* Functions that make objects, and functions that work with objects of every kind. */
#include "broker/Objects.h"

#include "model/DateTime.h"
#include "text/MofText.h"
#include "text/ObjectPathText.h"

#include <chrono>

namespace ObjectManager {

namespace {

/** The greatest number of elements of an array. A provider that asks for more has miscalculated. */
constexpr CMPICount maximumArraySize = 1'000'000;

const Broker* brokerOf(const CMPIBroker* handle, CMPIStatus* rc) {
    setStatus(rc, handle != nullptr ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return handle != nullptr ? static_cast<const Broker*>(handle->hdl) : nullptr;
}

/** The current request, for a new object. @return null, with `rc` set, if the thread has none or `broker` is null. */
Request* factoryRequest(const CMPIBroker* broker, CMPIStatus* rc) {
    return brokerOf(broker, rc) != nullptr ? requestFor(rc) : nullptr;
}

CMPIInstance* newInstance(const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* rc) {
    Request* request = factoryRequest(broker, rc);
    const PathContent* content = request != nullptr ? contentOf(path, rc) : nullptr;
    if (content == nullptr) {
        return nullptr;
    }
    return newObjectOf<CMPIInstance>(*request, {copy(request->memory(), *content), {}, {}, {}, false, false});
}

CMPIObjectPath* newObjectPath(const CMPIBroker* broker, const char* nameSpace, const char* className, CMPIStatus* rc) {
    Request* request = factoryRequest(broker, rc);
    if (request == nullptr) {
        return nullptr;
    }
    if (nameSpace == nullptr || className == nullptr) {
        return failure(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    Memory& memory = request->memory();
    return newObjectOf<CMPIObjectPath>(*request,
                                       {nullptr, copyText(memory, nameSpace), copyText(memory, className), {}, false});
}

CMPIArgs* newArgs(const CMPIBroker* broker, CMPIStatus* rc) {
    Request* request = factoryRequest(broker, rc);
    return request != nullptr ? newObjectOf<CMPIArgs>(*request, {}) : nullptr;
}

CMPIString* newStringSlot(const CMPIBroker* broker, const char* text, CMPIStatus* rc) {
    if (factoryRequest(broker, rc) == nullptr) {
        return nullptr;
    }
    return text != nullptr ? returnedString(text, rc) : failure(rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

/** Whether the elements of an array can have this type. */
bool isElementType(CMPIType type) {
    return scalarSize(type) != 0 || type == CMPI_string || type == CMPI_dateTime || type == CMPI_ref ||
           type == CMPI_instance;
}

CMPIArray* newArray(const CMPIBroker* broker, CMPICount size, CMPIType type, CMPIStatus* rc) {
    Request* request = factoryRequest(broker, rc);
    if (request == nullptr) {
        return nullptr;
    }
    const CMPIType elementType = type == CMPI_chars ? CMPIType{CMPI_string} : type;
    if (!isElementType(elementType)) {
        return failure(rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
    }
    if (size > maximumArraySize) {
        return failure(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    Item* elements = newElements(request->memory(), size);
    std::for_each(elements, elements + size, [&](Item& element) { element.type = elementType; });
    return newObjectOf<CMPIArray>(*request, {elementType, size, elements, type == CMPI_chars});
}

CMPIDateTime* newDateTimeOf(const CMPIBroker* broker, const std::optional<std::string>& text, CMPIStatus* rc) {
    Request* request = factoryRequest(broker, rc);
    if (request == nullptr) {
        return nullptr;
    }
    if (!text) {
        return failure(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    return newObjectOf<CMPIDateTime>(*request, {copyText(request->memory(), *text)});
}

CMPIDateTime* newDateTimeFromBinary(const CMPIBroker* broker, CMPIUint64 microseconds, CMPIBoolean interval,
                                    CMPIStatus* rc) {
    return newDateTimeOf(broker, formatDateTime({microseconds, interval != 0}), rc);
}

CMPIDateTime* newDateTime(const CMPIBroker* broker, CMPIStatus* rc) {
    const auto now = std::chrono::system_clock::now().time_since_epoch();
    const auto microseconds = std::chrono::duration_cast<std::chrono::microseconds>(now).count();
    return newDateTimeFromBinary(broker, static_cast<CMPIUint64>(microseconds), 0, rc);
}

CMPIDateTime* newDateTimeFromChars(const CMPIBroker* broker, const char* text, CMPIStatus* rc) {
    const bool valid = text != nullptr && parseDateTime(text).has_value();
    return newDateTimeOf(broker, valid ? std::optional<std::string>(text) : std::nullopt, rc);
}

CMPISelectExp* newSelectExp(const CMPIBroker* broker, const char*, const char*, CMPIArray**, CMPIStatus* rc) {
    return brokerOf(broker, rc) != nullptr ? failure(rc, CMPI_RC_ERR_NOT_SUPPORTED) : nullptr;
}

CMPIBoolean classPathIsA(const CMPIBroker* handle, const CMPIObjectPath* path, const char* className, CMPIStatus* rc) {
    const Broker* broker = brokerOf(handle, rc);
    const PathContent* content = broker != nullptr ? contentOf(path, rc) : nullptr;
    if (content == nullptr) {
        return 0;
    }
    if (className == nullptr) {
        setStatus(rc, CMPI_RC_ERR_INVALID_PARAMETER);
        return 0;
    }
    const char* name = orEmpty(content->className);
    const bool derived = broker->classes() != nullptr && broker->classes()->isA(name, className);
    return equalNames(name, className) || derived ? 1 : 0;
}

/* The contents of objects as text. */

std::string describeContent(const char& text) {
    return &text;
}
std::string describeContent(const PathContent& path) {
    return formatObjectPath(toModel(path));
}
std::string describeContent(const InstanceContent& instance) {
    return mofInstance(toModel(instance));
}
std::string describeContent(const NamedItemsContent& content) {
    std::string text;
    for (const NamedValue& named : toModel(content.items)) {
        text += (text.empty() ? "" : ", ") + named.name + '=' + mofLiteral(named.value);
    }
    return text;
}
std::string describeContent(const ArrayContent& array) {
    Item item{static_cast<CMPIType>(array.elementType | CMPI_ARRAY), false, array.count, {}};
    item.content.elements = array.elements;
    return mofLiteral(toModel(item));
}
std::string describeContent(const EnumerationContent& enumeration) {
    return describeContent(enumeration.elements);
}
std::string describeContent(const DateTimeContent& dateTime) {
    return dateTime.text;
}
std::string describeContent(const ErrorContent& error) {
    return orEmpty(error.message);
}
std::string describeContent(const Result& result) {
    return result.closed() ? "closed" : "open";
}

CMPIString* toString(const CMPIBroker*, const void* object, CMPIStatus* rc) {
    CMPIString* text = nullptr;
    setStatus(rc, CMPI_RC_ERR_INVALID_HANDLE);
    visitObject(object, [&](const auto* handle) {
        if (const auto* content = contentOf(handle, rc); content != nullptr) {
            text = returnedString(describeContent(*content).c_str(), rc);
        }
    });
    return text;
}

template <typename Handle>
const char* kindName(const Handle*) {
    return Kind<Handle>::name;
}

CMPIBoolean isOfType(const CMPIBroker*, const void* object, const char* type, CMPIStatus* rc) {
    if (type == nullptr) {
        setStatus(rc, CMPI_RC_ERR_INVALID_PARAMETER);
        return 0;
    }
    bool same = false;
    const bool known =
        visitObject(object, [&](const auto* handle) { same = std::strcmp(kindName(handle), type) == 0; });
    setStatus(rc, known ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return same ? 1 : 0;
}

CMPIString* getType(const CMPIBroker*, const void* object, CMPIStatus* rc) {
    CMPIString* name = nullptr;
    setStatus(rc, CMPI_RC_ERR_INVALID_HANDLE);
    visitObject(object, [&](const auto* handle) { name = returnedString(kindName(handle), rc); });
    return name;
}

/* Message files are not supported: every message is the default text that the provider gives. */

CMPIString* getMessage(const CMPIBroker* broker, const char*, const char* text, CMPIStatus* rc, CMPICount, ...) {
    return newStringSlot(broker, text, rc);
}

CMPIStatus openMessageFile(const CMPIBroker* broker, const char*, CMPIMsgFileHandle* file) {
    if (broker == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    if (file == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    *file = nullptr;
    return statusOf(CMPI_RC_ERR_NOT_SUPPORTED);
}

CMPIStatus closeMessageFile(const CMPIBroker* broker, CMPIMsgFileHandle) {
    return statusOf(broker != nullptr ? CMPI_RC_ERR_NOT_SUPPORTED : CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIString* getMessage2(const CMPIBroker* broker, const char*, CMPIMsgFileHandle, const char* text, CMPIStatus* rc,
                        CMPICount, ...) {
    return newStringSlot(broker, text, rc);
}

/** Passes a message to the broker's sink. Its text is `text` or, if that is null, the string. */
CMPIStatus pass(const CMPIBroker* handle, BrokerMessage::Kind kind, int level, const char* source, const char* text,
                const CMPIString* string) {
    CMPIStatus status;
    const Broker* broker = brokerOf(handle, &status);
    if (broker == nullptr) {
        return status;
    }
    if (text == nullptr && string == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    const char* content = text != nullptr ? text : contentOf(string, &status);
    if (content != nullptr) {
        broker->message({kind, level, orEmpty(source), content});
    }
    return status;
}

CMPIStatus logMessage(const CMPIBroker* broker, CMPISeverity severity, const char* id, const char* text,
                      const CMPIString* string) {
    return pass(broker, BrokerMessage::Kind::log, severity, id, text, string);
}

CMPIStatus trace(const CMPIBroker* broker, CMPILevel level, const char* component, const char* text,
                 const CMPIString* string) {
    return pass(broker, BrokerMessage::Kind::trace, level, component, text, string);
}

CMPIError* newCMPIError(const CMPIBroker* broker, const char* owner, const char* messageId, const char* message,
                        const CMPIErrorSeverity severity, const CMPIErrorProbableCause cause, const CMPIrc code,
                        CMPIStatus* rc) {
    Request* request = factoryRequest(broker, rc);
    if (request == nullptr) {
        return nullptr;
    }
    Memory& memory = request->memory();
    ErrorContent error;
    error.severity = severity;
    error.probableCause = cause;
    error.code = code;
    error.owningEntity = copyText(memory, orEmpty(owner));
    error.messageId = copyText(memory, orEmpty(messageId));
    error.message = copyText(memory, orEmpty(message));
    error.recommendedActions.elementType = CMPI_string;
    error.messageArguments.elementType = CMPI_string;
    return newObjectOf<CMPIError>(*request, error);
}

} // namespace

const CMPIBrokerEncFT factoryTable = {
    CMPIVersion200,
    newInstance,
    newObjectPath,
    newArgs,
    newStringSlot,
    newArray,
    newDateTime,
    newDateTimeFromBinary,
    newDateTimeFromChars,
    newSelectExp,
    classPathIsA,
    toString,
    isOfType,
    getType,
    getMessage,
    logMessage,
    trace,
    newCMPIError,
    openMessageFile,
    closeMessageFile,
    getMessage2,
};

} // namespace ObjectManager

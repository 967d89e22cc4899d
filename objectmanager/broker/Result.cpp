#include "broker/Objects.h"

namespace ObjectManager {

namespace {

/** Calls a member function of the result whose handle `self` is. */
template <typename... Arguments>
CMPIStatus forward(const CMPIResult* self, CMPIStatus (Result::*member)(Arguments...), Arguments... arguments) {
    CMPIStatus status;
    Result* result = contentOf(self, &status);
    return result != nullptr ? (result->*member)(arguments...) : status;
}

/** Refuses to copy a result: an operation has one result, which belongs to the object manager. */
CMPIResult* refuseClone(const CMPIResult* self, CMPIStatus* rc) {
    return contentOf(self, rc) != nullptr ? failure(rc, CMPI_RC_ERR_NOT_SUPPORTED) : nullptr;
}

CMPIStatus returnData(const CMPIResult* self, const CMPIValue* value, const CMPIType type) {
    return forward(self, &Result::returnData, value, type);
}

CMPIStatus returnInstance(const CMPIResult* self, const CMPIInstance* instance) {
    return forward(self, &Result::returnInstance, instance);
}

CMPIStatus returnObjectPath(const CMPIResult* self, const CMPIObjectPath* path) {
    return forward(self, &Result::returnPath, path);
}

CMPIStatus returnDone(const CMPIResult* self) {
    return forward(self, &Result::close);
}

CMPIStatus returnError(const CMPIResult* self, const CMPIError* error) {
    return forward(self, &Result::returnError, error);
}

/** The content of an object that a provider returned; if the object has none, this is reported to the request. */
template <typename Handle>
auto* returned(Request& request, const Handle* object, CMPIStatus& status) {
    auto* content = contentOf(object, &status);
    if (content == nullptr) {
        request.reportMisuse(std::string("returned a null ") + Kind<Handle>::name);
    }
    return content;
}

} // namespace

const CMPIResultFT resultTable = {
    CMPIVersion200, release<CMPIResult>, refuseClone, returnData,
    returnInstance, returnObjectPath,    returnDone,  returnError,
};

Result::Result(Request& request) : _request(request), _handle(newObject<CMPIResult>(request, this)) {}

Result::~Result() {
    _handle->hdl = nullptr;
}

bool Result::open(const char* attempt) {
    if (_closed) {
        _request.reportMisuse(std::string("returned ") + attempt + " after it had closed its result");
    }
    return !_closed;
}

bool Result::mayTake(const char* attempt) {
    return open(attempt) && _request.countObject();
}

/**
 * Keeps the content of a returned object as it is now. The content of an object of this request is marked as returned:
 * the object then copies it before the provider changes it. The content of any other object is copied here.
 */
template <typename Handle, typename Content>
const Content* Result::keep(const Handle* object, Content& content) {
    if (headerOf(object).memory != &_request.memory()) {
        return place(_request.memory(), content);
    }
    content.returned = true;
    return &content;
}

ObjectPath Result::path(std::size_t index) const {
    return toModel(*_paths[index]);
}

Instance Result::instance(std::size_t index) const {
    return fullInstance(*_instances[index], _request.broker().classes());
}

CMPIStatus Result::returnPath(const CMPIObjectPath* path) {
    CMPIStatus status = statusOf(CMPI_RC_ERR_FAILED);
    PathContent* content = mayTake("an object path") ? returned(_request, path, status) : nullptr;
    if (content != nullptr) {
        _paths.push_back(keep(path, *content));
    }
    return status;
}

CMPIStatus Result::returnInstance(const CMPIInstance* instance) {
    CMPIStatus status = statusOf(CMPI_RC_ERR_FAILED);
    InstanceContent* content = mayTake("an instance") ? returned(_request, instance, status) : nullptr;
    if (content != nullptr) {
        _instances.push_back(keep(instance, *content));
    }
    return status;
}

CMPIStatus Result::returnData(const CMPIValue* value, CMPIType type) {
    if (!mayTake("a value")) {
        return statusOf(CMPI_RC_ERR_FAILED);
    }
    Item item;
    const CMPIrc code = readValue(_request.memory(), value, type, item);
    if (code == CMPI_RC_OK) {
        _data.push_back(toModel(item));
    } else {
        _request.reportMisuse("returned a value that cannot be read");
    }
    return statusOf(code);
}

CMPIStatus Result::returnError(const CMPIError* error) {
    CMPIStatus status = statusOf(CMPI_RC_ERR_FAILED);
    const ErrorContent* content = open("an error") ? returned(_request, error, status) : nullptr;
    if (content != nullptr) {
        _errors.emplace_back(content->code != CMPI_RC_OK ? content->code : CMPI_RC_ERR_FAILED,
                             orEmpty(content->message));
    }
    return status;
}

CMPIStatus Result::close() {
    if (!open("the end of the result")) {
        return statusOf(CMPI_RC_ERR_FAILED);
    }
    _closed = true;
    return statusOf(CMPI_RC_OK);
}

} // namespace ObjectManager

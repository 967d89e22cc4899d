/**
 * Calls of the object manager; a call that fails ends the provider's operation with an exception.
 */
#ifndef PROVIDER_BROKERCALLS_H
#define PROVIDER_BROKERCALLS_H

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <stdexcept>
#include <string>

namespace Norv::Provider {

/** Ends an operation without a result. It has the code and message that the operation returns to its caller. */
class OperationError : public std::runtime_error {
public:
    OperationError(CMPIrc code, const std::string& message) : std::runtime_error(message), _code(code) {}

    CMPIrc code() const noexcept { return _code; }

private:
    CMPIrc _code;
};

/** Whether the pointer is null or its object holds nothing. CMIsNullObject of some headers checks only the pointer. */
template <typename Object>
bool isNull(const Object* object) {
    return object == nullptr || object->hdl == nullptr;
}

/**
 * Checks the status of a call. @param call the name of what was called, for the message.
 * @throws OperationError with the status's code if the call failed.
 */
inline void require(const std::string& call, const CMPIStatus& status) {
    if (status.rc == CMPI_RC_OK) {
        return;
    }
    const char* const reason = isNull(status.msg) ? nullptr : CMGetCharPtr(status.msg);
    throw OperationError(status.rc, call + " failed with code " + std::to_string(status.rc) +
                                        (reason == nullptr ? "" : std::string(": ") + reason));
}

/**
 * Makes a call that returns an object.
 *
 * @param call the name of what is called, for the message.
 * @param make makes the call: takes the status pointer and returns a pointer to the object.
 * @throws OperationError if the call fails, or returns null or an object that holds nothing.
 */
template <typename Make>
auto requireObject(const std::string& call, Make make) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    auto* const object = make(&status);
    require(call, status);
    if (isNull(object)) {
        throw OperationError(CMPI_RC_ERR_FAILED, call + " returned no object and reported no failure");
    }
    return object;
}

/** Makes a call that returns a string object. @return its text. Throws as `requireObject` does. */
template <typename Make>
std::string requireText(const std::string& call, Make make) {
    const CMPIString* const string = requireObject(call, make);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const char* const text = CMGetCharsPtr(string, &status);
    require("getCharPtr of " + call, status);
    if (text == nullptr) {
        throw OperationError(CMPI_RC_ERR_FAILED, "getCharPtr of " + call + " returned no text and reported no failure");
    }
    return text;
}

} // namespace Norv::Provider

#endif

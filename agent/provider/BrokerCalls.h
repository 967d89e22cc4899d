/**
 * Calls on the object manager that end the operation where they fail.
 */
#ifndef PROVIDER_BROKERCALLS_H
#define PROVIDER_BROKERCALLS_H

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include <stdexcept>
#include <string>

namespace Norv::Provider {

/** Why an operation ends without a result: the code and message that its caller gets. */
class OperationError : public std::runtime_error {
public:
    OperationError(CMPIrc code, const std::string& message) : std::runtime_error(message), _code(code) {}

    CMPIrc code() const noexcept { return _code; }

private:
    CMPIrc _code;
};

/** Whether there is no object or one that holds nothing; CMIsNullObject of some headers looks at the pointer only. */
template <typename Object>
bool isNull(const Object* object) {
    return object == nullptr || object->hdl == nullptr;
}

/**
 * @param call what was called, for the message.
 * @throws OperationError where the call reported a failure, with its code.
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
 * The object that a call gives.
 *
 * @param call what is called, for the message.
 * @param make calls it: takes the status pointer, returns a pointer to the object.
 * @throws OperationError where the call reports a failure, or gives no object or one that holds nothing.
 */
template <typename Make>
auto requireObject(const std::string& call, Make make) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    auto* const object = make(&status);
    require(call, status);
    if (isNull(object)) {
        throw OperationError(CMPI_RC_ERR_FAILED, call + " gave no object and reported no failure");
    }
    return object;
}

/** The text that a call gives as a string object; throws as `requireObject` does. */
template <typename Make>
std::string requireText(const std::string& call, Make make) {
    const CMPIString* const string = requireObject(call, make);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const char* const text = CMGetCharsPtr(string, &status);
    require("getCharPtr of " + call, status);
    if (text == nullptr) {
        throw OperationError(CMPI_RC_ERR_FAILED, "getCharPtr of " + call + " gave no text and reported no failure");
    }
    return text;
}

} // namespace Norv::Provider

#endif

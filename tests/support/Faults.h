/**
 * Faults that a test injects: which call goes wrong, at which occurrence, and how.
 */
#ifndef SUPPORT_FAULTS_H
#define SUPPORT_FAULTS_H

#include "cmpidt.h"

#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <string>

namespace OrvTest {

/** The way in which a call goes wrong. */
struct Fault {
    enum class Object { usual, null, withoutHandle };

    /** The object that the call returns, if it returns one. */
    Object object = Object::usual;
    /** The code and message that the call reports instead of CMPI_RC_OK. */
    std::optional<CMPIrc> status = {};
    CMPIString* message = nullptr;
    /** Whether the call leaves the caller's status as it is. */
    bool leavesStatus = false;
    /** Called before the call does anything else. If it throws, the call ends with this exception. */
    std::function<void()> action = {};
};

inline Fault nullObject(CMPIrc status = CMPI_RC_ERR_FAILED) {
    return {.object = Fault::Object::null, .status = status};
}

inline Fault objectWithoutHandle(CMPIrc status = CMPI_RC_ERR_FAILED) {
    return {.object = Fault::Object::withoutHandle, .status = status};
}

inline Fault reports(CMPIrc status, CMPIString* message = nullptr) {
    return {.status = status, .message = message};
}

inline Fault leavesStatus() {
    return {.leavesStatus = true};
}

template <typename Exception>
Fault throws(Exception exception) {
    return {.action = [exception] { throw exception; }};
}

/** The faults of the broker or of the agent. Several threads may use it at once. */
class Faults {
public:
    /** Makes the `occurrence`th of the following calls of the function `call` go wrong, counted from 1. */
    void at(const std::string& call, unsigned int occurrence, Fault fault);

    /** Makes every call of the function `call` go wrong, except those for which `at` gives another fault. */
    void always(const std::string& call, Fault fault);

    /** The fault of this call. Each call asks for it once. @throws what the fault's action throws. */
    Fault next(const std::string& call);

    void clear();

private:
    struct Plan {
        unsigned int count = 0;
        std::map<unsigned int, Fault> faults;
        Fault usual;
    };

    std::mutex _mutex;
    std::map<std::string, Plan> _plans;
};

} // namespace OrvTest

#endif

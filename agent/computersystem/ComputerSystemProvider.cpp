/**
 * TALVO_ComputerSystem: one instance, which represents the machine that the object manager runs on (CIM_ComputerSystem,
 * DMTF DSP1052). This provider is for machines where no other one serves the class.
 *
 * An operation either closes its result and returns CMPI_RC_OK, or leaves its result open, returns an error with a
 * message, and logs that message. No exception leaves an operation.
 */
#include "ComputerSystem.h"
#include "provider/BrokerCalls.h"
#include "provider/Log.h"
#include "provider/Outcome.h"

#include "Norv/Common.h"

#include <string>

#include <strings.h>

namespace Norv::ComputerSystemProvider {

static const CMPIBroker* broker = nullptr;
static constexpr const char* category = "Corvane.ComputerSystemProvider";

using Provider::OperationError;
using Provider::require;
using Provider::requireText;
using Provider::Site;

/** Carries an operation out and makes its status of how that ended. */
template <typename Operation>
static CMPIStatus run(Operation operation, const Site& site = Site::here()) {
    return Provider::outcomeOf(broker, operation,
                               [&](const char* message) { Provider::logFailure(site, category, message); });
}

/** A text key of a path. @throws OperationError where the path has no such key. */
static std::string requireKey(const CMPIObjectPath* path, const char* key) {
    const std::string call = std::string("getKey(") + key + ')';
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIData data = CMGetKey(path, key, &status);
    const bool isMissing = status.rc == CMPI_RC_ERR_NOT_FOUND || status.rc == CMPI_RC_ERR_NO_SUCH_PROPERTY;
    if (!isMissing) {
        require(call, status);
    }
    if (isMissing || (data.state & CMPI_notFound) != 0 || CMIsNullValue(data) || data.type != CMPI_string) {
        throw OperationError(CMPI_RC_ERR_INVALID_PARAMETER, std::string("The path of a ") + computerSystemClass +
                                                                " must have the string key " + key + '.');
    }
    return requireText(call, [&](CMPIStatus*) { return data.value.string; });
}

/** @throws OperationError where a path does not name the system of this name. */
static void requireSystem(const CMPIObjectPath* path, const std::string& name) {
    const auto requireMatch = [&name](bool matches, const std::string& what, const std::string& found) {
        if (!matches) {
            throw OperationError(CMPI_RC_ERR_NOT_FOUND, "No instance with the " + what + " \"" + found +
                                                            "\". The only one is " + computerSystemClass + '.' +
                                                            creationClassNameKey + "=\"" + computerSystemClass + "\"," +
                                                            nameKey + "=\"" + name + "\".");
        }
    };
    const std::string className = requireText("getClassName of the request's path",
                                              [&](CMPIStatus* status) { return CMGetClassName(path, status); });
    requireMatch(strcasecmp(className.c_str(), computerSystemClass) == 0, "class", className);

    const std::string creationClassName = requireKey(path, creationClassNameKey);
    const std::string systemName = requireKey(path, nameKey);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPICount count = CMGetKeyCount(path, &status);
    require("getKeyCount", status);
    if (count != 2) {
        throw OperationError(CMPI_RC_ERR_INVALID_PARAMETER, std::string("The path of a ") + computerSystemClass +
                                                                " must have the keys " + creationClassNameKey +
                                                                " and " + nameKey + " only, and this one has " +
                                                                std::to_string(count) + " keys.");
    }
    requireMatch(creationClassName == computerSystemClass, creationClassNameKey, creationClassName);
    requireMatch(systemName == name, nameKey, systemName);
}

static void returnInstance(const CMPIResult* result, const CMPIObjectPath* reference, const std::string& name,
                           const char** properties) {
    const CMPIInstance* const instance = newSystemInstance(broker, reference, name, identifyingFacts(), properties);
    require("returnInstance", CMReturnInstance(result, instance));
    require("returnDone", CMReturnDone(result));
}

static CMPIStatus ComputerSystem_Cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
    return {CMPI_RC_OK, nullptr};
}

static CMPIStatus ComputerSystem_EnumInstanceNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                                                   const CMPIObjectPath* reference) {
    return run([&] {
        const CMPIObjectPath* const path = newSystemPath(broker, reference, getSystemName());
        require("returnObjectPath", CMReturnObjectPath(result, path));
        require("returnDone", CMReturnDone(result));
    });
}

static CMPIStatus ComputerSystem_EnumInstances(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                                               const CMPIObjectPath* reference, const char** properties) {
    return run([&] { returnInstance(result, reference, getSystemName(), properties); });
}

static CMPIStatus ComputerSystem_GetInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                                             const CMPIObjectPath* reference, const char** properties) {
    return run([&] {
        const std::string name = getSystemName();
        requireSystem(reference, name);
        returnInstance(result, reference, name, properties);
    });
}

/* The system is neither made nor changed through its instance. */

static CMPIStatus notSupported() {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

static CMPIStatus ComputerSystem_CreateInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                                const CMPIObjectPath*, const CMPIInstance*) {
    return notSupported();
}

static CMPIStatus ComputerSystem_ModifyInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                                const CMPIObjectPath*, const CMPIInstance*, const char**) {
    return notSupported();
}

static CMPIStatus ComputerSystem_DeleteInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                                const CMPIObjectPath*) {
    return notSupported();
}

static CMPIStatus ComputerSystem_ExecQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                           const CMPIObjectPath*, const char*, const char*) {
    return notSupported();
}

CMInstanceMIStub(ComputerSystem_, ComputerSystemProvider, broker, CMNoHook)

} // namespace Norv::ComputerSystemProvider

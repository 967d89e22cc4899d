/** What is particular to requests for another power state (CIM_PowerManagementService, DMTF DSP1027). */
#ifndef POWER_POWERREQUESTS_H
#define POWER_POWERREQUESTS_H

#include "agentlog/LogTap.h"
#include "dispatch/MethodRule.h"
#include "model/ClassInformation.h"

namespace ObjectManager {

/** The class whose method RequestPowerStateChange this is about, with its descendants. */
inline constexpr const char* powerManagementServiceClass = "CIM_PowerManagementService";
/** The associations of such services with the systems whose power they manage, with its descendants. */
inline constexpr const char* associatedPowerManagementServiceClass = "CIM_AssociatedPowerManagementService";
inline constexpr const char* requestPowerStateChangeMethod = "RequestPowerStateChange";

/**
 * The systems whose power a service manages.
 *
 * @throws CimError
 */
std::vector<ObjectPath> systemsOf(const ObjectPath& service, const Invocation& invocation, Operations& operations);

/**
 * Takes back the power request that is under way.
 *
 * @return the agent's own word on it.
 * @throws CimError with CMPI_RC_ERR_FAILED and the agent's reason where it did not, and CMPI_RC_ERR_NOT_SUPPORTED where
 *         it cannot be asked to.
 */
std::string cancelPowerRequest(const LogTap& log);

/**
 * Calls of RequestPowerStateChange. A provider may act on its one machine whatever element is named, and return 0
 * whatever the machine says. So a request is made only for an element that is associated with the service, and it
 * succeeds only where the agent says, for this very call, that it was accepted. With an agent that cannot be observed
 * the outcome is not known beyond the return value, which is what the remark says then.
 */
class PowerRequestRule final : public MethodRule {
public:
    /** Both outlive the rule. */
    PowerRequestRule(const ClassInformation& classes, const LogTap& log) : _classes(classes), _log(log) {}

    bool isAbout(std::string_view className, std::string_view method) const override;

    /**
     * The remark is the agent's own word where the request was accepted.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_PARAMETER where an argument is missing, the element is not one of
     *         `systemsOf`, or another service than this one is known to take the requests; CMPI_RC_ERR_FAILED with the
     * agent's reason where it refused, or was not heard to accept.
     */
    MethodOutcome call(const MethodCall& call, Operations& operations,
                       const std::function<MethodResult()>& provider) const override;

private:
    const ClassInformation& _classes;
    const LogTap& _log;
};

} // namespace ObjectManager

#endif

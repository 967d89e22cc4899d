/** Rules for requests for another power state (CIM_PowerManagementService, DMTF DSP1027). */
#ifndef POWER_POWERREQUESTS_H
#define POWER_POWERREQUESTS_H

#include "agentlog/LogTap.h"
#include "dispatch/MethodRule.h"
#include "model/ClassInformation.h"

#include <optional>

namespace ObjectManager {

/** The class of the method RequestPowerStateChange. The rules also hold for its descendants. */
inline constexpr const char* powerManagementServiceClass = "CIM_PowerManagementService";
/** The association between such a service and the systems whose power it manages. Its descendants count, too. */
inline constexpr const char* associatedPowerManagementServiceClass = "CIM_AssociatedPowerManagementService";
inline constexpr const char* requestPowerStateChangeMethod = "RequestPowerStateChange";

/**
 * The systems whose power a service manages.
 *
 * @throws CimError
 */
std::vector<ObjectPath> systemsOf(const ObjectPath& service, const Invocation& invocation, Operations& operations);

/** Whether the agent offers to tell the state of the machine to which power requests go. */
bool tellsPowerState(const LogTap& log);

/** That state, as property 123 of the agent counts it; no value if it cannot be told. */
std::optional<unsigned int> powerState(const LogTap& log);

/**
 * Has the agent cancel the power request that is under way.
 *
 * @return the agent's text about the cancellation.
 * @throws CimError with CMPI_RC_ERR_FAILED and the agent's reason if it did not cancel a request, with
 *         CMPI_RC_ERR_NOT_SUPPORTED if the agent does not offer cancellation.
 */
std::string cancelPowerRequest(const LogTap& log);

/**
 * The rule for calls of RequestPowerStateChange. A provider may act on its one machine whatever element a request
 * names, and may return 0 whether or not the machine accepts the request. So the rule calls the provider only if the
 * element is associated with the service, and the call succeeds only if the agent reports, for this call, that it
 * accepted the request. If the agent does not report outcomes, nothing but the return value is known: the remark then
 * says so.
 */
class PowerRequestRule final : public MethodRule {
public:
    /** @param classes,log must outlive the rule. */
    PowerRequestRule(const ClassInformation& classes, const LogTap& log) : _classes(classes), _log(log) {}

    bool isAbout(std::string_view className, std::string_view method) const override;

    /**
     * The remark of an accepted request is the agent's text.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_PARAMETER if an argument is missing, if the element is not one of
     *         `systemsOf`, or if it is known that another service's node gets the requests; with CMPI_RC_ERR_FAILED and
     *         the agent's reason if the agent refused the request or did not report that it accepted it.
     */
    MethodOutcome call(const MethodCall& call, Operations& operations,
                       const std::function<MethodResult()>& provider) const override;

private:
    const ClassInformation& _classes;
    const LogTap& _log;
};

} // namespace ObjectManager

#endif

/**
 * Backend "logind": the machine itself, as one node. Each selection reads the state from systemd-logind. A request
 * counts as accepted when systemd-logind has taken it: it does not depend on this process any more.
 */
#ifndef INSTRUMENTATION_LOGINDBACKEND_H
#define INSTRUMENTATION_LOGINDBACKEND_H

#include "Backend.h"
#include "EndOfTheMachine.h"
#include "config/Configuration.h"

#include <utility>

namespace Norv::Agent {

class LogindBackend final : public Backend {
public:
    /** Does not connect to systemd-logind yet. */
    explicit LogindBackend(LogindSettings settings) : _settings(std::move(settings)) {}

    bool isSimulated() const override { return false; }
    std::string machine() const override;
    std::unique_ptr<NodeSelection> selectPowerManagementNodes() override;
    MachineReport examine() override;

private:
    class Selection;

    const LogindSettings _settings;
    /** Knows the node's state when the machine goes down. */
    EndOfTheMachine _end;
};

} // namespace Norv::Agent

#endif

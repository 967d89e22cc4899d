/**
 * Backend "logind": the machine itself, as one node. What it does now is read from systemd-logind with each selection,
 * and a request is handed to systemd-logind before it counts as accepted: this process keeps nothing of it.
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
    /** Nothing is connected yet. */
    explicit LogindBackend(LogindSettings settings) : _settings(std::move(settings)) {}

    bool isSimulated() const override { return false; }
    std::string machine() const override;
    std::unique_ptr<NodeSelection> selectPowerManagementNodes() override;
    MachineReport examine() override;

private:
    class Selection;

    const LogindSettings _settings;
    /** What keeps the node's state once the machine goes down. */
    EndOfTheMachine _end;
};

} // namespace Norv::Agent

#endif

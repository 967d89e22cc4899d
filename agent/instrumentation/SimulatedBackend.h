/**
 * Backend "simulated": a machine of any number of nodes; a reboot or shutdown changes only its state file.
 */
#ifndef INSTRUMENTATION_SIMULATEDBACKEND_H
#define INSTRUMENTATION_SIMULATEDBACKEND_H

#include "Backend.h"
#include "StateFile.h"
#include "config/Configuration.h"

#include <functional>
#include <memory>

namespace Norv::Agent {

class SimulatedBackend final : public Backend {
public:
    /** Returns the wall-clock time, which all processes on the host share. */
    using Clock = std::function<TimePoint()>;

    explicit SimulatedBackend(SimulatedSettings settings, Clock clock = wallClock);

    bool isSimulated() const override { return true; }
    std::string machine() const override;
    std::string warning() const override;
    std::unique_ptr<NodeSelection> selectPowerManagementNodes() override;
    MachineReport examine() override;

private:
    class Selection;

    static TimePoint wallClock();

    const SimulatedSettings _settings;
    const Clock _clock;
    StateFile _stateFile;
};

} // namespace Norv::Agent

#endif

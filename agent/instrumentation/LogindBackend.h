/**
 * Backend "logind": the machine itself, as one node. What it does now is read from systemd-logind with each selection,
 * and a request is handed to systemd-logind before it counts as accepted: this process keeps nothing of it.
 */
#ifndef INSTRUMENTATION_LOGINDBACKEND_H
#define INSTRUMENTATION_LOGINDBACKEND_H

#include "Backend.h"
#include "config/Configuration.h"

#include <filesystem>

namespace Norv::Agent {

class LogindBackend final : public Backend {
public:
    /**
     * Nothing is connected yet.
     *
     * @param lockFile locked while a request is made, so that of two that are made at once the second finds the first.
     * Any file that every process reads which makes requests; it is not changed.
     */
    LogindBackend(const LogindSettings& settings, std::filesystem::path lockFile);

    bool isSimulated() const override { return false; }
    std::string machine() const override;
    std::unique_ptr<NodeSelection> selectPowerManagementNodes() override;
    MachineReport examine() override;

private:
    class Selection;

    const LogindSettings _settings;
    const std::filesystem::path _lockFile;
};

} // namespace Norv::Agent

#endif

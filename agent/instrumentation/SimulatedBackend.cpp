#include "SimulatedBackend.h"

#include "PowerTransition.h"
#include "Report.h"
#include "Wording.h"

#include <algorithm>
#include <cerrno>
#include <exception>
#include <system_error>
#include <utility>

#include <unistd.h>

namespace Norv::Agent {

class SimulatedBackend::Selection final : public NodeSelection {
public:
    /** `requests` is what the state file holds; null where it cannot be read. */
    Selection(SimulatedBackend& backend, std::shared_ptr<const PowerRequests> requests)
        : _backend(backend), _requests(std::move(requests)) {}

    std::size_t size() const override { return _backend._settings.nodes.size(); }

    const std::string& path(std::size_t node) const override { return _backend._settings.nodes[node].path; }

    std::optional<unsigned int> powerState(std::size_t node) const override {
        if (!_requests) {
            return std::nullopt;
        }
        const auto request = _requests->find(path(node));
        if (request == _requests->end()) {
            return _backend._settings.nodes[node].powerState;
        }
        const auto& [transition, over] = request->second;
        const auto remaining = over - _backend._clock();
        // More can remain than a transition takes where the clock was set back, or the file came from elsewhere.
        const bool isOver = remaining.count() <= 0 || remaining > _backend._settings.*transition->duration;
        return isOver ? transition->stateAfterwards : transition->state;
    }

    const std::vector<unsigned int>& powerStates(std::size_t node) const override {
        return _backend._settings.nodes[node].powerStates;
    }

    PowerRequestOutcome requestPowerState(std::size_t node, unsigned int state) override {
        const std::string where = "of simulated node " + path(node);
        const auto* const transition = std::ranges::find(powerTransitions, state, &PowerTransition::state);
        if (transition == powerTransitions.end()) {
            return {false, "power state " + std::to_string(state) + ' ' + where + ": expected " +
                               acceptedStates(powerTransitions)};
        }
        const std::string what = transition->name + (' ' + where);
        const std::chrono::milliseconds duration = _backend._settings.*transition->duration;
        try {
            _requests = _backend._stateFile.write(path(node), {transition, _backend._clock() + duration});
        } catch (const std::exception& error) {
            return {false, what + ": " + error.what()};
        }
        return {true, what + ", over in " + inSeconds(duration)};
    }

private:
    SimulatedBackend& _backend;
    /** Null where the state file cannot be read. */
    std::shared_ptr<const PowerRequests> _requests;
};

SimulatedBackend::SimulatedBackend(SimulatedSettings settings, Clock clock)
    : _settings(std::move(settings)), _clock(std::move(clock)), _stateFile(_settings.stateFile) {}

std::string SimulatedBackend::machine() const {
    const std::size_t count = _settings.nodes.size();
    return "a simulated machine (" + std::to_string(count) + (count == 1 ? " node" : " nodes") + ", state in " +
           _settings.stateFile.string() + ')';
}

std::unique_ptr<NodeSelection> SimulatedBackend::selectPowerManagementNodes() {
    std::shared_ptr<const PowerRequests> requests;
    try {
        requests = _stateFile.read();
    } catch (const std::system_error& error) {
        report(failureLevel, std::string("The power states of the simulated machine cannot be told: ") + error.what());
    }
    return std::make_unique<Selection>(*this, std::move(requests));
}

MachineReport SimulatedBackend::examine() {
    MachineReport found;
    try {
        const Selection nodes(*this, _stateFile.read());
        for (std::size_t node = 0; node < nodes.size(); ++node) {
            found.facts.push_back(
                {"node " + nodes.path(node), "power state " + std::to_string(*nodes.powerState(node))});
        }
        std::filesystem::path folder = _settings.stateFile.parent_path();
        while (!std::filesystem::exists(folder)) {
            folder = folder.parent_path();
        }
        if (::access(folder.c_str(), W_OK) != 0) {
            throw std::system_error(errno, std::generic_category(), folder.string() + ": cannot be written");
        }
    } catch (const std::system_error& error) {
        found.problems.push_back(std::string(error.what()) + ": let the user write there, or name another state-file");
    }
    return found;
}

TimePoint SimulatedBackend::wallClock() {
    return std::chrono::floor<std::chrono::milliseconds>(std::chrono::system_clock::now());
}

} // namespace Norv::Agent

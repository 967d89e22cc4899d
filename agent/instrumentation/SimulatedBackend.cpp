#include "SimulatedBackend.h"

#include "PowerTransition.h"
#include "Report.h"
#include "Wording.h"
#include "base/Folders.h"
#include "base/UtcText.h"
#include "config/PowerStates.h"

#include <algorithm>
#include <cstdint>
#include <exception>
#include <system_error>
#include <utility>

namespace Norv::Agent {

class SimulatedBackend::Selection final : public NodeSelection {
public:
    /** @param requests the content of the state file; null if it cannot be read. */
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
        const PowerTransition& transition = *request->second.transition;
        return isUnderWay(request->second) ? transition.state : transition.stateAfterwards;
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
        const std::chrono::milliseconds duration = _backend._settings.*transition->duration;
        return change(transition->name + (' ' + where), [&](PowerRequests& requests) {
            const auto before = requests.find(path(node));
            if (before == requests.end()) {
                requests.emplace(path(node), PowerRequest{transition, _backend._clock() + duration});
            } else if (isUnderWay(before->second)) {
                throw Refusal("another request is in progress: " + describe(before->second));
            } else {
                before->second = {transition, _backend._clock() + duration, before->second.transition};
            }
            return ", over in " + inSeconds(duration);
        });
    }

    PowerRequestOutcome cancelRequest(std::size_t node) override {
        return change("cancellation of the request of simulated node " + path(node), [&](PowerRequests& requests) {
            const auto last = requests.find(path(node));
            if (last == requests.end() || !isUnderWay(last->second)) {
                throw Refusal("no request is in progress");
            }
            std::string cancelled = std::string(" (") + last->second.transition->name + ')';
            if (last->second.after == nullptr) {
                requests.erase(last);
            } else {
                last->second = {last->second.after, TimePoint()};
            }
            return cancelled;
        });
    }

private:
    /** Whether the transition goes on. An end that is further away than the transition takes does not count: the clock
     * was set back, or the file is from another machine. */
    bool isUnderWay(const PowerRequest& request) const {
        const auto remaining = request.over - _backend._clock();
        return remaining.count() > 0 && remaining <= _backend._settings.*request.transition->duration;
    }

    std::string describe(const PowerRequest& request) const {
        return std::string(request.transition->name) + " is over at " +
               UtcText(std::chrono::ceil<std::chrono::seconds>(request.over)).inSeconds() + ", in " +
               inSeconds(request.over - _backend._clock());
    }

    /**
     * @param action changes the file's content; returns the end of the description, or throws the reason of a refusal.
     */
    PowerRequestOutcome change(const std::string& what, const std::function<std::string(PowerRequests&)>& action) {
        try {
            std::string description = what;
            _requests = _backend._stateFile.update([&](PowerRequests& requests) { description += action(requests); });
            return {true, std::move(description)};
        } catch (const std::exception& error) {
            return {false, what + ": " + error.what()};
        }
    }

    SimulatedBackend& _backend;
    /** Null if the state file cannot be read. */
    std::shared_ptr<const PowerRequests> _requests;
};

SimulatedBackend::SimulatedBackend(SimulatedSettings settings, Clock clock)
    : _settings(std::move(settings)), _clock(std::move(clock)), _stateFile(_settings.stateFile) {}

std::string SimulatedBackend::machine() const {
    const std::size_t count = _settings.nodes.size();
    return "a simulated machine (" + std::to_string(count) + (count == 1 ? " node" : " nodes") + ", state in " +
           _settings.stateFile.string() + ')';
}

std::string SimulatedBackend::warning() const {
    // Every service is associated with every capabilities instance, and the provider counts these pairs with 16 bits.
    constexpr std::uint64_t mostNodes = 255;
    const std::uint64_t count = _settings.nodes.size();
    if (count <= mostNodes) {
        return {};
    }
    return std::to_string(count) +
           " nodes: clients see too few instances of TALVO_PowerManagementElementCapabilities, "
           "or none, since their " +
           std::to_string(count * count) + " pairs of service and capabilities are counted with 16 bits: expected " +
           std::to_string(mostNodes) + " nodes at most";
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
            found.facts.push_back({"node " + nodes.path(node), shownPowerState(*nodes.powerState(node))});
        }
        if (const std::string text = warning(); !text.empty()) {
            found.facts.push_back({"warning", text});
        }
        requireWritable(_settings.stateFile.parent_path());
    } catch (const std::system_error& error) {
        found.problems.push_back(std::string(error.what()) + ": let the user write there, or name another state-file");
    }
    return found;
}

TimePoint SimulatedBackend::wallClock() {
    return std::chrono::floor<std::chrono::milliseconds>(std::chrono::system_clock::now());
}

} // namespace Norv::Agent

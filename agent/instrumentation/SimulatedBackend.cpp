#include "SimulatedBackend.h"

#include "PowerTransition.h"
#include "Report.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <exception>
#include <system_error>
#include <utility>

namespace Norv::Agent {

namespace {

/** Seconds in the shortest exact form, whatever the process's locale: "10 s", "2.5 s". */
std::string inSeconds(std::chrono::milliseconds duration) {
    std::array<char, 32> text;
    const double seconds = std::chrono::duration<double>(duration).count();
    char* const begin = text.data();
    char* const end = std::to_chars(begin, begin + text.size(), seconds, std::chars_format::fixed).ptr;
    return std::string(begin, end) + " s";
}

/** "9 (reboot) or 12 (shutdown)". */
std::string acceptedStates() {
    std::string text;
    for (const PowerTransition& transition : powerTransitions) {
        text += text.empty() ? "" : " or ";
        text += std::to_string(transition.state) + " (" + transition.name + ')';
    }
    return text;
}

} // namespace

class SimulatedBackend::Selection final : public NodeSelection {
public:
    explicit Selection(SimulatedBackend& backend) : _backend(backend) {
        try {
            _requests = backend._stateFile.read();
        } catch (const std::system_error& error) {
            report(failureLevel,
                   std::string("The power states of the simulated machine cannot be told: ") + error.what());
        }
    }

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
            return {false, "power state " + std::to_string(state) + ' ' + where + ": expected " + acceptedStates()};
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

std::unique_ptr<NodeSelection> SimulatedBackend::selectPowerManagementNodes() {
    return std::make_unique<Selection>(*this);
}

TimePoint SimulatedBackend::wallClock() {
    return std::chrono::floor<std::chrono::milliseconds>(std::chrono::system_clock::now());
}

} // namespace Norv::Agent

/**
 * The names of power states in the configuration file and in texts for people.
 */
#ifndef CONFIG_POWERSTATES_H
#define CONFIG_POWERSTATES_H

#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <utility>

namespace Norv::Agent {

/** As property 123 of a power-management node counts them. There may be other numbers; they have no name. */
inline constexpr std::array<std::pair<std::string_view, unsigned int>, 5> nodePowerStates{{
    {"running", 1},
    {"hibernating", 8},
    {"rebooting", 9},
    {"off", 10},
    {"shutting-down", 12},
}};

/** As property 125 counts them: the values of CIM_PowerManagementCapabilities.PowerStatesSupported (DMTF). */
inline constexpr std::array<std::pair<std::string_view, unsigned int>, 15> supportedPowerStates{{
    {"on", 2},
    {"sleep-light", 3},
    {"sleep-deep", 4},
    {"power-cycle-off-soft", 5},
    {"off-hard", 6},
    {"hibernate", 7},
    {"off-soft", 8},
    {"power-cycle-off-hard", 9},
    {"master-bus-reset", 10},
    {"diagnostic-interrupt", 11},
    {"off-soft-graceful", 12},
    {"off-hard-graceful", 13},
    {"master-bus-reset-graceful", 14},
    {"power-cycle-off-soft-graceful", 15},
    {"power-cycle-off-hard-graceful", 16},
}};

/** What property 123 reads, for people. */
inline std::string nodePowerStateText(unsigned int state) {
    const auto* const found = std::ranges::find(nodePowerStates, state, [](const auto& each) { return each.second; });
    return found == nodePowerStates.end() ? "power state " + std::to_string(state) : std::string(found->first);
}

} // namespace Norv::Agent

#endif

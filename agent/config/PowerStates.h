/**
 * The names of power states, for the configuration file and for texts for people.
 */
#ifndef CONFIG_POWERSTATES_H
#define CONFIG_POWERSTATES_H

#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <utility>

namespace Norv::Agent {

/**
 * Power states by their numbers in property 123 of a power-management node. Other numbers are possible; they have no
 * names.
 */
inline constexpr std::array<std::pair<std::string_view, unsigned int>, 5> nodePowerStates{{
    {"running", 1},
    {"hibernating", 8},
    {"rebooting", 9},
    {"off", 10},
    {"shutting-down", 12},
}};

/**
 * Power states by their numbers in property 125: the values of CIM_PowerManagementCapabilities.PowerStatesSupported
 * (DMTF).
 */
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

/**
 * The values of property 123 in which a machine stays, each with the value of
 * CIM_AssociatedPowerManagementService.PowerState (DMTF) that clients see for it, and its meaning. A machine with any
 * other value is on its way from one of these states to another.
 */
inline constexpr std::array<std::pair<unsigned int, std::string_view>, 3> lastingPowerStates{{
    {1, "2 (On)"},
    {8, "7 (Hibernate (Off - Soft))"},
    {10, "12 (Off - Soft Graceful)"},
}};

inline bool isLasting(unsigned int state) {
    return std::ranges::find(lastingPowerStates, state, &std::pair<unsigned int, std::string_view>::first) !=
           lastingPowerStates.end();
}

/** What clients see for a value of property 123. */
inline std::string shownPowerState(unsigned int state) {
    const auto* const lasting =
        std::ranges::find(lastingPowerStates, state, &std::pair<unsigned int, std::string_view>::first);
    return std::string(lasting == lastingPowerStates.end() ? "1 (Other), as while it reboots or shuts down"
                                                           : lasting->second);
}

} // namespace Norv::Agent

#endif

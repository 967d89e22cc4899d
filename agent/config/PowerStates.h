/**
 * The names of power states, for the configuration file and for texts for people.
 */
#ifndef CONFIG_POWERSTATES_H
#define CONFIG_POWERSTATES_H

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

/** The value of CIM_AssociatedPowerManagementService.PowerState (DMTF) that clients see for a value of property 123,
 * with its meaning. */
inline std::string shownPowerState(unsigned int state) {
    constexpr unsigned int running = 1;
    constexpr unsigned int hibernating = 8;
    constexpr unsigned int off = 10;
    switch (state) {
    case running:
        return "2 (On)";
    case hibernating:
        return "7 (Hibernate (Off - Soft))";
    case off:
        return "12 (Off - Soft Graceful)";
    default:
        return "1 (Other), as while it reboots or shuts down";
    }
}

} // namespace Norv::Agent

#endif

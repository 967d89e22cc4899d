/**
 * The transitions between power states that a simulated machine can make.
 */
#ifndef INSTRUMENTATION_POWERTRANSITION_H
#define INSTRUMENTATION_POWERTRANSITION_H

#include "config/Configuration.h"

#include <array>
#include <chrono>

namespace Norv::Agent {

struct PowerTransition {
    /** The value that is written to property 123, and that it has until the transition is over. */
    unsigned int state;
    /** The value of property 123 afterwards. */
    unsigned int stateAfterwards;
    /** The transition's name in texts and in the state file. */
    const char* name;
    std::chrono::milliseconds SimulatedSettings::*duration;
};

inline constexpr std::array powerTransitions = {
    PowerTransition{9, 1, "reboot", &SimulatedSettings::rebootTime},
    PowerTransition{12, 10, "shutdown", &SimulatedSettings::shutdownTime},
};

} // namespace Norv::Agent

#endif

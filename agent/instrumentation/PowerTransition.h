/**
 * What a simulated machine can be asked to do.
 */
#ifndef INSTRUMENTATION_POWERTRANSITION_H
#define INSTRUMENTATION_POWERTRANSITION_H

#include "config/Configuration.h"

#include <array>
#include <chrono>

namespace Norv::Agent {

struct PowerTransition {
    /** What is written to property 123, and what it reads until the transition is over. */
    unsigned int state;
    /** What it reads from then on. */
    unsigned int stateAfterwards;
    /** Its name in texts and in the state file. */
    const char* name;
    std::chrono::milliseconds SimulatedSettings::*duration;
};

inline constexpr std::array powerTransitions = {
    PowerTransition{9, 1, "reboot", &SimulatedSettings::rebootTime},
    PowerTransition{12, 10, "shutdown", &SimulatedSettings::shutdownTime},
};

} // namespace Norv::Agent

#endif

/**
 * Parts of texts for people, for all backends.
 */
#ifndef INSTRUMENTATION_WORDING_H
#define INSTRUMENTATION_WORDING_H

#include <chrono>
#include <string>

namespace Norv::Agent {

/** A duration in seconds, in the shortest exact form whatever the process's locale: "10 s", "2.5 s". */
std::string inSeconds(std::chrono::milliseconds duration);

/** The states of a table of transitions as text: "9 (reboot) or 12 (shutdown)". */
std::string acceptedStates(const auto& transitions) {
    std::string text;
    for (const auto& transition : transitions) {
        text += text.empty() ? "" : " or ";
        text += std::to_string(transition.state) + " (" + transition.name + ')';
    }
    return text;
}

} // namespace Norv::Agent

#endif

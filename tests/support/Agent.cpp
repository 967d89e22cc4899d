#include "Agent.h"

namespace OrvTest {

Agent& Agent::instance() {
    static Agent agent;
    return agent;
}

void Agent::reset() {
    nodes.clear();
    acceptsWrites = true;
    systemName = "managed.example.org";
    language = 7;
    texts.clear();
    pathsEqual = nullptr;
    faults.clear();
}

} // namespace OrvTest

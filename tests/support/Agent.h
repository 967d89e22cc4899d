/**
 * The answers of the stand-ins for the agent's libraries. The stand-ins record all calls in the transcript.
 */
#ifndef SUPPORT_AGENT_H
#define SUPPORT_AGENT_H

#include "Faults.h"
#include "cmpidt.h"

#include <atomic>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace OrvTest {

/** A power management node of the instrumentation tree. A property without a value is one that the node lacks. */
struct Node {
    std::string path;
    std::optional<unsigned int> powerState;
    std::optional<std::vector<unsigned int>> powerStates;
};

/** The agent of one test: its answers and faults. Faults have the name of a member or function, e.g. "selectNode". */
struct Agent {
    static Agent& instance();

    /** Resets everything to a machine without nodes. */
    void reset();

    std::vector<Node> nodes;
    /** The result of `setProperty`, which does not change the nodes above. */
    bool acceptsWrites = true;
    std::string systemName = "managed.example.org";
    unsigned int language = 7;
    /** Texts by resource id; an id without an entry is its own text. */
    std::map<std::wstring, std::wstring> texts;
    /** Decides what `isObjPathsEqual` returns; if it is empty, that returns false. */
    std::function<bool(const CMPIObjectPath*, const CMPIObjectPath*, bool)> pathsEqual;
    Faults faults;

    /** The number of objects of each class that exist now. */
    std::atomic<int> messageBuffers = 0;
    std::atomic<int> instrumentations = 0;
};

} // namespace OrvTest

#endif

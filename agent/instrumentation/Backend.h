/**
 * What stands behind the cursor of Norv::Instrumentation: a backend gives the nodes of one kind of machine. Each
 * process has one backend, which any number of threads use at once.
 */
#ifndef INSTRUMENTATION_BACKEND_H
#define INSTRUMENTATION_BACKEND_H

#include "config/Configuration.h"

#include <cstddef>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace Norv::Agent {

/** How a request for another power state, or its cancellation, ended. */
struct PowerRequestOutcome {
    bool accepted;
    /** For people: what was asked of which node, and when it will be over or why it was refused. */
    std::string description;
};

/** Why a request is not even tried. what() is the reason, for people. */
class Refusal : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/**
 * The power-management nodes as they stood when they were selected. Belongs to one thread at a time and must not
 * outlive its backend. Every `node` is an index below `size()`.
 */
class NodeSelection {
public:
    virtual ~NodeSelection() = default;

    virtual std::size_t size() const = 0;

    /** Names from the root down, separated by slashes, without one in front: the node's identity. */
    virtual const std::string& path(std::size_t node) const = 0;

    /** What the node does now; not set where the backend cannot tell. The reason is in the log. */
    virtual std::optional<unsigned int> powerState(std::size_t node) const = 0;

    virtual const std::vector<unsigned int>& powerStates(std::size_t node) const = 0;

    /**
     * Asks for another power state; an accepted one shows in `powerState` of this selection at once. Refused where
     * another request is under way.
     */
    virtual PowerRequestOutcome requestPowerState(std::size_t node, unsigned int state) = 0;

    /**
     * Takes back the request that is under way, by whomever it was made; the node is then as it was before. Refused
     * where there is none, or where it is too late.
     */
    virtual PowerRequestOutcome cancelRequest(std::size_t node) = 0;
};

/** The machine behind the nodes, for people who want to know whether it can do what it is there for. */
struct MachineReport {
    struct Fact {
        std::string name;
        std::string value;
    };

    /** What it does now, what it can be asked to do, and what it warns of. */
    std::vector<Fact> facts;
    /** What is missing, and what to do about it. */
    std::vector<std::string> problems;
};

class Backend {
public:
    virtual ~Backend() = default;

    /** Whether nothing real happens whatever is asked of it. */
    virtual bool isSimulated() const = 0;

    /** The machine, for people, as it completes "Power management of". */
    virtual std::string machine() const = 0;

    /** Why clients will not see the machine as it is configured, for people; empty where they will. */
    virtual std::string warning() const { return {}; }

    /** Never null; without nodes where the machine has none. */
    virtual std::unique_ptr<NodeSelection> selectPowerManagementNodes() = 0;

    /** Looks at the machine and asks nothing of it. */
    virtual MachineReport examine() = 0;
};

/** The backend of the configuration. Nothing is asked of its machine yet. */
std::unique_ptr<Backend> makeBackend(const Configuration& configuration);

} // namespace Norv::Agent

#endif

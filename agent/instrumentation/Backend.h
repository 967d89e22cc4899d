/**
 * The seam between the cursor Norv::Instrumentation and the machine: a backend provides the nodes of one kind of
 * machine. A process has one backend, which any number of threads may use at once.
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

/** The outcome of a request for another power state, or of its cancellation. */
struct PowerRequestOutcome {
    bool accepted;
    /** For people: which request was made of which node, and when it will be done or why it was refused. */
    std::string description;
};

/** A refusal of a request that is not even tried. what() is the reason, for people. */
class Refusal : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/**
 * The power-management nodes, and their states when one of them was first asked for or before. It belongs to one thread
 * at a time and must not outlive its backend. Every `node` is an index below `size()`.
 */
class NodeSelection {
public:
    virtual ~NodeSelection() = default;

    virtual std::size_t size() const = 0;

    /**
     * The names from the root down to the node, separated by slashes, without a leading slash. The path is the node's
     * identity.
     */
    virtual const std::string& path(std::size_t node) const = 0;

    /**
     * The node's power state, as property 123 counts them; no value if the backend does not know it: the log says why.
     */
    virtual std::optional<unsigned int> powerState(std::size_t node) const = 0;

    virtual const std::vector<unsigned int>& powerStates(std::size_t node) const = 0;

    /**
     * Requests another power state. If the request is accepted, `powerState` of this selection shows it at once. It is
     * refused if another request is under way, and if memory is short: once it is carried out, no more is needed.
     */
    virtual PowerRequestOutcome requestPowerState(std::size_t node, unsigned int state) = 0;

    /**
     * Cancels the request that is under way, whoever made it; the node then has its former state again. It is refused
     * if there is no request, or if it is too late.
     */
    virtual PowerRequestOutcome cancelRequest(std::size_t node) = 0;
};

/** What was found out about the machine, for people who want to know whether power requests can succeed. */
struct MachineReport {
    struct Fact {
        std::string name;
        std::string value;
    };

    /** The machine's state, the requests that it can carry out, and warnings. */
    std::vector<Fact> facts;
    /** What is missing, each with what to do about it. */
    std::vector<std::string> problems;
};

class Backend {
public:
    virtual ~Backend() = default;

    /** Whether the machine is simulated: requests change nothing but a file. */
    virtual bool isSimulated() const = 0;

    /** A description of the machine that completes "Power management of", for people. */
    virtual std::string machine() const = 0;

    /** Why clients cannot see all of the configured machine, for people; empty if they can. */
    virtual std::string warning() const { return {}; }

    /** Selects the nodes. The result is never null; it is empty if the machine has no nodes. */
    virtual std::unique_ptr<NodeSelection> selectPowerManagementNodes() = 0;

    /** Examines the machine without any request to it. */
    virtual MachineReport examine() = 0;
};

/** Makes the configured backend, which does not contact its machine yet. */
std::unique_ptr<Backend> makeBackend(const Configuration& configuration);

} // namespace Norv::Agent

#endif

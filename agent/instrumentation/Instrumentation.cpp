#include "Norv/Instrumentation.h"
#include "Norv/Machine.h"

#include "Backend.h"
#include "Report.h"
#include "config/Configuration.h"

#include <cerrno>
#include <cstddef>
#include <memory>
#include <string>

#include <unistd.h>

namespace Norv {

using namespace Agent;

namespace {

std::unique_ptr<Backend> createBackend() {
    try {
        const Configuration configuration = loadConfiguration();
        auto backend = makeBackend(configuration);
        if (configuration.source.empty()) {
            report(failureLevel, "No configuration file: power management of " + backend->machine(),
                   OrvLog::MACHINE_RECORD);
        } else {
            report(informationLevel, "Power management of " + backend->machine(), OrvLog::MACHINE_RECORD);
        }
        if (const std::string warning = backend->warning(); !warning.empty()) {
            report(failureLevel, warning);
        }
        return backend;
    } catch (const ConfigurationError&) {
        // The log library reports the mistake when it is first used, which this record ensures.
        OrvLog::OrvLogger::traceLevelMessage(static_cast<const char*>(__func__), __FILE__, __LINE__,
                                             instrumentationCategory, failureLevel, nullptr, 0, 0,
                                             "No power-management node is offered: the configuration cannot be used");
        return nullptr;
    }
}

/**
 * The backend of this process; null if the configuration cannot be used. It is never destroyed: a host's threads may
 * use cursors until the process ends.
 */
Backend* processBackend() {
    static Backend* const backend = createBackend().release();
    return backend;
}

/** The text that the thread passed to orvInstrumentationOnBehalfOf1. */
constinit thread_local const char* principal = nullptr;

/** The requester for the log: the host program, and the user on whose behalf it acts, if it has told that. */
std::string requester() {
    return std::string(" [asked by ") + program_invocation_short_name + ", process " + std::to_string(getpid()) +
           ", uid " + std::to_string(geteuid()) +
           (principal == nullptr ? "" : std::string(", on behalf of ") + principal) + ']';
}

/** Logs the outcome, whatever the log's thresholds. @return whether the request was accepted. */
bool reported(const PowerRequestOutcome& outcome) {
    report(alwaysWrittenLevel,
           (outcome.accepted ? "Power request accepted: " : "Power request refused: ") + outcome.description +
               requester(),
           outcome.accepted ? OrvLog::POWER_REQUEST_ACCEPTED_RECORD : OrvLog::POWER_REQUEST_REFUSED_RECORD);
    return outcome.accepted;
}

} // namespace

class Instrumentation::Implementation {
public:
    Backend* const backend = processBackend();
    /** The selected nodes; null before the first selection. */
    std::unique_ptr<NodeSelection> nodes;
    std::size_t node = 0;

    bool isOnNode() const { return nodes && node < nodes->size(); }

    PowerRequestOutcome write(NodeLexicon::Properties property, unsigned int value) const {
        if (property == NodeLexicon::POWER_STATE && isOnNode()) {
            return nodes->requestPowerState(node, value);
        }
        const std::string what = "write of " + std::to_string(value) + " to property " + std::to_string(property);
        if (isOnNode()) {
            return {false, what + " of node " + nodes->path(node) + ": expected property " +
                               std::to_string(NodeLexicon::POWER_STATE)};
        }
        return {false, what + (backend != nullptr ? ": expected a cursor that stands on a node"
                                                  : ": no node is offered, the configuration cannot be used")};
    }
};

Instrumentation::Instrumentation() : _implementation(new Implementation) {}

Instrumentation::~Instrumentation() {
    delete _implementation;
}

bool Instrumentation::selectNode(NodeLexicon::NodeType type) {
    _implementation->node = 0;
    _implementation->nodes.reset();
    if (type == NodeLexicon::POWER_MANAGEMENT_NODE && _implementation->backend) {
        _implementation->nodes = _implementation->backend->selectPowerManagementNodes();
    }
    return _implementation->isOnNode();
}

Instrumentation::operator bool() {
    return _implementation->isOnNode();
}

Instrumentation& Instrumentation::operator++() {
    if (_implementation->isOnNode()) {
        ++_implementation->node;
    }
    return *this;
}

// A path begins with a slash for the root, like a file's; texts for people leave that slash out.
std::string Instrumentation::getPathToNode() {
    return _implementation->isOnNode() ? '/' + _implementation->nodes->path(_implementation->node) : std::string();
}

// NOLINTNEXTLINE(readability-convert-member-functions-to-static): the libraries' interface is fixed
std::string Instrumentation::convertPathToString(const std::string& path) {
    return path.starts_with('/') ? path.substr(1) : path;
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, std::vector<unsigned int>& values) {
    if (property != NodeLexicon::POWER_STATE_LIST || !_implementation->isOnNode()) {
        return false;
    }
    values = _implementation->nodes->powerStates(_implementation->node);
    return true;
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, unsigned int& value) {
    if (property != NodeLexicon::POWER_STATE || !_implementation->isOnNode()) {
        return false;
    }
    const std::optional<unsigned int> state = _implementation->nodes->powerState(_implementation->node);
    value = state.value_or(value);
    return state.has_value();
}

bool Instrumentation::setProperty(NodeLexicon::Properties property, unsigned int& value) {
    return reported(_implementation->write(property, value));
}

} // namespace Norv

int orvInstrumentationMachine1() {
    const Norv::Backend* const backend = Norv::processBackend();
    if (backend == nullptr) {
        return Norv::NO_MACHINE;
    }
    return backend->isSimulated() ? Norv::SIMULATED_MACHINE : Norv::REAL_MACHINE;
}

void orvInstrumentationOnBehalfOf1(const char* whom) {
    Norv::principal = whom;
}

const char* orvInstrumentationPowerNode1() {
    static const std::string node = [] {
        Norv::Backend* const backend = Norv::processBackend();
        const auto nodes = backend == nullptr ? nullptr : backend->selectPowerManagementNodes();
        return nodes == nullptr || nodes->size() == 0 ? std::string() : nodes->path(0);
    }();
    return node.c_str();
}

int orvInstrumentationCancelRequest1() {
    Norv::Backend* const backend = Norv::processBackend();
    const auto nodes = backend == nullptr ? nullptr : backend->selectPowerManagementNodes();
    const bool hasNode = nodes != nullptr && nodes->size() > 0;
    return Norv::reported(hasNode ? nodes->cancelRequest(0)
                                  : Norv::PowerRequestOutcome{false, "cancellation: no node is offered"})
               ? 1
               : 0;
}

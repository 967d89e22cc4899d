#include "Norv/Instrumentation.h"
#include "Norv/Machine.h"

#include "Backend.h"
#include "Report.h"
#include "base/Utf8.h"
#include "config/Configuration.h"

#include <cerrno>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

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

/**
 * The log's record of the outcome of a power request, which is written whatever the log's thresholds. All memory for it
 * is allocated before the request is carried out, so that an accepted request is recorded even if memory ends
 * meanwhile.
 */
class RequestRecord {
public:
    RequestRecord() { _text.reserve(longestPrefix + longestDescription + _requester.size()); }

    /** Writes the record, and returns whether the request was accepted. */
    bool reported(const PowerRequestOutcome& outcome) {
        _text = outcome.accepted ? Norv::acceptedRequestText : Norv::refusedRequestText;
        _text.append(beginningOf(outcome.description, longestDescription)).append(_requester);
        OrvLog::OrvLogger::logLevelMessage(
            static_cast<const char*>(__func__), __FILE__, __LINE__, _category, alwaysWrittenLevel, nullptr,
            outcome.accepted ? OrvLog::POWER_REQUEST_ACCEPTED_RECORD : OrvLog::POWER_REQUEST_REFUSED_RECORD, 0, _text);
        return outcome.accepted;
    }

private:
    static constexpr std::size_t longestPrefix = 32;
    /** In bytes; a line of the log has no room for more. */
    static constexpr std::size_t longestDescription = 3072;

    const std::string _category = instrumentationCategory;
    const std::string _requester = requester();
    std::string _text;
};

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
    RequestRecord record;
    return record.reported(_implementation->write(property, value));
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

namespace {

/** The nodes of this process as they are now; null where the first, to which power requests go, is missing. */
std::unique_ptr<Norv::NodeSelection> nodesNow() {
    Norv::Backend* const backend = Norv::processBackend();
    auto nodes = backend == nullptr ? nullptr : backend->selectPowerManagementNodes();
    return nodes == nullptr || nodes->size() == 0 ? nullptr : std::move(nodes);
}

} // namespace

const char* orvInstrumentationPowerNode1() {
    static const std::string node = [] {
        const auto nodes = nodesNow();
        return nodes == nullptr ? std::string() : nodes->path(0);
    }();
    return node.c_str();
}

int orvInstrumentationPowerState1() {
    const auto nodes = nodesNow();
    const auto state = nodes == nullptr ? std::nullopt : nodes->powerState(0);
    return state ? static_cast<int>(*state) : -1;
}

int orvInstrumentationCancelRequest1() {
    const auto nodes = nodesNow();
    Norv::RequestRecord record;
    return record.reported(nodes == nullptr ? Norv::PowerRequestOutcome{false, "cancellation: no node is offered"}
                                            : nodes->cancelRequest(0))
               ? 1
               : 0;
}

#include "Norv/Instrumentation.h"

#include "Agent.h"
#include "Transcript.h"

namespace Norv {

using OrvTest::Agent;
using OrvTest::Node;
using OrvTest::Transcript;

namespace {

/** The library's internal form of a path differs from the text that people see. */
const std::string pathPrefix = "node/";

std::string shown(const std::vector<unsigned int>& values) {
    std::string text;
    for (const unsigned int value : values) {
        text += (text.empty() ? "" : ", ") + std::to_string(value);
    }
    return '[' + text + ']';
}

std::string shown(unsigned int value) {
    return std::to_string(value);
}
std::string shown(bool value) {
    return value ? "true" : "false";
}
std::string shown(const std::string& value) {
    return '"' + value + '"';
}

/** Asks for the fault of a call. If the fault throws, the call is recorded here, since it does not return then. */
void called(const std::string& call, const std::string& arguments) {
    try {
        Agent::instance().faults.next(call);
    } catch (...) {
        Transcript::instance().call("instrumentation." + call + '(' + arguments + ") throws");
        throw;
    }
}

template <typename Result>
void answered(const std::string& call, const std::string& arguments, const Result& result) {
    Transcript::instance().call("instrumentation." + call + '(' + arguments + ") -> " + shown(result));
}

template <typename Value>
bool answerProperty(NodeLexicon::Properties property, Value& value, const std::optional<Value>& content) {
    const std::string arguments = std::to_string(property) + ", " + shown(value);
    called("getProperty", arguments);
    if (content) {
        value = *content;
        Transcript::instance().call("instrumentation.getProperty(" + arguments + ") -> true, " + shown(value));
    } else {
        answered("getProperty", arguments, false);
    }
    return content.has_value();
}

} // namespace

class Instrumentation::Implementation {
public:
    std::size_t position = 0;
    bool selected = false;

    bool onNode() const { return selected && position < Agent::instance().nodes.size(); }
    Node node() const { return onNode() ? Agent::instance().nodes[position] : Node(); }
};

Instrumentation::Instrumentation() {
    try {
        Agent::instance().faults.next("Instrumentation");
    } catch (...) {
        Transcript::instance().call("Instrumentation() throws");
        throw;
    }
    Transcript::instance().call("Instrumentation()");
    _implementation = new Implementation;
    ++Agent::instance().instrumentations;
}

Instrumentation::~Instrumentation() {
    Transcript::instance().call("~Instrumentation()");
    --Agent::instance().instrumentations;
    delete _implementation;
}

bool Instrumentation::selectNode(NodeLexicon::NodeType type) {
    called("selectNode", std::to_string(type));
    _implementation->selected = type == NodeLexicon::POWER_MANAGEMENT_NODE;
    _implementation->position = 0;
    answered("selectNode", std::to_string(type), _implementation->onNode());
    return _implementation->onNode();
}

Instrumentation::operator bool() {
    called("bool", "");
    Transcript::instance().reading("instrumentation.bool() -> " + shown(_implementation->onNode()));
    return _implementation->onNode();
}

Instrumentation& Instrumentation::operator++() {
    called("++", "");
    ++_implementation->position;
    Transcript::instance().call("++instrumentation");
    return *this;
}

std::string Instrumentation::getPathToNode() {
    called("getPathToNode", "");
    std::string path = _implementation->onNode() ? pathPrefix + std::to_string(_implementation->position) : "";
    answered("getPathToNode", "", path);
    return path;
}

// The real library has no static members.
// NOLINTBEGIN(readability-convert-member-functions-to-static)

std::string Instrumentation::convertPathToString(const std::string& path) {
    called("convertPathToString", shown(path));
    const std::size_t position = std::stoul(path.substr(pathPrefix.size()));
    std::string text = Agent::instance().nodes.at(position).path;
    answered("convertPathToString", shown(path), text);
    return text;
}

bool Instrumentation::setProperty(NodeLexicon::Properties property, unsigned int& value) {
    const std::string arguments = std::to_string(property) + ", " + shown(value);
    called("setProperty", arguments);
    answered("setProperty", arguments, Agent::instance().acceptsWrites);
    return Agent::instance().acceptsWrites;
}

// NOLINTEND(readability-convert-member-functions-to-static)

bool Instrumentation::getProperty(NodeLexicon::Properties property, std::vector<unsigned int>& values) {
    const Node node = _implementation->node();
    return answerProperty(property, values,
                          property == NodeLexicon::POWER_STATE_LIST ? node.powerStates : std::nullopt);
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, unsigned int& value) {
    const Node node = _implementation->node();
    return answerProperty(property, value, property == NodeLexicon::POWER_STATE ? node.powerState : std::nullopt);
}

} // namespace Norv

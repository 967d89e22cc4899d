#include "orvcim/Commands.h"
#include "text/ObjectPathText.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <string_view>
#include <unordered_map>

namespace ObjectManager::Orvcim {

namespace {

/** A text as a quoted string of the DOT language. */
std::string dotString(std::string_view text) {
    std::string quoted = "\"";
    for (const char c : text) {
        if (c == '\n') {
            quoted += "\\n";
        } else {
            quoted += c == '"' || c == '\\' ? std::string{'\\', c} : std::string{c};
        }
    }
    return quoted + '"';
}

/** A graph in the DOT language, whose nodes are instances and whose edges are associations. */
class Graph {
public:
    explicit Graph(const Catalogue& catalogue) : _catalogue(catalogue) {}

    void addInstance(const ObjectPath& path) { nodeOf(path); }

    /**
     * Adds an edge from the object of the first reference to those of the others; the association's other properties
     * are the label.
     */
    void addAssociation(const Instance& association) {
        const Class* known = _catalogue.find(association.path.className);
        std::string label = association.path.className;
        std::vector<std::string> nodes;
        for (const NamedValue& property : association.properties) {
            if (const auto* end = std::get_if<std::shared_ptr<const ObjectPath>>(&property.value.content)) {
                nodes.push_back(nodeOf(**end));
            } else {
                const Property* declared = known == nullptr ? nullptr : known->property(property.name);
                label += fmt::format("\n{}: {}", property.name, plainText(property.value, declared));
            }
        }
        for (std::size_t i = 1; i < nodes.size(); ++i) {
            _edges += fmt::format("    {} -> {} [label={}];\n", nodes.front(), nodes[i], dotString(label));
        }
    }

    std::string text() const { return "digraph orvcim {\n    node [shape=box];\n" + _nodes + _edges + "}\n"; }

private:
    /** The name of the path's node; adds the node if the graph does not have it yet. */
    std::string nodeOf(const ObjectPath& path) {
        const auto [known, added] = _names.try_emplace(path, fmt::format("n{}", _names.size() + 1));
        if (added) {
            _nodes += fmt::format("    {} [label={}];\n", known->second, dotString(labelOf(path)));
        }
        return known->second;
    }

    /** The class, and below it the keys, except those that repeat class names. */
    static std::string labelOf(const ObjectPath& path) {
        std::string label = path.className;
        for (const NamedValue& key : path.keys) {
            if (!equalNames(key.name, "CreationClassName") && !equalNames(key.name, "SystemCreationClassName")) {
                label += fmt::format("\n{}: {}", key.name, plainText(key.value, nullptr));
            }
        }
        return label;
    }

    const Catalogue& _catalogue;
    std::unordered_map<ObjectPath, std::string, ObjectPathHash> _names;
    std::string _nodes;
    std::string _edges;
};

bool isAssociation(const Catalogue& catalogue, const Registration& registration) {
    return !catalogue.references(registration.className).empty();
}

Graph graphOf(Session& session) {
    Graph graph(session.catalogue());
    const std::string& nameSpace = session.options().nameSpace;
    const auto classes = session.dispatcher().registry().all(nameSpace, ProviderKind::instance);
    const auto classPath = [&](const Registration* registration) {
        return ObjectPath{{}, nameSpace, registration->className, {}};
    };
    for (const Registration* registration : classes) {
        if (!isAssociation(session.catalogue(), *registration)) {
            const auto paths =
                session.dispatcher().enumerateInstanceNames(Session::invocation(), classPath(registration));
            std::for_each(paths.begin(), paths.end(), [&](const ObjectPath& path) { graph.addInstance(path); });
        }
    }
    for (const Registration* registration : classes) {
        if (isAssociation(session.catalogue(), *registration)) {
            const auto associations =
                session.dispatcher().enumerateInstances(Session::invocation(), classPath(registration), std::nullopt);
            std::for_each(associations.begin(), associations.end(),
                          [&](const Instance& association) { graph.addAssociation(association); });
        }
    }
    return graph;
}

} // namespace

void writeGraph(Session& session) {
    if (session.options().format != Format::table) {
        throw UsageError("found --format, expected none: graph writes DOT");
    }
    session.out() << graphOf(session).text();
}

} // namespace ObjectManager::Orvcim

/**
 * Access to the tree of managed nodes: liborvinstrumentation.so.1.
 */
#ifndef NORV_INSTRUMENTATION_H
#define NORV_INSTRUMENTATION_H

#include "Norv/NodeLexicon.h"

#include <string>
#include <vector>

namespace Norv {

/**
 * A cursor over the nodes of one type. A cursor belongs to one thread at a time; different cursors may be used by
 * different threads at once.
 *
 * The object is one word and its members are neither const nor inline: the library that implements them can be
 * exchanged without rebuilding its users.
 */
class Instrumentation {
public:
    /** A cursor on the tree that stands on no node yet. May throw what derives from std::exception. */
    Instrumentation();
    ~Instrumentation();
    Instrumentation(const Instrumentation&) = delete;
    Instrumentation& operator=(const Instrumentation&) = delete;

    /**
     * Selects every node of a type and places the cursor on the first.
     *
     * @return whether there is such a node.
     */
    bool selectNode(NodeLexicon::NodeType type);

    /** Whether the cursor stands on a selected node. */
    operator bool();

    /** Moves to the next selected node; past the last one, the cursor stands on none. */
    Instrumentation& operator++();

    /** The current node's path in the library's own form; empty where the cursor stands on no node. */
    std::string getPathToNode();

    /** A path of `getPathToNode` as text for people: the node's identity, stable from one request to the next. */
    std::string convertPathToString(const std::string& path);

    /**
     * Reads a list property of the current node.
     *
     * @param[out] values the list; untouched where the result is false.
     * @return whether the node has the property.
     */
    bool getProperty(NodeLexicon::Properties property, std::vector<unsigned int>& values);

    /**
     * Reads a number property of the current node.
     *
     * @param[out] value the number; untouched where the result is false.
     * @return whether the node has the property.
     */
    bool getProperty(NodeLexicon::Properties property, unsigned int& value);

    /**
     * Writes a number property of the current node.
     *
     * @param value the number to write; not changed.
     * @return whether the write was accepted. The reason of a refusal is in the log.
     */
    bool setProperty(NodeLexicon::Properties property, unsigned int& value);

private:
    class Implementation;
    Implementation* _implementation;
};

} // namespace Norv

#endif

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
 * A cursor over the nodes of one type. Only one thread at a time may use a cursor; several threads may use different
 * cursors at once.
 *
 * The object is one word, and its members are neither const nor inline, so that the library can be replaced without
 * rebuilding its users.
 */
class Instrumentation {
public:
    /** Makes a cursor that does not stand on a node yet. May throw exceptions that derive from std::exception. */
    Instrumentation();
    ~Instrumentation();
    Instrumentation(const Instrumentation&) = delete;
    Instrumentation& operator=(const Instrumentation&) = delete;

    /**
     * Selects all nodes of a type, and moves the cursor to the first one.
     *
     * @return whether there is such a node.
     */
    bool selectNode(NodeLexicon::NodeType type);

    /** Whether the cursor stands on a selected node. */
    operator bool();

    /** Moves the cursor to the next selected node; after the last one, it stands on no node. */
    Instrumentation& operator++();

    /** The current node's path in the library's own form; empty if the cursor stands on no node. */
    std::string getPathToNode();

    /**
     * Converts a path of `getPathToNode` to a text for people. The text is the node's identity, and stays the same from
     * one request to the next.
     */
    std::string convertPathToString(const std::string& path);

    /**
     * Reads a list property of the current node.
     *
     * @param[out] values the list; unchanged if the result is false.
     * @return whether the node has the property.
     */
    bool getProperty(NodeLexicon::Properties property, std::vector<unsigned int>& values);

    /**
     * Reads a number property of the current node.
     *
     * @param[out] value the number; unchanged if the result is false.
     * @return whether the node has the property.
     */
    bool getProperty(NodeLexicon::Properties property, unsigned int& value);

    /**
     * Writes a number property of the current node.
     *
     * @param value the number to write; not changed.
     * @return whether the write was accepted. The log has the reason of a refusal.
     */
    bool setProperty(NodeLexicon::Properties property, unsigned int& value);

private:
    class Implementation;
    Implementation* _implementation;
};

} // namespace Norv

#endif

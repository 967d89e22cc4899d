/**
 * The vocabulary of the instrumentation tree: node types and property numbers.
 */
#ifndef NORV_NODELEXICON_H
#define NORV_NODELEXICON_H

namespace Norv::NodeLexicon {

/** The types of nodes. The numbers are fixed. */
enum NodeType : int {
    POWER_MANAGEMENT_NODE = 40,
};

/** The properties of nodes. The numbers are fixed. */
enum Properties : int {
    /** The current power state, a number; writing it changes the power state. */
    POWER_STATE = 123,
    /** The power states that the element can be put into, a list of numbers. */
    POWER_STATE_LIST = 125,
};

} // namespace Norv::NodeLexicon

#endif

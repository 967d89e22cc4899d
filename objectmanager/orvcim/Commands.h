/**
 * What the program can do. Every command writes its answer to the session's stream and throws where it fails: CimError,
 * Failure, UsageError, ObjectPathError.
 */
#ifndef ORVCIM_COMMANDS_H
#define ORVCIM_COMMANDS_H

#include "orvcim/Session.h"

namespace ObjectManager::Orvcim {

/** The registered classes of the namespace. */
void listClasses(Session& session);
/** The paths of a class's instances. */
void enumerateNames(Session& session);
/** A class's instances. */
void enumerateInstances(Session& session);
/** One instance. */
void getInstance(Session& session);
/** Says on standard error where the outcome of a call is not known beyond its return value. */
void reportUnknown(const MethodOutcome& outcome);
/** One call of a method. */
void invokeMethod(Session& session);

/** The instances that are associated with one. */
void listAssociators(Session& session);
void listAssociatorNames(Session& session);
/** The associations that refer to an instance. */
void listReferences(Session& session);
void listReferenceNames(Session& session);

/** All instances with their associations, as a graph in the DOT language of Graphviz. */
void writeGraph(Session& session);

/** The power states of the machine, or what its services can do where nobody serves the states. Throws Failure, after
 * its answer, where a state is not known. */
void powerStatus(Session& session);
void powerReboot(Session& session);
void powerShutdown(Session& session);
/** Takes back the reboot or shutdown that is under way. */
void powerCancel(Session& session);

/** Answers clients on the network until a signal ends the program. Only where it was built with the server. */
void serve(Session& session);

/** What is found of every registered provider and of the embedded agent. Throws Failure, after its answer, where
 * something is wrong. */
void checkProviders(Session& session);

} // namespace ObjectManager::Orvcim

#endif

/**
 * The commands of the program. Each writes its answer to the session's stream, and throws CimError, Failure, UsageError
 * or ObjectPathError if it fails.
 */
#ifndef ORVCIM_COMMANDS_H
#define ORVCIM_COMMANDS_H

#include "orvcim/Session.h"

namespace ObjectManager::Orvcim {

/** Lists the registered classes of the namespace. */
void listClasses(Session& session);
/** Lists the paths of a class's instances. */
void enumerateNames(Session& session);
/** Shows the instances of a class. */
void enumerateInstances(Session& session);
/** Shows one instance. */
void getInstance(Session& session);
/** Reports on standard error if nothing but the return value says how a call ended. */
void reportUnknown(const MethodOutcome& outcome);
/** Calls a method. */
void invokeMethod(Session& session);

/** Shows the instances that are associated with an instance. */
void listAssociators(Session& session);
void listAssociatorNames(Session& session);
/** Shows the associations that refer to an instance. */
void listReferences(Session& session);
void listReferenceNames(Session& session);

/** Writes all instances with their associations as a graph in the DOT language of Graphviz. */
void writeGraph(Session& session);

/** Shows the namespaces, the registered profiles, and what each profile leads to. Throws Failure if there is none. */
void listProfiles(Session& session);

/** Shows the power states of the machine; if no provider serves them, the states that its services can be asked for.
 * Throws Failure after the answer if a state is not known. */
void powerStatus(Session& session);
void powerReboot(Session& session);
void powerShutdown(Session& session);
/** Cancels the reboot or shutdown that is under way. */
void powerCancel(Session& session);

/** Serves clients on the network until a signal ends the program. Only in builds with the server. */
void serve(Session& session);

/** Reports on every registered provider and on the embedded agent. Throws Failure after the answer if something is
 * wrong. */
void checkProviders(Session& session);

} // namespace ObjectManager::Orvcim

#endif

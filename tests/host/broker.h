/*
 * A broker in plain C, with the functions that the providers call; the other slots are null. The objects that a
 * provider makes belong to the request that runs in the provider's thread.
 */
#ifndef HOST_BROKER_H
#define HOST_BROKER_H

#include "cmpidt.h"
#include "cmpift.h"

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

/* Function tables of CMPI 2.0, or tables of a later object manager: the latter have a higher version and more slots at
   the end, which end the program when they are called. */
enum TableLength { knownTables, longerTables };

/* Serves an up-call for the instance names or the instances of a class, and returns these to the result. If it fails,
   the up-call fails. */
typedef CMPIStatus UpCall(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* classPath,
                          CMPIResult* result);

/* Makes a broker, which lives as long as the process. An up-call may be null: then no class has instances. */
const CMPIBroker* newBroker(enum TableLength length, UpCall* names, UpCall* instances);

/* Begin and end a request of the calling thread. endRequest frees all objects that were made since beginRequest. */
void beginRequest(void);
void endRequest(void);

CMPIContext* newContext(const CMPIBroker* broker);

/* Makes a result. It keeps each path, instance and value that a provider returns as a line of text. */
CMPIResult* newResult(const CMPIBroker* broker);
const char* returnedText(const CMPIResult* result);
int isClosed(const CMPIResult* result);
/* The paths that were returned, `count` of them. */
CMPIObjectPath** returnedPaths(const CMPIResult* result, size_t* count);

CMPIArgs* newArguments(const CMPIBroker* broker);

#ifdef __cplusplus
}
#endif

#endif

/*
 * A broker in plain C, as far as the providers use one. What a provider makes and returns belongs to the request that
 * runs in its thread; slots that no provider has a use for are null.
 */
#ifndef HOST_BROKER_H
#define HOST_BROKER_H

#include "cmpidt.h"
#include "cmpift.h"

#include <stddef.h>

#ifdef __cplusplus
extern "C" {
#endif

/* The tables as CMPI 2.0 has them, or those of a later object manager: a higher version, with slots behind the known
   ones that end the program when they are called. */
enum TableLength { knownTables, longerTables };

/* Answers an up-call for the instance names or the instances of a class by returning them into the result; a failure is
   the caller's. */
typedef CMPIStatus UpCall(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* classPath,
                          CMPIResult* result);

/* A broker of its own; it lives as long as the process. An up-call may be null: then no class has an instance. */
const CMPIBroker* newBroker(enum TableLength length, UpCall* names, UpCall* instances);

/* Between these two lies one request of the calling thread: the second frees all that was made since the first. */
void beginRequest(void);
void endRequest(void);

CMPIContext* newContext(const CMPIBroker* broker);

/* What a provider returns into a result is kept there as text, one line for each path, instance or value. */
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

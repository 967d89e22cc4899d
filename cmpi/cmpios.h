/**
 * The operating system's types that appear in the function tables of the Common Manageability Programming Interface,
 * version 2.0 (The Open Group, C061), as they are on systems with POSIX threads.
 */
#ifndef CMPIOS_H
#define CMPIOS_H

#include "cmpipl.h"

#include <stddef.h>
#include <time.h>

#ifdef __cplusplus
extern "C" {
#endif

#define CMPI_THREAD_RETURN void*
#define CMPI_THREAD_TYPE void*
#define CMPI_MUTEX_TYPE void*
#define CMPI_COND_TYPE void*
#define CMPI_THREAD_KEY_TYPE unsigned int

/** Body of a thread. */
typedef CMPI_THREAD_RETURN (*CMPIThreadFunc)(void*);
/** Run once by CMPIBrokerExtFT.threadOnce. */
typedef void (*CMPIThreadOnceFunc)(void);
/** Called with a thread's value for a key when the thread ends. */
typedef void (*CMPIThreadKeyCleanupFunc)(void*);

#ifdef __cplusplus
}
#endif

#endif

/*
 * Threads, mutexes and conditions of the operating system under CMPI's names. Handles are those of POSIX threads, and
 * results are error numbers. A function that gets a null pointer instead of a handle returns EINVAL or, if it has no
 * result, does nothing.
 */
#include "broker/Objects.h"

#include <bit>
#include <cerrno>
#include <ctime>
#include <memory>
#include <pthread.h>

namespace ObjectManager {

namespace {

static_assert(sizeof(pthread_t) == sizeof(void*) && sizeof(pthread_key_t) == sizeof(unsigned int) &&
              sizeof(pthread_once_t) == sizeof(int));

pthread_mutex_t* mutexOf(void* handle) {
    return static_cast<pthread_mutex_t*>(handle);
}

pthread_cond_t* conditionOf(void* handle) {
    return static_cast<pthread_cond_t*>(handle);
}

pthread_t threadOf(void* handle) {
    return std::bit_cast<pthread_t>(handle);
}

/** The file name of a library, as a text in the memory of the current request. */
char* resolveFileName(const char* library) {
    Request* request = Request::current();
    if (library == nullptr || request == nullptr) {
        return nullptr;
    }
    return copyText(request->memory(), "lib" + std::string(library) + ".so");
}

void* newThread(CMPIThreadFunc function, void* argument, int detached) {
    if (function == nullptr) {
        return nullptr;
    }
    pthread_attr_t attributes;
    pthread_attr_init(&attributes);
    pthread_attr_setdetachstate(&attributes, detached != 0 ? PTHREAD_CREATE_DETACHED : PTHREAD_CREATE_JOINABLE);
    pthread_t thread{};
    const int error = pthread_create(&thread, &attributes, function, argument);
    pthread_attr_destroy(&attributes);
    return error == 0 ? std::bit_cast<void*>(thread) : nullptr;
}

int joinThread(void* thread, void** result) {
    return thread != nullptr ? pthread_join(threadOf(thread), result) : EINVAL;
}

int exitThread(void* result) {
    pthread_exit(result);
}

int cancelThread(void* thread) {
    return thread != nullptr ? pthread_cancel(threadOf(thread)) : EINVAL;
}

int threadSleep(CMPIUint32 milliseconds) {
    timespec left{static_cast<time_t>(milliseconds / 1000), static_cast<long>(milliseconds % 1000) * 1'000'000};
    int error = 0;
    do {
        error = clock_nanosleep(CLOCK_MONOTONIC, 0, &left, &left);
    } while (error == EINTR);
    return error;
}

int threadOnce(int* once, CMPIThreadOnceFunc function) {
    return once != nullptr && function != nullptr ? pthread_once(once, function) : EINVAL;
}

int createThreadKey(unsigned int* key, CMPIThreadKeyCleanupFunc cleanup) {
    return key != nullptr ? pthread_key_create(key, cleanup) : EINVAL;
}

int destroyThreadKey(unsigned int key) {
    return pthread_key_delete(key);
}

void* getThreadSpecific(unsigned int key) {
    return pthread_getspecific(key);
}

int setThreadSpecific(unsigned int key, void* value) {
    return pthread_setspecific(key, value);
}

void* newMutex(int) {
    return new pthread_mutex_t(PTHREAD_MUTEX_INITIALIZER);
}

void destroyMutex(void* mutex) {
    if (mutex != nullptr) {
        pthread_mutex_destroy(mutexOf(mutex));
        delete mutexOf(mutex);
    }
}

void lockMutex(void* mutex) {
    if (mutex != nullptr) {
        pthread_mutex_lock(mutexOf(mutex));
    }
}

void unlockMutex(void* mutex) {
    if (mutex != nullptr) {
        pthread_mutex_unlock(mutexOf(mutex));
    }
}

void* newCondition(int) {
    return new pthread_cond_t(PTHREAD_COND_INITIALIZER);
}

void destroyCondition(void* condition) {
    if (condition != nullptr) {
        pthread_cond_destroy(conditionOf(condition));
        delete conditionOf(condition);
    }
}

int condWait(void* condition, void* mutex) {
    return condition != nullptr && mutex != nullptr ? pthread_cond_wait(conditionOf(condition), mutexOf(mutex))
                                                    : EINVAL;
}

/** @param until a time of the real-time clock. */
int timedCondWait(void* condition, void* mutex, timespec* until) {
    return condition != nullptr && mutex != nullptr && until != nullptr
               ? pthread_cond_timedwait(conditionOf(condition), mutexOf(mutex), until)
               : EINVAL;
}

int signalCondition(void* condition) {
    return condition != nullptr ? pthread_cond_signal(conditionOf(condition)) : EINVAL;
}

} // namespace

const CMPIBrokerExtFT operatingSystemTable = {
    CMPIVersion200, resolveFileName, newThread,       joinThread,       exitThread,        cancelThread,
    threadSleep,    threadOnce,      createThreadKey, destroyThreadKey, getThreadSpecific, setThreadSpecific,
    newMutex,       destroyMutex,    lockMutex,       unlockMutex,      newCondition,      destroyCondition,
    condWait,       timedCondWait,   signalCondition,
};

} // namespace ObjectManager

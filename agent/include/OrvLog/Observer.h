/**
 * An optional function of liborvlog.so.1 with which a program receives the log records of the libraries in its process.
 *
 * Another agent's log library need not have this function. A program therefore does not link it: it passes the name
 * below to dlsym(3), with the handle of a library that it has loaded and that uses the log, and does without if the
 * function is missing.
 */
#ifndef ORVLOG_OBSERVER_H
#define ORVLOG_OBSERVER_H

#include <cstddef>

namespace OrvLog {

/**
 * The kinds of records, by which a program can recognise those that it acts on. The numbers are fixed. A library that
 * logs such a record passes its kind to OrvLogger::logLevelMessage, as the first of the two unnamed numbers.
 */
enum RecordKind : int {
    /** A record that is for people only. */
    ORDINARY_RECORD = 0,
    /** The record that tells which machine the instrumentation manages. It is logged once in a process. */
    MACHINE_RECORD = 1,
    /** A power request that the machine accepted: which request, when it will be done, and who made it. */
    POWER_REQUEST_ACCEPTED_RECORD = 2,
    /** A power request that was refused, and why. */
    POWER_REQUEST_REFUSED_RECORD = 3,
};

/**
 * A record of kind "log". The texts belong to the log and are valid while the observer runs. They have sizes instead of
 * a null at the end.
 */
struct ObservedRecord1 {
    /** A RecordKind. */
    int kind;
    int level;
    const char* category;
    std::size_t categorySize;
    const char* text;
    std::size_t textSize;
};

struct Observer1 {
    /** The observer does not receive records below this level. */
    int lowestLevel;
    /**
     * Called with each record, whatever the log's thresholds, before the record is written. It runs in the thread that
     * logs, and in several threads at once. It must neither throw nor log.
     */
    void (*record)(void* context, const ObservedRecord1* record);
    /** The first argument of `record`; belongs to the observer. */
    void* context;
};

/**
 * Sets the process's only observer, in place of the former one; null removes it.
 *
 * @param observer belongs to the caller. It must stay valid until another one has replaced it and each thread that was
 *                 logging at that moment has finished doing so.
 */
using Observe1 = void(const Observer1* observer);

/** The function's name for dlsym(3). */
inline constexpr const char* observe1Name = "orvLogObserve1";

} // namespace OrvLog

/** The embedded agent's function of type OrvLog::Observe1. */
extern "C" void orvLogObserve1(const OrvLog::Observer1* observer);

#endif

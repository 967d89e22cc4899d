/**
 * How a program hears what the libraries in it log: an optional function of liborvlog.so.1.
 *
 * The log library of another agent need not have it. A program therefore does not link it: it asks dlsym(3) for the
 * name that stands here, of a library that it loaded and that uses the log, and does without where there is none.
 */
#ifndef ORVLOG_OBSERVER_H
#define ORVLOG_OBSERVER_H

#include <cstddef>

namespace OrvLog {

/**
 * What a record tells that a program may act on. The numbers are fixed. Whoever logs such a record hands its kind to
 * OrvLogger::logLevelMessage as the first of the numbers that have no name there.
 */
enum RecordKind : int {
    /** For people only. */
    ORDINARY_RECORD = 0,
    /** Which machine the instrumentation manages. Once in a process. */
    MACHINE_RECORD = 1,
    /** A power request that the machine accepted: what was asked, when it will be over, and who asked. */
    POWER_REQUEST_ACCEPTED_RECORD = 2,
    /** A power request that was refused, and why. */
    POWER_REQUEST_REFUSED_RECORD = 3,
};

/** A record of kind "log". The texts are the log's, valid while the observer runs; they end where their sizes say. */
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
    /** Records below this level are not handed over. */
    int lowestLevel;
    /**
     * Called with each record, whatever the log's thresholds, in the thread that logs, before the record is written.
     * Several threads call it at a time. It neither throws nor logs.
     */
    void (*record)(void* context, const ObservedRecord1* record);
    /** For `record`; the observer's own. */
    void* context;
};

/**
 * Makes an observer the process's only one, in place of the one before; null is none.
 *
 * @param observer stays the caller's. It is valid until another one has taken its place and no thread that was logging
 *                 at that moment logs any more.
 */
using Observe1 = void(const Observer1* observer);

/** The name of the function. */
inline constexpr const char* observe1Name = "orvLogObserve1";

} // namespace OrvLog

/** The embedded agent's function of type OrvLog::Observe1. */
extern "C" void orvLogObserve1(const OrvLog::Observer1* observer);

#endif

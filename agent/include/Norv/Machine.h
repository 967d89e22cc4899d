/**
 * What a program that serves others needs to know of, and tell, the instrumentation: optional functions of
 * liborvinstrumentation.so.1.
 *
 * The library of another agent need not have them. A program therefore does not link them: it asks dlsym(3) for the
 * names that stand here, of a library that it loaded and that uses the instrumentation, and does without where there
 * are none.
 */
#ifndef NORV_MACHINE_H
#define NORV_MACHINE_H

namespace Norv {

/** Whose power the process manages. The numbers are fixed. */
enum Machine : int {
    /** Nobody's: the configuration cannot be used. */
    NO_MACHINE = 0,
    /** That of a simulated machine. Whatever is asked of it happens in a file. */
    SIMULATED_MACHINE = 1,
    /** That of a real machine. */
    REAL_MACHINE = 2,
};

/**
 * Tells whose power the process manages; asks nothing of the machine. May be called from any thread.
 *
 * @return a Machine, the same one for the life of the process.
 */
using Machine1 = int();

/**
 * Says on whose behalf the calling thread acts from now on: the record of a power request in the log names him.
 *
 * @param whom a text for people, such as "alice from 192.0.2.7"; null for nobody but the process itself. It stays the
 *             caller's, and is valid until the thread gives another one.
 */
using OnBehalfOf1 = void(const char* whom);

/**
 * Tells to which node power requests go: the provider writes to the first one, whichever service a client names.
 *
 * @return the node's path below the root; empty where there is none. It is the same one for the life of the process.
 */
using PowerNode1 = const char*();

/**
 * Takes back the power request that is under way, by whomever it was made. The log gets a record of it as of a power
 * request. May be called from any thread, and waits for the machine as a request does.
 *
 * @return 1 where the request was taken back, 0 where there is none or it is too late.
 */
using CancelRequest1 = int();

/** The names of the functions. */
inline constexpr const char* machine1Name = "orvInstrumentationMachine1";
inline constexpr const char* powerNode1Name = "orvInstrumentationPowerNode1";
inline constexpr const char* cancelRequest1Name = "orvInstrumentationCancelRequest1";
inline constexpr const char* onBehalfOf1Name = "orvInstrumentationOnBehalfOf1";

} // namespace Norv

/** The embedded agent's function of type Norv::Machine1. */
extern "C" int orvInstrumentationMachine1();

/** The embedded agent's function of type Norv::OnBehalfOf1. */
extern "C" void orvInstrumentationOnBehalfOf1(const char* whom);

/** The embedded agent's function of type Norv::PowerNode1. */
extern "C" const char* orvInstrumentationPowerNode1();

/** The embedded agent's function of type Norv::CancelRequest1. */
extern "C" int orvInstrumentationCancelRequest1();

#endif

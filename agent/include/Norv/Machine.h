/**
 * Optional functions of liborvinstrumentation.so.1 for programs that serve clients: they tell which machine is managed,
 * and for whom requests are made.
 *
 * Another agent's library need not have these functions. A program therefore does not link them: it passes the names
 * below to dlsym(3), with the handle of a library that it has loaded and that uses the instrumentation, and does
 * without the functions that are missing.
 */
#ifndef NORV_MACHINE_H
#define NORV_MACHINE_H

namespace Norv {

/** The kind of machine whose power the process manages. The numbers are fixed. */
enum Machine : int {
    /** No machine: the configuration cannot be used. */
    NO_MACHINE = 0,
    /** A simulated machine: requests change only a file. */
    SIMULATED_MACHINE = 1,
    /** A real machine. */
    REAL_MACHINE = 2,
};

/**
 * Tells which kind of machine the process manages, without contacting it. May be called from any thread.
 *
 * @return a Machine, which stays the same until the process ends.
 */
using Machine1 = int();

/**
 * Sets the user on whose behalf the calling thread acts from now on. The log records of power requests name this user.
 *
 * @param whom a text for people, such as "alice from 192.0.2.7"; null if the process acts for itself. The text belongs
 *             to the caller, and must stay valid until the thread's next call.
 */
using OnBehalfOf1 = void(const char* whom);

/**
 * Tells which node gets the power requests: the provider writes to the first node, whichever service a client names.
 *
 * @return the node's path below the root, which stays the same until the process ends; empty if there is no node.
 */
using PowerNode1 = const char*();

/**
 * Tells the state of the node to which power requests go. May be called from any thread; waits for the machine as long
 * as a read of the property does.
 *
 * @return the current value of property 123; -1 if there is no node, or if its state cannot be told.
 */
using PowerState1 = int();

/**
 * Cancels the power request that is under way, whoever made it. The outcome is logged like that of a power request. May
 * be called from any thread; waits for the machine as long as a power request does.
 *
 * @return 1 if the request was cancelled; 0 if there is no request, or if it is too late.
 */
using CancelRequest1 = int();

/** How the log records begin that tell the outcome of a power request. */
inline constexpr const char* acceptedRequestText = "Power request accepted: ";
inline constexpr const char* refusedRequestText = "Power request refused: ";

/** The functions' names for dlsym(3). */
inline constexpr const char* machine1Name = "orvInstrumentationMachine1";
inline constexpr const char* powerNode1Name = "orvInstrumentationPowerNode1";
inline constexpr const char* powerState1Name = "orvInstrumentationPowerState1";
inline constexpr const char* cancelRequest1Name = "orvInstrumentationCancelRequest1";
inline constexpr const char* onBehalfOf1Name = "orvInstrumentationOnBehalfOf1";

} // namespace Norv

/** The embedded agent's function of type Norv::Machine1. */
extern "C" int orvInstrumentationMachine1();

/** The embedded agent's function of type Norv::OnBehalfOf1. */
extern "C" void orvInstrumentationOnBehalfOf1(const char* whom);

/** The embedded agent's function of type Norv::PowerNode1. */
extern "C" const char* orvInstrumentationPowerNode1();

/** The embedded agent's function of type Norv::PowerState1. */
extern "C" int orvInstrumentationPowerState1();

/** The embedded agent's function of type Norv::CancelRequest1. */
extern "C" int orvInstrumentationCancelRequest1();

#endif

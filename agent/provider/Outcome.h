/**
 * Turns what an operation of a provider throws into the status that its caller gets.
 */
#ifndef PROVIDER_OUTCOME_H
#define PROVIDER_OUTCOME_H

#include "provider/BrokerCalls.h"

#include <exception>

namespace Norv::Provider {

/**
 * To be called first in each catch (...). When a host cancels the thread, the thread is unwound without a C++
 * exception; to catch that would end the process.
 */
inline void letCancellationPass() {
    if (std::current_exception() == nullptr) {
        throw;
    }
}

/**
 * Carries out an operation. @return its status. No exception leaves this function; only a cancellation does.
 *
 * @param report is called with the reason of a failure. If it throws, that is ignored, and the status has no message.
 */
template <typename Operation, typename Report>
CMPIStatus outcomeOf(const CMPIBroker* broker, Operation operation, Report report) {
    const auto failed = [&](CMPIrc code, const char* message) -> CMPIStatus {
        try {
            report(message);
            return {code, CMNewString(broker, message, nullptr)};
        } catch (...) {
            letCancellationPass();
            // Memory is too short for a message: only the code is left.
            return {code, nullptr};
        }
    };
    try {
        operation();
        return {CMPI_RC_OK, nullptr};
    } catch (const OperationError& error) {
        return failed(error.code(), error.what());
    } catch (const std::exception& error) {
        return failed(CMPI_RC_ERR_FAILED, error.what());
    } catch (...) {
        letCancellationPass();
        return failed(CMPI_RC_ERR_FAILED, "an exception of unknown type was thrown");
    }
}

} // namespace Norv::Provider

#endif

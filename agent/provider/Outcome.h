/**
 * From what an operation of a provider throws to the status that its caller gets.
 */
#ifndef PROVIDER_OUTCOME_H
#define PROVIDER_OUTCOME_H

#include "provider/BrokerCalls.h"

#include <exception>

namespace Norv::Provider {

/**
 * To be called first where everything is caught. A host that cancels the thread unwinds it without a C++ exception;
 * stopping that would end the process.
 */
inline void letCancellationPass() {
    if (std::current_exception() == nullptr) {
        throw;
    }
}

/**
 * Carries an operation out and makes its status of how that ended. Nothing but a cancellation leaves it.
 *
 * @param report is told why the operation failed. What it throws is ignored, and the status has no message then.
 */
template <typename Operation, typename Report>
CMPIStatus outcomeOf(const CMPIBroker* broker, Operation operation, Report report) {
    const auto failed = [&](CMPIrc code, const char* message) -> CMPIStatus {
        try {
            report(message);
            return {code, CMNewString(broker, message, nullptr)};
        } catch (...) {
            letCancellationPass();
            // Nothing is left to say it with but the code.
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

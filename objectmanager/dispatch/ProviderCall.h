/** Calls provider code and catches what it throws. */
#ifndef DISPATCH_PROVIDERCALL_H
#define DISPATCH_PROVIDERCALL_H

#include <cxxabi.h>
#include <exception>
#include <optional>
#include <string>

namespace ObjectManager {

/**
 * Runs a provider's code and catches every exception. @return the exception in words, to follow the provider's name in
 * a message ("threw an exception: ..."); no value if the code threw none.
 */
template <typename Call>
std::optional<std::string> callProvider(Call call) {
    try {
        call();
    } catch (const abi::__forced_unwind&) { // pthread_cancel ends the thread; that must not be caught
        throw;
    } catch (const std::exception& exception) {
        return std::string("threw an exception: ") + exception.what();
    } catch (...) {
        return "threw an exception of unknown type";
    }
    return std::nullopt;
}

} // namespace ObjectManager

#endif

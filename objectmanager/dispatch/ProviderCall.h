/** Calling into providers. */
#ifndef DISPATCH_PROVIDERCALL_H
#define DISPATCH_PROVIDERCALL_H

#include <cxxabi.h>
#include <exception>
#include <optional>
#include <string>

namespace ObjectManager {

/**
 * Runs code of a provider's. What it throws ends here and is told as the end of a sentence that begins with the
 * provider's name; nothing where it throws nothing.
 */
template <typename Call>
std::optional<std::string> callProvider(Call call) {
    try {
        call();
    } catch (const abi::__forced_unwind&) { // the thread is being ended, which cannot be stopped here
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

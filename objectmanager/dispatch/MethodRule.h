/** Rules for calls of particular methods, beyond those for all methods. */
#ifndef DISPATCH_METHODRULE_H
#define DISPATCH_METHODRULE_H

#include "model/Operations.h"

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** A client's call of a method. The target, and every instance that its arguments refer to, is known to exist. */
struct MethodCall {
    const Invocation& invocation;
    const ObjectPath& target;
    /** Spelled as the class declares it. */
    const std::string& method;
    const std::vector<NamedValue>& arguments;
};

/** The outcome of a call that the provider answered. */
struct MethodOutcome {
    MethodResult result;
    /** The facts about the outcome beyond the return value, or the reason why nothing is known; may be empty. */
    std::string remark{};
    /** False if nothing but the return value says that the call succeeded. */
    bool isKnown = true;
};

/** A rule for one or more methods. Used by several threads at once. */
class MethodRule {
public:
    MethodRule() = default;
    MethodRule(const MethodRule&) = delete;
    MethodRule& operator=(const MethodRule&) = delete;
    virtual ~MethodRule() = default;

    /** Whether the rule holds for this method of this class. */
    virtual bool isAbout(std::string_view className, std::string_view method) const = 0;

    /**
     * Calls the provider if the rule permits it.
     *
     * @param operations serve the rule if it has to look at objects first.
     * @param provider makes the call.
     * @throws CimError if the rule forbids the call, if the provider fails, or if the call failed although the provider
     * reports success.
     */
    virtual MethodOutcome call(const MethodCall& call, Operations& operations,
                               const std::function<MethodResult()>& provider) const = 0;
};

} // namespace ObjectManager

#endif

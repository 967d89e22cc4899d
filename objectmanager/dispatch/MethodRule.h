/** What holds for calls of one method beyond what holds for all. */
#ifndef DISPATCH_METHODRULE_H
#define DISPATCH_METHODRULE_H

#include "model/Operations.h"

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** A client's call of a method: of an instance that is there, with references to instances that are there. */
struct MethodCall {
    const Invocation& invocation;
    const ObjectPath& target;
    /** As the class declares it. */
    const std::string& method;
    const std::vector<NamedValue>& arguments;
};

/** A call that its provider answered. */
struct MethodOutcome {
    MethodResult result;
    /** What is known of the outcome beyond the return value, or why nothing is; may be empty. */
    std::string remark{};
    /** False where success is not known beyond the return value. */
    bool isKnown = true;
};

/** Used by several threads at once. */
class MethodRule {
public:
    MethodRule() = default;
    MethodRule(const MethodRule&) = delete;
    MethodRule& operator=(const MethodRule&) = delete;
    virtual ~MethodRule() = default;

    /** Whether the rule is about a method of a class. */
    virtual bool isAbout(std::string_view className, std::string_view method) const = 0;

    /**
     * Makes the call, if it may be made.
     *
     * @param operations answers what the rule has to ask before.
     * @param provider calls the provider.
     * @throws CimError where the call was not made, or failed, also where the provider tells of no failure.
     */
    virtual MethodOutcome call(const MethodCall& call, Operations& operations,
                               const std::function<MethodResult()>& provider) const = 0;
};

} // namespace ObjectManager

#endif

#include "orvcim/Arguments.h"
#include "orvcim/Commands.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <iostream>

namespace ObjectManager::Orvcim {

namespace {

bool serves(const Registration& registration, std::string_view nameSpace) {
    return std::any_of(registration.nameSpaces.begin(), registration.nameSpaces.end(),
                       [nameSpace](const std::string& served) { return equalNames(served, nameSpace); });
}

/** The declaration of the method to call, which has the types of its arguments. */
const Method& methodOf(Session& session, const ObjectPath& path) {
    // Throws if no provider serves the class, even if it is declared.
    session.dispatcher().registry().find(path.nameSpace, path.className, ProviderKind::method);
    const Class* known = session.catalogue().find(path.className);
    if (known == nullptr) {
        throw CimError(CMPI_RC_ERR_INVALID_CLASS, fmt::format("{} is not declared in {}, so its methods are not known",
                                                              path.className, session.schemaFolder().string()));
    }
    const Method* method = known->method(session.options().method);
    if (method == nullptr) {
        std::vector<std::string> names;
        std::transform(known->methods.begin(), known->methods.end(), std::back_inserter(names),
                       [](const Method& m) { return m.name; });
        throw CimError(CMPI_RC_ERR_METHOD_NOT_FOUND,
                       fmt::format("{} has no method {}; it has {}", known->name, session.options().method,
                                   names.empty() ? "none" : fmt::format("{}", fmt::join(names, ", "))));
    }
    return *method;
}

} // namespace

void listClasses(Session& session) {
    const std::string& nameSpace = session.options().nameSpace;
    std::vector<Class> classes;
    bool nameSpaceKnown = false;
    for (const Registration& registration : session.dispatcher().registry().registrations()) {
        if (serves(registration, nameSpace)) {
            nameSpaceKnown = true;
            if (findElement(classes, registration.className) == nullptr) {
                const Class* known = session.catalogue().find(registration.className);
                classes.push_back(known == nullptr ? Class{registration.className, {}, {}, {}, {}, {}} : *known);
            }
        }
    }
    if (!nameSpaceKnown) {
        throw CimError(CMPI_RC_ERR_INVALID_NAMESPACE, fmt::format("no class is registered in {}", nameSpace));
    }
    session.writer().classes(classes);
}

void enumerateNames(Session& session) {
    const ObjectPath path = session.classPath(session.options().target);
    session.writer().names(session.dispatcher().enumerateInstanceNames(Session::invocation(), path));
}

void enumerateInstances(Session& session) {
    const ObjectPath path = session.classPath(session.options().target);
    const PropertyList properties = session.propertiesOf(path);
    session.writer().instances(session.dispatcher().enumerateInstances(Session::invocation(), path, properties));
}

void getInstance(Session& session) {
    const ObjectPath path = session.instancePath(session.options().target);
    const PropertyList properties = session.propertiesOf(path);
    session.writer().instance(session.dispatcher().getInstance(Session::invocation(), path, properties));
}

void reportUnknown(const MethodOutcome& outcome) {
    if (!outcome.isKnown) {
        std::cerr << "orvcim: " << outcome.remark << '\n';
    }
}

void invokeMethod(Session& session) {
    const ObjectPath path = session.instancePath(session.options().target);
    const Method& method = methodOf(session, path);
    const auto arguments = parseArguments(session.options().arguments, method, session.catalogue(), path.nameSpace);
    const MethodOutcome outcome = session.dispatcher().callMethod(Session::invocation(), path, method.name, arguments);
    session.writer().methodResult(method, outcome.result.returnValue, outcome.result.outArguments);
    reportUnknown(outcome);
}

} // namespace ObjectManager::Orvcim

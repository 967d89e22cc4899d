#include "dispatch/Registry.h"

#include "model/Model.h"

#include <algorithm>

namespace ObjectManager {

namespace {

bool serves(const Registration& registration, ProviderKind kind) {
    switch (kind) {
    case ProviderKind::instance:
        return registration.instance;
    case ProviderKind::method:
        return registration.method;
    default:
        return registration.association;
    }
}

bool isIn(const Registration& registration, std::string_view nameSpace) {
    return std::any_of(registration.nameSpaces.begin(), registration.nameSpaces.end(),
                       [&](const std::string& name) { return equalNames(name, nameSpace); });
}

CimError unknownNameSpace(std::string_view nameSpace) {
    return {CMPI_RC_ERR_INVALID_NAMESPACE, "no provider is registered in namespace \"" + std::string(nameSpace) + '"'};
}

} // namespace

const Registration& Registry::find(std::string_view nameSpace, std::string_view className, ProviderKind kind) const {
    bool nameSpaceKnown = false;
    bool classKnown = false;
    for (const Registration& registration : _registrations) {
        if (!isIn(registration, nameSpace)) {
            continue;
        }
        nameSpaceKnown = true;
        if (equalNames(registration.className, className)) {
            classKnown = true;
            if (serves(registration, kind)) {
                return registration;
            }
        }
    }
    if (!nameSpaceKnown) {
        throw unknownNameSpace(nameSpace);
    }
    if (!classKnown) {
        throw CimError(CMPI_RC_ERR_INVALID_CLASS, "no provider is registered for class \"" + std::string(className) +
                                                      "\" in namespace \"" + std::string(nameSpace) + '"');
    }
    if (kind == ProviderKind::method) {
        throw CimError(CMPI_RC_ERR_METHOD_NOT_AVAILABLE,
                       "no method provider is registered for class \"" + std::string(className) + '"');
    }
    throw CimError(CMPI_RC_ERR_NOT_SUPPORTED,
                   std::string("no ") + (kind == ProviderKind::instance ? "instance" : "association") +
                       " provider is registered for class \"" + std::string(className) + '"');
}

std::vector<const Registration*> Registry::all(std::string_view nameSpace, ProviderKind kind) const {
    std::vector<const Registration*> found;
    bool nameSpaceKnown = false;
    for (const Registration& registration : _registrations) {
        if (!isIn(registration, nameSpace)) {
            continue;
        }
        nameSpaceKnown = true;
        const auto sameClass = [&](const Registration* other) {
            return equalNames(other->className, registration.className);
        };
        if (serves(registration, kind) && std::none_of(found.begin(), found.end(), sameClass)) {
            found.push_back(&registration);
        }
    }
    if (!nameSpaceKnown) {
        throw unknownNameSpace(nameSpace);
    }
    return found;
}

} // namespace ObjectManager

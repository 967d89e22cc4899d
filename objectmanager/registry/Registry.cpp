#include "registry/Registry.h"

#include "model/Model.h"

#include <algorithm>
#include <array>
#include <functional>
#include <iterator>
#include <set>

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

CimError unknownNameSpace(std::string_view nameSpace) {
    return {CMPI_RC_ERR_INVALID_NAMESPACE, "no provider is registered in namespace \"" + std::string(nameSpace) + '"'};
}

} // namespace

bool Registration::isIn(std::string_view nameSpace) const {
    return std::any_of(nameSpaces.begin(), nameSpaces.end(),
                       [&](const std::string& name) { return equalNames(name, nameSpace); });
}

bool Registration::mayImplement(std::string_view methodName) const {
    return methods.empty() || std::any_of(methods.begin(), methods.end(),
                                          [&](const std::string& name) { return equalNames(name, methodName); });
}

Registry::Registry(std::vector<Registration> registrations) : _registrations(std::move(registrations)) {
    constexpr std::array<const char*, 2> interop = {"root/interop", "interop"};
    for (Registration& registration : _registrations) {
        const auto isServed = [&](const char* name) { return registration.isIn(name); };
        if (std::ranges::any_of(interop, isServed)) {
            std::ranges::copy_if(interop, std::back_inserter(registration.nameSpaces), std::not_fn(isServed));
        }
    }
}

std::vector<std::string> Registry::nameSpaces() const {
    std::set<std::string, NameLess> names;
    for (const Registration& registration : _registrations) {
        names.insert(registration.nameSpaces.begin(), registration.nameSpaces.end());
    }
    return {names.begin(), names.end()};
}

void Registry::requireNameSpace(std::string_view nameSpace) const {
    if (std::none_of(_registrations.begin(), _registrations.end(),
                     [&](const Registration& registration) { return registration.isIn(nameSpace); })) {
        throw unknownNameSpace(nameSpace);
    }
}

const Registration& Registry::find(std::string_view nameSpace, std::string_view className, ProviderKind kind) const {
    requireNameSpace(nameSpace);
    bool classKnown = false;
    for (const Registration& registration : _registrations) {
        if (!registration.isIn(nameSpace)) {
            continue;
        }
        if (equalNames(registration.className, className)) {
            classKnown = true;
            if (serves(registration, kind)) {
                return registration;
            }
        }
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
    requireNameSpace(nameSpace);
    std::vector<const Registration*> found;
    for (const Registration& registration : _registrations) {
        if (!registration.isIn(nameSpace)) {
            continue;
        }
        const auto sameClass = [&](const Registration* other) {
            return equalNames(other->className, registration.className);
        };
        if (serves(registration, kind) && std::none_of(found.begin(), found.end(), sameClass)) {
            found.push_back(&registration);
        }
    }
    return found;
}

} // namespace ObjectManager

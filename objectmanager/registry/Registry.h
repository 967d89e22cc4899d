/** Registrations: which provider serves which class. */
#ifndef REGISTRY_REGISTRY_H
#define REGISTRY_REGISTRY_H

#include "model/CimError.h"

#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** The statement that a provider of a library serves a class. */
struct Registration {
    std::string className;
    /** The provider's name, with which its factory functions begin: <provider>_Create_InstanceMI and so on. */
    std::string provider;
    /** The library's file name without "lib" and ".so.1". */
    std::string location;
    std::vector<std::string> nameSpaces;
    bool instance = false;
    bool method = false;
    bool association = false;
    bool property = false;
    bool indication = false;
    /** The methods that the provider implements; empty if the registration does not list them. */
    std::vector<std::string> methods;

    /** Whether the class is served in the namespace; letter case is ignored. */
    bool isIn(std::string_view nameSpace) const;

    /** Whether the provider may implement the method; letter case is ignored. */
    bool mayImplement(std::string_view methodName) const;
};

enum class ProviderKind { instance, method, association };

/** All registrations. The registry does not change, so several threads may use it at once. */
class Registry {
public:
    /**
     * root/interop and interop are two names of the namespace for discovery: a class that is registered in one of them
     * is registered in the other one, too.
     */
    explicit Registry(std::vector<Registration> registrations);

    const std::vector<Registration>& registrations() const { return _registrations; }

    /** All namespaces, each once, in the order of their names. */
    std::vector<std::string> nameSpaces() const;

    /** @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE if no registration names the namespace. */
    void requireNameSpace(std::string_view nameSpace) const;

    /**
     * The first registration that serves the class in the namespace; letter case is ignored.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE if no registration names the namespace; with
     * CMPI_RC_ERR_INVALID_CLASS if none in the namespace names the class; if those that name it have no provider of
     * this kind, with CMPI_RC_ERR_METHOD_NOT_AVAILABLE for methods, else with CMPI_RC_ERR_NOT_SUPPORTED.
     */
    const Registration& find(std::string_view nameSpace, std::string_view className, ProviderKind kind) const;

    /**
     * The registrations in the namespace that have a provider of this kind, in the order of `registrations`. If several
     * of them are for one class, only the first one is among them.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE if no registration names the namespace.
     */
    std::vector<const Registration*> all(std::string_view nameSpace, ProviderKind kind) const;

private:
    std::vector<Registration> _registrations;
};

} // namespace ObjectManager

#endif

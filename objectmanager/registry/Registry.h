/** Which provider serves which class. */
#ifndef REGISTRY_REGISTRY_H
#define REGISTRY_REGISTRY_H

#include "model/CimError.h"

#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** That one provider of a library serves one class. */
struct Registration {
    std::string className;
    /** Names the factories: <provider>_Create_InstanceMI and so on. */
    std::string provider;
    /** The library without "lib" and ".so.1". */
    std::string location;
    std::vector<std::string> nameSpaces;
    bool instance = false;
    bool method = false;
    bool association = false;
    bool property = false;
    bool indication = false;
    /** Those that the provider of methods implements; none where the registration does not tell. */
    std::vector<std::string> methods;

    /** Whether the class is served in the namespace; letter case is ignored. */
    bool isIn(std::string_view nameSpace) const;

    /** Whether the provider may implement the method; letter case is ignored. */
    bool mayImplement(std::string_view methodName) const;
};

enum class ProviderKind { instance, method, association };

/** All registrations. Not changed once made, so used by several threads at once. */
class Registry {
public:
    explicit Registry(std::vector<Registration> registrations) : _registrations(std::move(registrations)) {}

    const std::vector<Registration>& registrations() const { return _registrations; }

    /** @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE where no registration names the namespace. */
    void requireNameSpace(std::string_view nameSpace) const;

    /**
     * The first registration that serves the class in the namespace; letter case is ignored.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE where no registration names the namespace,
     * CMPI_RC_ERR_INVALID_CLASS where none in it names the class, and where those that do have no provider of this
     * kind, CMPI_RC_ERR_METHOD_NOT_AVAILABLE for methods, else CMPI_RC_ERR_NOT_SUPPORTED.
     */
    const Registration& find(std::string_view nameSpace, std::string_view className, ProviderKind kind) const;

    /**
     * The registrations of providers of one kind in the namespace, in order, for each class the first.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE where no registration names the namespace.
     */
    std::vector<const Registration*> all(std::string_view nameSpace, ProviderKind kind) const;

private:
    std::vector<Registration> _registrations;
};

} // namespace ObjectManager

#endif

/** Provider libraries and the providers that their factory functions make. */
#ifndef DISPATCH_PROVIDERS_H
#define DISPATCH_PROVIDERS_H

#include "broker/Broker.h"
#include "registry/Registry.h"

#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** The result of calling one factory of a registered provider. */
struct FactoryReport {
    /** The factory's name, for example "PowerManagementServiceProvider_Create_InstanceMI". */
    std::string factory;
    /** The name and the versions in the function table. If there is a problem, those of them that could be read. */
    std::string miName;
    int tableVersion = 0;
    int miVersion = 0;
    /** The reason why the factory cannot be used, in one line; empty if it can. */
    std::string problem;
};

/** The findings about a registered provider when it was loaded. */
struct ProviderReport {
    /**
     * The library's file with every symbolic link resolved, or the program's file for a provider that is built in;
     * empty if the library was not found or does not load.
     */
    std::filesystem::path library;
    /** The reason why the library or the registration cannot be used, in one line; empty if both can. */
    std::string problem;
    /** One report for each kind of provider that is registered; none if the library cannot be used. */
    std::vector<FactoryReport> factories;

    bool usable() const;
};

/**
 * Providers that are part of the program. Registrations name them by a location that no library has. They are called in
 * the same way as the providers of a library. Used by several threads at once.
 */
class BuiltInProviders {
public:
    BuiltInProviders() = default;
    BuiltInProviders(const BuiltInProviders&) = delete;
    BuiltInProviders& operator=(const BuiltInProviders&) = delete;
    virtual ~BuiltInProviders() = default;

    /** The location that registrations of built-in providers have. */
    virtual std::string_view location() const = 0;

    /* These do the same as a provider's factory functions. They return null if there is no provider of this name and
       kind. */

    virtual CMPIInstanceMI* instanceProvider(std::string_view provider, const CMPIBroker* broker) = 0;
    virtual CMPIAssociationMI* associationProvider(std::string_view provider, const CMPIBroker* broker) = 0;
};

class ProviderLibrary;

/**
 * Loads each provider library when it is first needed, and calls all factories of a provider before its first
 * operation. Libraries and function tables stay until this object is destroyed: then it calls every provider's cleanup
 * function and unloads the libraries, except those whose cleanup says that they must stay. Used by several threads at
 * once.
 */
class Providers {
public:
    /** Called with each library's handle from dlopen, before any function of the library is called. */
    using Loaded = std::function<void(void* library)>;

    /**
     * Searches `folders` in their order for lib<location>.so.1, then for lib<location>.so.
     *
     * @param builtIn may be null; outlives this object.
     */
    Providers(
        const Broker& broker, std::vector<std::filesystem::path> folders, BuiltInProviders* builtIn = nullptr,
        Loaded loaded = [](void* /*library*/) {});
    Providers(const Providers&) = delete;
    Providers& operator=(const Providers&) = delete;
    ~Providers();

    /* These return the function table of a registered provider; the registration must outlive this object. They throw
       CimError with CMPI_RC_ERR_FAILED if it cannot be used; the message is one line that names the library or the
       factory, and what is wrong with it. */

    CMPIInstanceMI& instanceProvider(const Registration& registration);
    CMPIMethodMI& methodProvider(const Registration& registration);
    CMPIAssociationMI& associationProvider(const Registration& registration);

    /** Loads the provider that the registration names, and reports what was found. */
    ProviderReport check(const Registration& registration);

private:
    template <typename MI>
    MI& provider(const Registration& registration);
    ProviderLibrary& library(const std::string& location);

    const Broker& _broker;
    std::vector<std::filesystem::path> _folders;
    BuiltInProviders* _builtIn;
    Loaded _loaded;
    /** Recursive, since a factory may call functions of the object manager that need a provider. */
    std::recursive_mutex _mutex;
    std::map<std::string, std::unique_ptr<ProviderLibrary>> _libraries;
    /** The registrations whose factories were called. */
    std::set<const Registration*> _begun;
};

} // namespace ObjectManager

#endif

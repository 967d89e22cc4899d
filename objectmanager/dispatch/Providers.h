/** Provider libraries and what they export. */
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
#include <vector>

namespace ObjectManager {

/** One factory of a registered provider, as found. */
struct FactoryReport {
    /** For example "PowerManagementServiceProvider_Create_InstanceMI". */
    std::string factory;
    /** The name and versions in the function table; where there is a problem, as far as they could be read. */
    std::string miName;
    int tableVersion = 0;
    int miVersion = 0;
    /** One line; empty where nothing is wrong. */
    std::string problem;
};

/** A registered provider, as found. */
struct ProviderReport {
    /** The library's file with every symbolic link resolved; empty where it was not found or did not load. */
    std::filesystem::path library;
    /** Why the library or the registration cannot be used, in one line; empty where it can. */
    std::string problem;
    /** One for each kind that is registered; none where the library cannot be used. */
    std::vector<FactoryReport> factories;

    bool usable() const;
};

class ProviderLibrary;

/**
 * Loads provider libraries when they are first needed, calls all factories of a provider before its first operation,
 * and keeps both, with the function tables that the factories gave, until it ends; then every provider's cleanup is
 * called and the libraries are unloaded, but for those that object to it. Used by several threads at once.
 */
class Providers {
public:
    /** What is done with each library, as dlopen gave it, before anything in it is called. */
    using Loaded = std::function<void(void* library)>;

    /** Libraries are looked for in `folders`, in that order, as lib<location>.so.1, then as lib<location>.so. */
    Providers(
        const Broker& broker, std::vector<std::filesystem::path> folders, Loaded loaded = [](void* /*library*/) {});
    Providers(const Providers&) = delete;
    Providers& operator=(const Providers&) = delete;
    ~Providers();

    /* A registered provider of one kind; the registration outlives this. Throws CimError with CMPI_RC_ERR_FAILED where
       it cannot be had: one line that says which library or factory, and what is wrong with it. */

    CMPIInstanceMI& instanceProvider(const Registration& registration);
    CMPIMethodMI& methodProvider(const Registration& registration);
    CMPIAssociationMI& associationProvider(const Registration& registration);

    /** Loads what the registration names, and says what was found. */
    ProviderReport check(const Registration& registration);

private:
    template <typename MI>
    MI& provider(const Registration& registration);
    ProviderLibrary& library(const std::string& location);

    const Broker& _broker;
    std::vector<std::filesystem::path> _folders;
    Loaded _loaded;
    /** Recursive, since a factory may ask the object manager for something on its own. */
    std::recursive_mutex _mutex;
    std::map<std::string, std::unique_ptr<ProviderLibrary>> _libraries;
    /** Those of which a provider was asked for. */
    std::set<const Registration*> _begun;
};

} // namespace ObjectManager

#endif

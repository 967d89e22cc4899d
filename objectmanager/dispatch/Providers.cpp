#include "dispatch/Providers.h"

#include "broker/Request.h"
#include "dispatch/ProviderCall.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>
#include <dlfcn.h>
#include <functional>
#include <type_traits>

namespace ObjectManager {

namespace {

/** The particulars of one kind of provider: the suffix of its factory functions, and the names of its functions. */
template <typename MI>
struct MIKind;

template <>
struct MIKind<CMPIInstanceMI> {
    static constexpr const char* suffix = "_Create_InstanceMI";
    static constexpr std::array slots{"cleanup",        "enumerateInstanceNames", "enumerateInstances", "getInstance",
                                      "createInstance", "modifyInstance",         "deleteInstance",     "execQuery"};
};

template <>
struct MIKind<CMPIMethodMI> {
    static constexpr const char* suffix = "_Create_MethodMI";
    static constexpr std::array slots{"cleanup", "invokeMethod"};
};

template <>
struct MIKind<CMPIAssociationMI> {
    static constexpr const char* suffix = "_Create_AssociationMI";
    static constexpr std::array slots{"cleanup", "associators", "associatorNames", "references", "referenceNames"};
};

/** The name of the first function that is null in a function table; null if the table is complete. */
template <typename MI>
const char* missingSlot(const MI& mi) {
    constexpr auto& names = MIKind<MI>::slots;
    std::array<void (*)(), names.size()> functions{};
    static_assert(sizeof functions == sizeof mi.ft->cleanup * names.size());
    std::memcpy(functions.data(), &mi.ft->cleanup, sizeof functions);
    const auto missing = std::find(functions.begin(), functions.end(), nullptr);
    return missing != functions.end() ? names[static_cast<std::size_t>(missing - functions.begin())] : nullptr;
}

/**
 * The mistake in a provider's function table, as the end of a sentence that begins with the provider's factory; empty
 * if the table is correct.
 */
template <typename MI>
std::string tableProblem(const MI& mi) {
    if (mi.ft == nullptr) {
        return "returned a provider without a function table";
    }
    if (mi.ft->ftVersion < CMPIVersion100 || mi.ft->ftVersion > CMPIVersion210) {
        return "returned a function table of version " + std::to_string(mi.ft->ftVersion) + ", expected " +
               std::to_string(CMPIVersion100) + " to " + std::to_string(CMPIVersion210);
    }
    if (mi.ft->miName == nullptr) {
        return "returned a function table without a name";
    }
    if (const char* slot = missingSlot(mi); slot != nullptr) {
        return std::string("returned a function table whose slot ") + slot + " is null";
    }
    return {};
}

std::string joined(const std::vector<std::filesystem::path>& folders) {
    std::string text;
    for (const std::filesystem::path& folder : folders) {
        text += (text.empty() ? "" : ", ") + folder.string();
    }
    return text;
}

} // namespace

/** A loaded library, or the program itself for built-in providers, with the providers that the factories made. */
class ProviderLibrary {
public:
    ProviderLibrary(const Broker& broker, const std::string& location,
                    const std::vector<std::filesystem::path>& folders);
    ProviderLibrary(const Broker& broker, BuiltInProviders& builtIn)
        : _broker(broker), _file(std::filesystem::read_symlink("/proc/self/exe")), _builtIn(&builtIn) {}
    ProviderLibrary(const ProviderLibrary&) = delete;
    ProviderLibrary& operator=(const ProviderLibrary&) = delete;
    ~ProviderLibrary();

    /** The file of the library or of the program, with every symbolic link resolved. */
    const std::filesystem::path& file() const { return _file; }
    /** The library's handle from dlopen; null if the providers are built in. */
    void* handle() const { return _handle; }

    /**
     * The provider of one kind; its factory is called the first time. @return null if the factory failed: `report` has
     * the reason.
     */
    template <typename MI>
    MI* provider(const std::string& name, FactoryReport& report);

private:
    template <typename MI>
    using Factory = std::function<MI*(const CMPIContext*, CMPIStatus*)>;

    template <typename MI>
    Factory<MI> factoryOf(const std::string& name);
    template <typename MI>
    MI* create(const std::string& name, FactoryReport& report);
    void complain(const std::string& factory, const std::string& problem) const {
        _broker.message({BrokerMessage::Kind::log, CMPI_SEV_ERROR, factory, problem});
    }

    struct Loaded {
        void* mi;
        FactoryReport report;
        /** Calls the provider's cleanup function. @return whether the library may be unloaded afterwards. */
        std::function<bool()> cleanup;
    };

    const Broker& _broker;
    std::filesystem::path _file;
    void* _handle = nullptr;
    BuiltInProviders* _builtIn = nullptr;
    std::map<std::string, Loaded> _providers;
};

ProviderLibrary::ProviderLibrary(const Broker& broker, const std::string& location,
                                 const std::vector<std::filesystem::path>& folders)
    : _broker(broker) {
    const std::string name = "lib" + location + ".so";
    for (const std::filesystem::path& folder : folders) {
        for (const std::string& fileName : {name + ".1", name}) {
            std::error_code error;
            if (_file.empty() && std::filesystem::exists(folder / fileName, error)) {
                _file = std::filesystem::weakly_canonical(folder / fileName, error);
            }
        }
    }
    if (_file.empty()) {
        throw CimError(CMPI_RC_ERR_FAILED,
                       "provider library " + name + ".1 or " + name + " not found in " + joined(folders));
    }
    _handle = dlopen(_file.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (_handle == nullptr) {
        throw CimError(CMPI_RC_ERR_FAILED, std::string("provider library does not load: ") + dlerror());
    }
}

ProviderLibrary::~ProviderLibrary() {
    bool unload = true;
    for (const auto& [factory, loaded] : _providers) {
        unload = loaded.cleanup() && unload;
    }
    if (unload && _handle != nullptr) {
        dlclose(_handle);
    }
}

template <typename MI>
MI* ProviderLibrary::provider(const std::string& name, FactoryReport& report) {
    report.factory = name + MIKind<MI>::suffix;
    if (const auto known = _providers.find(report.factory); known != _providers.end()) {
        report = known->second.report;
        return static_cast<MI*>(known->second.mi);
    }
    MI* mi = create<MI>(name, report);
    if (!report.problem.empty()) {
        return nullptr;
    }
    const auto cleanup = [this, mi, factory = report.factory] {
        Request request(_broker);
        CMPIStatus status{CMPI_RC_OK, nullptr};
        std::optional<std::string> thrown =
            callProvider([&] { status = mi->ft->cleanup(mi, request.context({}), CMPIBoolean{1}); });
        const bool keep = status.rc == CMPI_RC_DO_NOT_UNLOAD || status.rc == CMPI_RC_NEVER_UNLOAD;
        if (thrown || (status.rc != CMPI_RC_OK && !keep)) {
            complain(factory, thrown ? "cleanup " + *thrown : "cleanup failed with code " + std::to_string(status.rc));
        }
        return !keep;
    };
    _providers.emplace(report.factory, Loaded{mi, report, cleanup});
    return mi;
}

/** The factory of a provider; an empty function if the library or program has none. */
template <typename MI>
ProviderLibrary::Factory<MI> ProviderLibrary::factoryOf(const std::string& name) {
    if (_builtIn != nullptr) {
        MI* mi = nullptr;
        if constexpr (std::is_same_v<MI, CMPIInstanceMI>) {
            mi = _builtIn->instanceProvider(name, _broker.handle());
        } else if constexpr (std::is_same_v<MI, CMPIAssociationMI>) {
            mi = _builtIn->associationProvider(name, _broker.handle());
        }
        return mi == nullptr ? Factory<MI>() : [mi](const CMPIContext*, CMPIStatus*) { return mi; };
    }
    using Exported = MI*(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    auto* const factory = reinterpret_cast<Exported*>(dlsym(_handle, (name + MIKind<MI>::suffix).c_str()));
    return factory == nullptr ? Factory<MI>() : [this, factory](const CMPIContext* context, CMPIStatus* status) {
        return factory(_broker.handle(), context, status);
    };
}

template <typename MI>
MI* ProviderLibrary::create(const std::string& name, FactoryReport& report) {
    const Factory<MI> factory = factoryOf<MI>(name);
    if (!factory) {
        report.problem = _file.string() + " has no factory " + report.factory;
        return nullptr;
    }
    Request request(_broker);
    CMPIStatus status{CMPI_RC_OK, nullptr};
    MI* mi = nullptr;
    std::optional<std::string> thrown = callProvider([&] { mi = factory(request.context({}), &status); });
    std::string problem;
    if (thrown) {
        problem = *thrown;
    } else if (mi == nullptr || status.rc != CMPI_RC_OK) {
        const std::string message = textOf(status.msg);
        problem = "returned no provider, code " + std::to_string(status.rc) + (message.empty() ? "" : ": " + message);
    } else {
        problem = tableProblem(*mi);
    }
    if (mi != nullptr && mi->ft != nullptr) {
        report.miName = mi->ft->miName != nullptr ? mi->ft->miName : "";
        report.tableVersion = mi->ft->ftVersion;
        report.miVersion = mi->ft->miVersion;
    }
    if (!problem.empty()) {
        report.problem = report.factory + " in " + _file.string() + ' ' + problem;
    }
    return mi;
}

bool ProviderReport::usable() const {
    return problem.empty() && std::all_of(factories.begin(), factories.end(),
                                          [](const FactoryReport& factory) { return factory.problem.empty(); });
}

Providers::Providers(const Broker& broker, std::vector<std::filesystem::path> folders, BuiltInProviders* builtIn,
                     Loaded loaded)
    : _broker(broker), _folders(std::move(folders)), _builtIn(builtIn), _loaded(std::move(loaded)) {}

Providers::~Providers() = default;

ProviderLibrary& Providers::library(const std::string& location) {
    std::unique_ptr<ProviderLibrary>& library = _libraries[location];
    if (library == nullptr && _builtIn != nullptr && location == _builtIn->location()) {
        library = std::make_unique<ProviderLibrary>(_broker, *_builtIn);
    } else if (library == nullptr) {
        library = std::make_unique<ProviderLibrary>(_broker, location, _folders);
        _loaded(library->handle());
    }
    return *library;
}

namespace {

/**
 * Calls the factory of each kind of provider that is registered; each call of `report` returns the report to fill in
 * next.
 */
template <typename Report>
void callFactories(ProviderLibrary& library, const Registration& registration, Report report) {
    const auto call = [&]<typename MI>(bool registered, const MI*) {
        if (registered) {
            library.provider<MI>(registration.provider, report());
        }
    };
    call(registration.instance, static_cast<CMPIInstanceMI*>(nullptr));
    call(registration.method, static_cast<CMPIMethodMI*>(nullptr));
    call(registration.association, static_cast<CMPIAssociationMI*>(nullptr));
}

} // namespace

template <typename MI>
MI& Providers::provider(const Registration& registration) {
    const std::lock_guard lock(_mutex);
    ProviderLibrary& loaded = library(registration.location);
    FactoryReport report;
    // A provider's factories may write data that its operations read, so all of them run before its first operation.
    if (_begun.insert(&registration).second) {
        callFactories(loaded, registration, [&]() -> FactoryReport& { return report = FactoryReport(); });
    }
    MI* mi = loaded.provider<MI>(registration.provider, report = FactoryReport());
    if (mi == nullptr) {
        throw CimError(CMPI_RC_ERR_FAILED, report.problem);
    }
    return *mi;
}

CMPIInstanceMI& Providers::instanceProvider(const Registration& registration) {
    return provider<CMPIInstanceMI>(registration);
}

CMPIMethodMI& Providers::methodProvider(const Registration& registration) {
    return provider<CMPIMethodMI>(registration);
}

CMPIAssociationMI& Providers::associationProvider(const Registration& registration) {
    return provider<CMPIAssociationMI>(registration);
}

ProviderReport Providers::check(const Registration& registration) {
    const std::lock_guard lock(_mutex);
    ProviderReport report;
    try {
        ProviderLibrary& loaded = library(registration.location);
        report.library = loaded.file();
        callFactories(loaded, registration, [&]() -> FactoryReport& { return report.factories.emplace_back(); });
        if (registration.property || registration.indication) {
            report.problem = "property and indication providers are not served";
        }
    } catch (const CimError& error) {
        report.problem = error.what();
    }
    return report;
}

} // namespace ObjectManager

/** From an operation on values to the provider that serves it, and back. */
#ifndef DISPATCH_DISPATCHER_H
#define DISPATCH_DISPATCHER_H

#include "agentlog/LogTap.h"
#include "broker/Broker.h"
#include "broker/Request.h"
#include "broker/Result.h"
#include "dispatch/Associations.h"
#include "dispatch/Providers.h"
#include "registry/Registry.h"

#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace ObjectManager {

/**
 * Serves the CIM operations through registered providers. Every operation throws CimError where it fails, with the
 * provider's code and message, or CMPI_RC_ERR_FAILED and what the provider did where it broke the rules of the
 * interface; what it did costs its own request only. Used by several threads at once.
 */
class Dispatcher final : public Operations {
public:
    struct Settings {
        /** Where provider libraries are, in order. */
        std::vector<std::filesystem::path> folders;
        /** May be null; outlives the dispatcher. */
        const ClassInformation* classes = nullptr;
        /** Where failures' reasons come from; may be null; outlives the dispatcher. */
        LogTap* log = nullptr;
    };

    Dispatcher(Registry registry, const Settings& settings);

    const Registry& registry() const { return _registry; }
    Broker& broker() { return _broker; }
    /** Where failures' reasons come from; may be null. */
    LogTap* log() { return _log; }

    /** What is found of a registered provider. */
    ProviderReport check(const Registration& registration) { return _providers.check(registration); }

    using Operations::enumerateInstanceNames;
    using Operations::enumerateInstances;
    using Operations::execQuery;

    void enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath,
                                const PathSink& sink) override;
    void enumerateInstances(const Invocation& invocation, const ObjectPath& classPath, const PropertyList& properties,
                            const InstanceSink& sink) override;
    Instance getInstance(const Invocation& invocation, const ObjectPath& path, const PropertyList& properties) override;
    ObjectPath createInstance(const Invocation& invocation, const ObjectPath& path, const Instance& instance) override;
    void modifyInstance(const Invocation& invocation, const ObjectPath& path, const Instance& instance,
                        const PropertyList& properties) override;
    void deleteInstance(const Invocation& invocation, const ObjectPath& path) override;
    void execQuery(const Invocation& invocation, const ObjectPath& classPath, const std::string& query,
                   const std::string& language, const InstanceSink& sink) override;
    /**
     * Throws CMPI_RC_ERR_NOT_FOUND where the provider of the path's class does not name that instance among its own.
     * Of a class that has no provider of instances it is not known, and taken to be there. A provider of methods may
     * act whatever instance it is asked for, so a client's path is checked by this before.
     */
    void requireInstance(const Invocation& invocation, const ObjectPath& path);
    /** A refusal is a CimError with `refused` set. */
    MethodResult invokeMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                              const std::vector<NamedValue>& arguments) override;

    /*
     * The association operations need the classes. An association class is followed where its declaration says that it
     * can link the source; its provider is asked for the associations of that class, and told the filter. What the
     * filter leaves out is dropped from the answer too, since a provider need not look at it. One provider's failure is
     * the operation's, and names the class.
     */

    std::vector<Associated<Instance>> associators(const Invocation& invocation, const ObjectPath& source,
                                                  const AssociationFilter& filter,
                                                  const PropertyList& properties) override;
    std::vector<Associated<ObjectPath>> associatorNames(const Invocation& invocation, const ObjectPath& source,
                                                        const AssociationFilter& filter) override;
    std::vector<Instance> references(const Invocation& invocation, const ObjectPath& source,
                                     const AssociationFilter& filter, const PropertyList& properties) override;
    std::vector<ObjectPath> referenceNames(const Invocation& invocation, const ObjectPath& source,
                                           const AssociationFilter& filter) override;

private:
    enum class Answer;

    template <class Call, class Take>
    auto serve(const Invocation& invocation, const ObjectPath& path, const Registration& registration, Answer answer,
               const std::optional<CimError>& unanswered, Call call, Take take);
    template <class Call, class Take>
    auto follow(const Invocation& invocation, const AssociationWalk& walk, const AssociationStep& step, Answer answer,
                Call call, Take take);

    Registry _registry;
    LogTap* _log;
    Broker _broker;
    Providers _providers;
};

} // namespace ObjectManager

#endif

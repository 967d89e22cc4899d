/** From an operation on values to the provider that serves it, and back. */
#ifndef DISPATCH_DISPATCHER_H
#define DISPATCH_DISPATCHER_H

#include "agentlog/LogTap.h"
#include "broker/Broker.h"
#include "broker/Request.h"
#include "broker/Result.h"
#include "dispatch/Associations.h"
#include "dispatch/MethodRule.h"
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
        /** Of which the first that is about a method is followed. They outlive the dispatcher. */
        std::vector<const MethodRule*> rules{};
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
     * Calls a method for a client. A provider of methods may act whatever it is asked for, so this looks before whether
     * the paths that the client gave name what is there: the target, and each reference among the arguments. Whether
     * paths are equal is not a matter of host names and of the letter case of names.
     *
     * @param path without keys for the class itself.
     * @param method,arguments named as the class declares them.
     * @throws CimError with CMPI_RC_ERR_NOT_FOUND where no provider names such an instance, but for a target of a class
     *         that has no provider of instances; with CMPI_RC_ERR_INVALID_PARAMETER where a reference names a class, or
     *         its class is not declared; and as the method's rule and invokeMethod throw.
     */
    MethodOutcome callMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                             const std::vector<NamedValue>& arguments);
    /** A refusal is a CimError with `refused` set. */
    MethodResult invokeMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                              const std::vector<NamedValue>& arguments) override;

    /*
     * The association operations need the classes, and a source that is there: CMPI_RC_ERR_NOT_FOUND where the provider
     * of its class does not name it. An association class is followed where its declaration says that it
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

    template <typename Call, typename Take>
    auto serve(const char* operation, const Invocation& invocation, const ObjectPath& path,
               const Registration& registration, Answer answer, const std::optional<CimError>& unanswered, Call call,
               Take take);
    template <typename Call, typename Take>
    auto follow(const char* operation, const Invocation& invocation, const AssociationWalk& walk,
                const AssociationStep& step, Answer answer, Call call, Take take);

    AssociationWalk walkFrom(const Invocation& invocation, const ObjectPath& source, const AssociationFilter& filter);
    bool hasInstanceProvider(const ObjectPath& path) const;
    bool isNamed(const Invocation& invocation, const ObjectPath& path);
    void requireInstance(const Invocation& invocation, const ObjectPath& path);
    void requireReference(const Invocation& invocation, const std::string& argument, const Value& value);

    Registry _registry;
    std::vector<const MethodRule*> _rules;
    LogTap* _log;
    Broker _broker;
    Providers _providers;
};

} // namespace ObjectManager

#endif

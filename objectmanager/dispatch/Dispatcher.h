/** Turns operations on values into calls of CMPI providers. */
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
 * Serves the CIM operations through registered providers. A failed operation throws CimError: with the provider's code
 * and message, or, if the provider broke the rules of CMPI, with CMPI_RC_ERR_FAILED and a message that says what it
 * did. A provider that breaks the rules fails its own request only; others go on. Used by several threads at once.
 */
class Dispatcher final : public Operations {
public:
    struct Settings {
        /** The folders that are searched for provider libraries, in this order. */
        std::vector<std::filesystem::path> folders;
        /** The class declarations. May be null; must outlive the dispatcher. */
        const ClassInformation* classes = nullptr;
        /** The agent's log, which has the reasons of failures. May be null; must outlive the dispatcher. */
        LogTap* log = nullptr;
        /** A call follows the first rule that is about its method. The rules must outlive the dispatcher. */
        std::vector<const MethodRule*> rules{};
        /** May be null; outlives the dispatcher. */
        BuiltInProviders* builtIn = nullptr;
    };

    Dispatcher(Registry registry, const Settings& settings);

    const Registry& registry() const { return _registry; }
    Broker& broker() { return _broker; }
    /** The agent's log, which has the reasons of failures; may be null. */
    LogTap* log() { return _log; }

    /** Loads a registered provider, and reports whether it can be used. */
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
     * Calls a method for a client. Since a method provider may act without a look at the paths that it is given, this
     * checks first that they name instances that exist: the target, and each reference among the arguments. Host names,
     * and the letter case of names, do not matter.
     *
     * @param path names the instance whose method is called; without keys it names the class itself.
     * @param method,arguments have the names that the class declares.
     * @throws CimError with CMPI_RC_ERR_NOT_FOUND if no provider lists such an instance (a target whose class has no
     *         instance provider is not checked); with CMPI_RC_ERR_INVALID_PARAMETER if a reference names a class
     *         instead of an instance, or its class is not declared; and whatever the method's rule and invokeMethod
     *         throw.
     */
    MethodOutcome callMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                             const std::vector<NamedValue>& arguments);
    /** Calls the method without the checks of `callMethod`. If the provider refuses, the CimError has `refused` set. */
    MethodResult invokeMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                              const std::vector<NamedValue>& arguments) override;

    /*
     * The association operations need the class declarations, and a source that exists: if the provider of its class
     * does not list it, they throw CMPI_RC_ERR_NOT_FOUND. They follow each association class whose declaration lets it
     * refer to the source, and call its provider with the filter. Since a provider need not apply the filter, they
     * apply it to the provider's objects once more. If one provider fails, the whole operation fails, with a message
     * that names the association class.
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

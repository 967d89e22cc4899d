#include "dispatch/Dispatcher.h"

#include "dispatch/ProviderCall.h"
#include "text/ObjectPathText.h"

#include <algorithm>
#include <iterator>
#include <optional>
#include <utility>

namespace ObjectManager {

namespace {

CimError noInstance() {
    return {CMPI_RC_ERR_NOT_FOUND, "there is no such instance"};
}

CimError leftOpen(const Registration& registration) {
    return {CMPI_RC_ERR_FAILED, registration.provider + " ended without closing its result"};
}

CimError refused(const std::string& method) {
    CimError error(CMPI_RC_ERR_FAILED, method + " was refused");
    error.refused = true;
    return error;
}

CimError wrongAnswer(const Registration& registration, const std::string& what) {
    return {CMPI_RC_ERR_FAILED, registration.provider + " returned " + what};
}

/** A name as a provider takes it: null instead of an empty one. */
const char* orNull(const std::string& name) {
    return name.empty() ? nullptr : name.c_str();
}

/** Adds the objects that one association class leads to, unless there are none. */
template <typename Object>
void append(std::vector<Associated<Object>>& found, const AssociationStep& step, std::vector<Object> objects) {
    if (!objects.empty()) {
        found.push_back({step.registration->className, std::move(objects)});
    }
}

/** The message for a provider that failed without a message of its own. */
std::string reasonOf(const Registration& registration, CMPIrc code, const std::string& operation) {
    return registration.provider +
           (code == CMPI_RC_ERR_NOT_SUPPORTED ? " does not support " + operation : " gave no reason");
}

/** Throws unless the provider returned the status OK. */
void requireSuccess(const Registration& registration, const std::string& operation, const CMPIStatus& status,
                    const Request& request, const Result& result) {
    std::string message = textOf(status.msg);
    if (!request.misuse().empty()) {
        throw CimError(CMPI_RC_ERR_FAILED, registration.provider + ' ' + request.misuse());
    }
    CMPIrc code = status.rc;
    if (!result.errors().empty()) {
        const CimError& error = result.errors().front();
        code = code == CMPI_RC_OK ? error.code : code;
        message = message.empty() ? error.what() : message;
    }
    if (code != CMPI_RC_OK) {
        throw CimError(code, message.empty() ? reasonOf(registration, code, operation) : message);
    }
}

const CMPIContext* contextOf(Request& request, const Invocation& invocation, const ObjectPath& path) {
    return request.context({
        {CMPIInitNameSpace, stringValue(path.nameSpace)},
        {CMPIInvocationFlags, unsignedValue(CMPI_uint32, invocation.flags)},
        {CMPIPrincipal, stringValue(invocation.principal)},
    });
}

void passPaths(const Result& result, const PathSink& sink) {
    for (std::size_t i = 0; i < result.pathCount(); ++i) {
        sink(result.path(i));
    }
}

void passInstances(const Result& result, const InstanceSink& sink) {
    for (std::size_t i = 0; i < result.instanceCount(); ++i) {
        sink(result.instance(i));
    }
}

std::vector<ObjectPath> pathsOf(const Result& result) {
    std::vector<ObjectPath> paths;
    passPaths(result, [&](ObjectPath&& path) { paths.push_back(std::move(path)); });
    return paths;
}

std::vector<Instance> instancesOf(const Result& result) {
    std::vector<Instance> instances;
    passInstances(result, [&](Instance&& instance) { instances.push_back(std::move(instance)); });
    return instances;
}

} // namespace

/** The kind of objects or values that a provider has to return from an operation. */
enum class Dispatcher::Answer { paths, instances, value, nothing };

Dispatcher::Dispatcher(Registry registry, const Settings& settings)
    : _registry(std::move(registry)), _rules(settings.rules), _log(settings.log), _broker(this, settings.classes),
      _providers(_broker, settings.folders, settings.builtIn, [log = settings.log](void* library) {
          if (log != nullptr) {
              log->attach(library);
          }
      }) {}

/**
 * Does one operation, which messages call `operation`: `call` calls the provider with context, result and path, and
 * `take` takes the objects that the provider returned. If the provider neither returned anything nor closed its result,
 * `unanswered` is thrown, if there is one.
 */
template <typename Call, typename Take>
auto Dispatcher::serve(const char* operation, const Invocation& invocation, const ObjectPath& path,
                       const Registration& registration, Answer answer, const std::optional<CimError>& unanswered,
                       Call call, Take take) {
    const std::uint64_t before = _log != nullptr ? _log->newest() : 0;
    try {
        Request request(_broker, invocation.meter);
        Result result(request);
        // The class is spelled as the provider's registration has it.
        std::optional<ObjectPath> respelled;
        if (path.className != registration.className && equalNames(path.className, registration.className)) {
            respelled = path;
            respelled->className = registration.className;
        }
        const ObjectPath& target = respelled ? *respelled : path;
        const CMPIContext* context = contextOf(request, invocation, path);
        CMPIStatus status{CMPI_RC_OK, nullptr};
        const std::optional<std::string> thrown =
            callProvider([&] { status = call(request, context, result.handle(), request.objectPath(target)); });
        // If a limit was exceeded, the status or exception that the provider made of it does not matter.
        if (const std::string excess = request.excess(); !excess.empty()) {
            throw CimError(serverLimitsExceeded, registration.provider + ' ' + excess);
        }
        if (thrown) {
            throw CimError(CMPI_RC_ERR_FAILED, registration.provider + ' ' + *thrown);
        }
        requireSuccess(registration, operation, status, request, result);
        if (unanswered && !result.closed() && result.empty()) {
            throw CimError(*unanswered);
        }
        if ((answer != Answer::paths && result.pathCount() != 0) ||
            (answer != Answer::instances && result.instanceCount() != 0) ||
            (answer != Answer::value && !result.data().empty())) {
            throw wrongAnswer(registration, "a result of the wrong kind for this operation");
        }
        return take(result);
    } catch (CimError& error) {
        if (_log != nullptr) {
            error.reasons = _log->failuresSince(before);
        }
        if (error.refused && error.reasons.empty()) {
            error.reasons = {"the provider gave no reason"};
        }
        throw;
    }
}

void Dispatcher::enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath,
                                        const PathSink& sink) {
    const Registration& registration = _registry.find(classPath.nameSpace, classPath.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    serve(
        "EnumerateInstanceNames", invocation, classPath, registration, Answer::paths, leftOpen(registration),
        [&](Request&, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi.ft->enumerateInstanceNames(&mi, context, result, path);
        },
        [&](const Result& result) { passPaths(result, sink); });
}

void Dispatcher::enumerateInstances(const Invocation& invocation, const ObjectPath& classPath,
                                    const PropertyList& properties, const InstanceSink& sink) {
    const Registration& registration = _registry.find(classPath.nameSpace, classPath.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    serve(
        "EnumerateInstances", invocation, classPath, registration, Answer::instances, leftOpen(registration),
        [&](Request& request, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi.ft->enumerateInstances(&mi, context, result, path, request.propertyList(properties));
        },
        [&](const Result& result) { passInstances(result, sink); });
}

Instance Dispatcher::getInstance(const Invocation& invocation, const ObjectPath& path, const PropertyList& properties) {
    const Registration& registration = _registry.find(path.nameSpace, path.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    return serve(
        "GetInstance", invocation, path, registration, Answer::instances, noInstance(),
        [&](Request& request, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* target) {
            return mi.ft->getInstance(&mi, context, result, target, request.propertyList(properties));
        },
        [&](const Result& result) {
            if (result.instanceCount() == 0) {
                throw noInstance();
            }
            if (result.instanceCount() != 1) {
                throw wrongAnswer(registration, std::to_string(result.instanceCount()) + " instances, expected one");
            }
            return result.instance(0);
        });
}

ObjectPath Dispatcher::createInstance(const Invocation& invocation, const ObjectPath& path, const Instance& instance) {
    const Registration& registration = _registry.find(path.nameSpace, path.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    return serve(
        "CreateInstance", invocation, path, registration, Answer::paths, leftOpen(registration),
        [&](Request& request, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* target) {
            return mi.ft->createInstance(&mi, context, result, target, request.instance(instance));
        },
        [&](const Result& result) {
            if (result.pathCount() != 1) {
                throw wrongAnswer(registration, std::to_string(result.pathCount()) + " object paths, expected one");
            }
            return result.path(0);
        });
}

void Dispatcher::modifyInstance(const Invocation& invocation, const ObjectPath& path, const Instance& instance,
                                const PropertyList& properties) {
    const Registration& registration = _registry.find(path.nameSpace, path.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    serve(
        "ModifyInstance", invocation, path, registration, Answer::nothing, leftOpen(registration),
        [&](Request& request, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* target) {
            return mi.ft->modifyInstance(&mi, context, result, target, request.instance(instance),
                                         request.propertyList(properties));
        },
        [](const Result&) {});
}

void Dispatcher::deleteInstance(const Invocation& invocation, const ObjectPath& path) {
    const Registration& registration = _registry.find(path.nameSpace, path.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    serve(
        "DeleteInstance", invocation, path, registration, Answer::nothing, leftOpen(registration),
        [&](Request&, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* target) {
            return mi.ft->deleteInstance(&mi, context, result, target);
        },
        [](const Result&) {});
}

void Dispatcher::execQuery(const Invocation& invocation, const ObjectPath& classPath, const std::string& query,
                           const std::string& language, const InstanceSink& sink) {
    const Registration& registration = _registry.find(classPath.nameSpace, classPath.className, ProviderKind::instance);
    CMPIInstanceMI& mi = _providers.instanceProvider(registration);
    serve(
        "ExecQuery", invocation, classPath, registration, Answer::instances, leftOpen(registration),
        [&](Request&, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path) {
            return mi.ft->execQuery(&mi, context, result, path, query.c_str(), language.c_str());
        },
        [&](const Result& result) { passInstances(result, sink); });
}

bool Dispatcher::hasInstanceProvider(const ObjectPath& path) const {
    return std::ranges::any_of(_registry.registrations(), [&](const Registration& registration) {
        return registration.instance && registration.isIn(path.nameSpace) &&
               equalNames(registration.className, path.className);
    });
}

/** Whether the provider of the path's class lists that instance in its EnumInstanceNames. */
bool Dispatcher::isNamed(const Invocation& invocation, const ObjectPath& path) {
    bool found = false;
    enumerateInstanceNames(invocation, {{}, path.nameSpace, path.className, {}},
                           [&](const ObjectPath& name) { found = found || name == path; });
    return found;
}

/**
 * Throws if the path names no instance. A class without an instance provider is not checked: its instances cannot be
 * listed.
 */
void Dispatcher::requireInstance(const Invocation& invocation, const ObjectPath& path) {
    if (hasInstanceProvider(path) && !isNamed(invocation, path)) {
        throw noInstance();
    }
}

/** Checks an argument that is a reference, or an array of references: each must name an instance that is there. */
void Dispatcher::requireReference(const Invocation& invocation, const std::string& argument, const Value& value) {
    if (const auto* elements = std::get_if<Value::Array>(&value.content)) {
        for (const Value& element : *elements) {
            requireReference(invocation, argument, element);
        }
        return;
    }
    const auto* const reference = std::get_if<std::shared_ptr<const ObjectPath>>(&value.content);
    if (reference == nullptr) {
        return;
    }
    const ObjectPath& path = **reference;
    const auto fail = [&](CMPIrc code, const std::string& what) { throw CimError(code, argument + ": " + what); };
    if (_broker.classes() != nullptr && _broker.classes()->declaredName(path.className) == nullptr) {
        fail(CMPI_RC_ERR_INVALID_PARAMETER, "found a path of the class " + path.className +
                                                ", which is not declared, expected the path of an instance");
    }
    if (path.keys.empty()) {
        fail(CMPI_RC_ERR_INVALID_PARAMETER,
             "found the class " + path.className + ", expected the path of an instance, with its keys");
    }
    if (!hasInstanceProvider(path) || !isNamed(invocation, path)) {
        fail(CMPI_RC_ERR_NOT_FOUND, "there is no instance " + formatLocalPath(path) + ", expected one of those of " +
                                        path.className + " that are served in that namespace");
    }
}

namespace {

/**
 * The reference that the client means. The client wbemcli takes the first part of a namespace for a host name: it turns
 * root/cimv2:CLASS into the host root and the namespace cimv2. If the namespace cimv2 is not registered but root/cimv2
 * is, the reference is one in root/cimv2.
 */
Value meantReference(const Value& given, const Registry& registry) {
    const auto* const reference = std::get_if<std::shared_ptr<const ObjectPath>>(&given.content);
    const auto isServed = [&](std::string_view nameSpace) {
        return std::ranges::any_of(registry.registrations(),
                                   [&](const Registration& registration) { return registration.isIn(nameSpace); });
    };
    if (reference == nullptr || isServed((*reference)->nameSpace) ||
        !isServed((*reference)->host + '/' + (*reference)->nameSpace)) {
        return given;
    }
    ObjectPath meant = **reference;
    meant.nameSpace = meant.host + '/' + meant.nameSpace;
    meant.host.clear();
    return referenceValue(std::move(meant));
}

} // namespace

MethodOutcome Dispatcher::callMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                                     const std::vector<NamedValue>& given) {
    std::vector<NamedValue> arguments = given;
    for (NamedValue& argument : arguments) {
        argument.value = meantReference(argument.value, _registry);
    }
    if (!path.keys.empty()) {
        requireInstance(invocation, path);
    }
    for (const NamedValue& argument : arguments) {
        requireReference(invocation, argument.name, argument.value);
    }
    const auto provider = [&] { return invokeMethod(invocation, path, method, arguments); };
    const auto rule =
        std::ranges::find_if(_rules, [&](const MethodRule* each) { return each->isAbout(path.className, method); });
    return rule == _rules.end() ? MethodOutcome{provider()}
                                : (*rule)->call({invocation, path, method, arguments}, *this, provider);
}

MethodResult Dispatcher::invokeMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                                      const std::vector<NamedValue>& arguments) {
    const Registration& registration = _registry.find(path.nameSpace, path.className, ProviderKind::method);
    if (!registration.mayImplement(method)) {
        throw CimError(CMPI_RC_ERR_METHOD_NOT_AVAILABLE,
                       registration.provider + " does not implement the method " + method);
    }
    CMPIMethodMI& mi = _providers.methodProvider(registration);
    const CMPIArgs* answers = nullptr;
    return serve(
        method.c_str(), invocation, path, registration, Answer::value, refused(method),
        [&](Request& request, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* target) {
            CMPIArgs* out = request.arguments({});
            answers = out;
            return mi.ft->invokeMethod(&mi, context, result, target, method.c_str(), request.arguments(arguments), out);
        },
        [&](const Result& result) {
            if (result.data().size() != 1) {
                throw wrongAnswer(registration, std::to_string(result.data().size()) + " values, expected one");
            }
            return MethodResult{result.data().front(), argumentsOf(answers)};
        });
}

namespace {

/** The error of one association's provider, with the association class in its message. */
CimError failureOf(const Registration& registration, const CimError& error) {
    CimError failure(error.code, registration.className + ": " + error.what());
    failure.reasons = error.reasons;
    return failure;
}

} // namespace

/**
 * Asks the provider of one association class. Association providers leave their results open, so an open result counts
 * as complete here. The message of a failure names the class.
 */
template <typename Call, typename Take>
auto Dispatcher::follow(const char* operation, const Invocation& invocation, const AssociationWalk& walk,
                        const AssociationStep& step, Answer answer, Call call, Take take) {
    const Registration& registration = *step.registration;
    try {
        CMPIAssociationMI& mi = _providers.associationProvider(registration);
        return serve(
            operation, invocation, walk.source(), registration, answer, std::nullopt,
            [&](Request& request, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* source) {
                return call(mi, request, context, result, source);
            },
            [&](const Result& result) {
                auto objects = take(result);
                dropDuplicates(objects);
                return objects;
            });
    } catch (const CimError& error) {
        throw failureOf(registration, error);
    }
}

/** Begins the walk at a source that exists: association providers may make up references to one that does not. */
AssociationWalk Dispatcher::walkFrom(const Invocation& invocation, const ObjectPath& source,
                                     const AssociationFilter& filter) {
    AssociationWalk walk(_registry, _broker.classes(), source, filter);
    requireInstance(invocation, walk.source());
    return walk;
}

std::vector<Associated<Instance>> Dispatcher::associators(const Invocation& invocation, const ObjectPath& source,
                                                          const AssociationFilter& filter,
                                                          const PropertyList& properties) {
    const AssociationWalk walk = walkFrom(invocation, source, filter);
    std::vector<Associated<Instance>> found;
    for (const AssociationStep& step : walk.steps()) {
        std::vector<Instance> instances = follow(
            "Associators", invocation, walk, step, Answer::instances,
            [&](CMPIAssociationMI& mi, Request& request, const CMPIContext* context, const CMPIResult* result,
                const CMPIObjectPath* path) {
                return mi.ft->associators(&mi, context, result, path, step.registration->className.c_str(),
                                          orNull(step.resultClass), orNull(filter.role), orNull(filter.resultRole),
                                          request.propertyList(properties));
            },
            instancesOf);
        walk.keepAsked(step, instances);
        walk.keepWanted(instances, properties);
        append(found, step, std::move(instances));
    }
    return found;
}

std::vector<Associated<ObjectPath>> Dispatcher::associatorNames(const Invocation& invocation, const ObjectPath& source,
                                                                const AssociationFilter& filter) {
    const AssociationWalk walk = walkFrom(invocation, source, filter);
    std::vector<Associated<ObjectPath>> found;
    for (const AssociationStep& step : walk.steps()) {
        std::vector<ObjectPath> paths = follow(
            "AssociatorNames", invocation, walk, step, Answer::paths,
            [&](CMPIAssociationMI& mi, Request&, const CMPIContext* context, const CMPIResult* result,
                const CMPIObjectPath* path) {
                return mi.ft->associatorNames(&mi, context, result, path, step.registration->className.c_str(),
                                              orNull(step.resultClass), orNull(filter.role), orNull(filter.resultRole));
            },
            pathsOf);
        walk.keepAsked(step, paths);
        append(found, step, std::move(paths));
    }
    return found;
}

std::vector<Instance> Dispatcher::references(const Invocation& invocation, const ObjectPath& source,
                                             const AssociationFilter& filter, const PropertyList& properties) {
    const AssociationWalk walk = walkFrom(invocation, source, filter);
    std::vector<Instance> found;
    for (const AssociationStep& step : walk.steps()) {
        std::vector<Instance> instances = follow(
            "References", invocation, walk, step, Answer::instances,
            [&](CMPIAssociationMI& mi, Request& request, const CMPIContext* context, const CMPIResult* result,
                const CMPIObjectPath* path) {
                return mi.ft->references(&mi, context, result, path, step.registration->className.c_str(),
                                         orNull(filter.role), request.propertyList(properties));
            },
            instancesOf);
        std::move(instances.begin(), instances.end(), std::back_inserter(found));
    }
    walk.keepWanted(found, properties);
    return found;
}

std::vector<ObjectPath> Dispatcher::referenceNames(const Invocation& invocation, const ObjectPath& source,
                                                   const AssociationFilter& filter) {
    const AssociationWalk walk = walkFrom(invocation, source, filter);
    std::vector<ObjectPath> found;
    for (const AssociationStep& step : walk.steps()) {
        std::vector<ObjectPath> paths = follow(
            "ReferenceNames", invocation, walk, step, Answer::paths,
            [&](CMPIAssociationMI& mi, Request&, const CMPIContext* context, const CMPIResult* result,
                const CMPIObjectPath* path) {
                return mi.ft->referenceNames(&mi, context, result, path, step.registration->className.c_str(),
                                             orNull(filter.role));
            },
            pathsOf);
        std::move(paths.begin(), paths.end(), std::back_inserter(found));
    }
    return found;
}

} // namespace ObjectManager

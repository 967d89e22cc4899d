#include "cimxml/IntrinsicCall.h"

#include "cimxml/StatusCodes.h"

#include <algorithm>

namespace ObjectManager::CimXml {

namespace {

/** The error of one class's provider in an enumeration of an ancestor; its message begins with the class. */
CimError failureOf(const std::string& className, const CimError& error) {
    CimError failure(error.code, className + ": " + error.what());
    failure.reasons = error.reasons;
    return failure;
}

} // namespace

Invocation Call::invocation() const {
    Invocation invocation = operation.invocation();
    invocation.flags = (parameters.flag("IncludeClassOrigin", false) ? CMPI_FLAG_IncludeClassOrigin : 0) |
                       (parameters.flag("DeepInheritance", true) ? CMPI_FLAG_DeepInheritance : 0);
    return invocation;
}

bool isRegistered(const Operation& operation, std::string_view className) {
    const auto& registrations = operation.dispatcher.registry().registrations();
    return std::any_of(registrations.begin(), registrations.end(), [&](const Registration& registration) {
        return equalNames(registration.className, className) && registration.isIn(operation.message.nameSpace());
    });
}

CimError unknownClass(const std::string& className, CMPIrc code) {
    return {code, "there is no class " + className};
}

void requireServed(const Operation& operation, const std::string& className) {
    if (!isRegistered(operation, className)) {
        throw operation.catalogue.find(className) == nullptr
            ? unknownClass(className)
            : CimError(CMPI_RC_ERR_NOT_FOUND, "no provider serves instances of the class " + className);
    }
}

void forEachServed(const Call& call, const ObjectPath& classPath,
                   const std::function<void(const ObjectPath& classPath)>& doWith) {
    bool served = false;
    for (const Registration* registration :
         call.dispatcher().registry().all(classPath.nameSpace, ProviderKind::instance)) {
        if (call.catalogue().isA(registration->className, classPath.className)) {
            served = true;
            ObjectPath path = classPath;
            path.className = registration->className;
            try {
                doWith(path);
            } catch (const CimError& error) {
                // An exceeded limit of the server is not the failure of this class's provider.
                if (equalNames(path.className, classPath.className) || error.code == serverLimitsExceeded) {
                    throw;
                }
                throw failureOf(path.className, error);
            }
        }
    }
    // A class that is declared, but not registered, has no instances; for any other class, `find` throws the reason.
    if (!served &&
        (isRegistered(call.operation, classPath.className) || call.catalogue().find(classPath.className) == nullptr)) {
        call.dispatcher().registry().find(classPath.nameSpace, classPath.className, ProviderKind::instance);
    }
}

const Class& declaredClass(const Call& call, const std::string& className, CMPIrc unknown) {
    const Class* declared = call.catalogue().find(className);
    if (declared == nullptr) {
        throw unknownClass(className, unknown);
    }
    return *declared;
}

PropertyList askedOfProvider(const Call& call, const PropertyList& properties, const std::string& className) {
    const Class* declared = call.catalogue().find(className);
    if (!properties || declared == nullptr) {
        return properties;
    }
    const auto keys = call.catalogue().keyNames(className);
    PropertyList asked(std::in_place, keys.begin(), keys.end());
    for (const std::string& name : *properties) {
        const Property* property = declared->property(name);
        if (property != nullptr && !property->isKey()) {
            asked->push_back(property->name);
        }
    }
    return asked;
}

Selection selectionOfInstances(const Call& call) {
    call.parameters.flag("LocalOnly", true);
    call.parameters.flag("IncludeQualifiers", false);
    Selection selection;
    selection.properties = call.parameters.propertyList();
    selection.classOrigin = call.parameters.flag("IncludeClassOrigin", false);
    return selection;
}

Selection selectionOfEnumeration(const Call& call) {
    Selection selection = selectionOfInstances(call);
    if (!call.parameters.flag("DeepInheritance", true)) {
        selection.within = call.catalogue().find(call.parameters.className("ClassName").className);
    }
    return selection;
}

Selection selectionOfClasses(const Call& call, bool qualifiers, bool localOnly) {
    Selection selection;
    selection.properties = call.parameters.propertyList();
    selection.localOnly = call.parameters.flag("LocalOnly", localOnly);
    selection.qualifiers = call.parameters.flag("IncludeQualifiers", qualifiers);
    selection.classOrigin = call.parameters.flag("IncludeClassOrigin", false);
    return selection;
}

AssociationFilter associatorFilter(const Call& call) {
    return {call.parameters.optionalClassName("AssocClass"), call.parameters.optionalClassName("ResultClass"),
            call.parameters.optionalText("Role"), call.parameters.optionalText("ResultRole")};
}

AssociationFilter referenceFilter(const Call& call) {
    return {call.parameters.optionalClassName("ResultClass"), {}, call.parameters.optionalText("Role"), {}};
}

void forEachInstance(const Call& call, const ObjectPath& classPath, const PropertyList& properties,
                     const InstanceSink& sink) {
    forEachServed(call, classPath, [&](const ObjectPath& path) {
        call.dispatcher().enumerateInstances(call.invocation(), path, askedOfProvider(call, properties, path.className),
                                             sink);
    });
}

void forEachMatch(const Call& call, const Query& query, const InstanceSink& sink) {
    checkQuery(query, declaredClass(call, query.className));
    PropertyList needed = query.properties;
    if (needed) {
        const std::vector<std::string> compared = query.compared();
        needed->insert(needed->end(), compared.begin(), compared.end());
    }
    forEachInstance(call, {{}, call.nameSpace(), query.className, {}}, needed, [&](Instance&& instance) {
        if (matches(query, instance)) {
            sink(std::move(instance));
        }
    });
}

void forEachInstanceName(const Call& call, const PathSink& sink) {
    forEachServed(call, call.parameters.className("ClassName"), [&](const ObjectPath& path) {
        call.dispatcher().enumerateInstanceNames(call.invocation(), path, sink);
    });
}

std::vector<Instance> referencesOf(const Call& call, const ObjectPath& source) {
    return call.dispatcher().references(call.invocation(), source, referenceFilter(call), std::nullopt);
}

} // namespace ObjectManager::CimXml

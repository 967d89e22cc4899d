#include "provider/ServedClass.h"

#include "provider/BrokerCalls.h"
#include "provider/Outcome.h"

#include <algorithm>

namespace Norv::Provider {

namespace {

const ServedClass& servedBy(const CMPIInstanceMI* mi) {
    return *static_cast<const ServedClass*>(mi->hdl);
}

const ServedClass& servedBy(const CMPIAssociationMI* mi) {
    return *static_cast<const ServedClass*>(mi->hdl);
}

/** Carries out an operation: calls `operation` with the request, and then closes the result. */
template <typename Operation>
CMPIStatus perform(const ServedClass& served, const CMPIContext* context, const CMPIResult* result,
                   const CMPIObjectPath* reference, Operation operation) {
    return outcomeOf(
        served.broker(),
        [&] {
            operation(Request{served.broker(), context, nameSpaceOf(reference)});
            require("returnDone", CMReturnDone(result));
        },
        [&](const char* message) { served.report(message); });
}

void returnPath(const Request& request, const CMPIResult* result, const Path& path) {
    require("returnObjectPath", CMReturnObjectPath(result, newPath(request.broker, path)));
}

void returnInstance(const Request& request, const CMPIResult* result, const Instance& instance,
                    const char** properties) {
    require("returnInstance", CMReturnInstance(result, newInstance(request.broker, instance, properties)));
}

/* Instances */

CMPIStatus cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus enumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                             const CMPIObjectPath* reference) {
    return perform(servedBy(mi), context, result, reference, [&](const Request& request) {
        for (const Instance& instance : servedBy(mi).instances(request)) {
            returnPath(request, result, instance.path);
        }
    });
}

CMPIStatus enumInstances(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                         const CMPIObjectPath* reference, const char** properties) {
    return perform(servedBy(mi), context, result, reference, [&](const Request& request) {
        for (const Instance& instance : servedBy(mi).instances(request)) {
            returnInstance(request, result, instance, properties);
        }
    });
}

CMPIStatus getInstance(CMPIInstanceMI* mi, const CMPIContext* context, const CMPIResult* result,
                       const CMPIObjectPath* path, const char** properties) {
    return perform(servedBy(mi), context, result, path, [&](const Request& request) {
        const std::vector<Instance> instances = servedBy(mi).instances(request);
        const auto named = std::find_if(instances.begin(), instances.end(),
                                        [&](const Instance& instance) { return isSame(path, instance.path); });
        if (named == instances.end()) {
            throw OperationError(CMPI_RC_ERR_NOT_FOUND, "There is no such instance.");
        }
        returnInstance(request, result, *named, properties);
    });
}

CMPIStatus createInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*,
                          const CMPIInstance*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus modifyInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*,
                          const CMPIInstance*, const char**) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus deleteInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus execQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*, const char*,
                     const char*) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

/* Associations */

/** Restricts which associations are followed. A null member restricts nothing. */
struct Filter {
    const char* associationClass = nullptr;
    const char* resultClass = nullptr;
    const char* role = nullptr;
    const char* resultRole = nullptr;
};

bool isA(const Request& request, const CMPIObjectPath* path, const char* className) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIBoolean is = CMClassPathIsA(request.broker, path, className, &status);
    require(std::string("classPathIsA(") + className + ')', status);
    return is != 0;
}

/** Whether the object's class is `className` or a descendant; true if `className` is null. */
bool isAsked(const Request& request, const Path& path, const char* className) {
    return className == nullptr || isSameName(path.className, className) ||
           isA(request, newPath(request.broker, {path.nameSpace, path.className, {}}), className);
}

bool isRole(const Property& reference, const char* role) {
    return role == nullptr || isSameName(reference.name, role);
}

/** An association that refers to the source, and that reference. */
struct Link {
    const Instance& association;
    const Property& near;
};

/** Visits the associations that refer to a source, once for each reference to it. */
template <typename Visit>
void forEachLink(const ServedClass& served, const Request& request, const CMPIObjectPath* source, const Filter& filter,
                 Visit visit) {
    const std::vector<const char*> ends = served.ends();
    if (std::none_of(ends.begin(), ends.end(),
                     [&](const char* className) { return isA(request, source, className); })) {
        return;
    }
    for (const Instance& association : served.instances(request)) {
        if (!isAsked(request, association.path, filter.associationClass)) {
            continue;
        }
        for (const Property& near : association.path.keys) {
            if (isRole(near, filter.role) && isSame(source, std::get<Path>(near.value))) {
                visit(Link{association, near});
            }
        }
    }
}

/** Visits the paths of the objects that are associated with a source. */
template <typename Visit>
void forEachAssociated(const ServedClass& served, const Request& request, const CMPIObjectPath* source,
                       const Filter& filter, Visit visit) {
    forEachLink(served, request, source, filter, [&](const Link& link) {
        for (const Property& far : link.association.path.keys) {
            const Path& path = std::get<Path>(far.value);
            if (&far != &link.near && isRole(far, filter.resultRole) && isAsked(request, path, filter.resultClass)) {
                visit(path);
            }
        }
    });
}

CMPIStatus associationCleanup(CMPIAssociationMI*, const CMPIContext*, CMPIBoolean) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus associators(CMPIAssociationMI* mi, const CMPIContext* context, const CMPIResult* result,
                       const CMPIObjectPath* source, const char* associationClass, const char* resultClass,
                       const char* role, const char* resultRole, const char** properties) {
    return perform(servedBy(mi), context, result, source, [&](const Request& request) {
        forEachAssociated(servedBy(mi), request, source, {associationClass, resultClass, role, resultRole},
                          [&](const Path& path) {
                              const CMPIObjectPath* const far = newPath(request.broker, path);
                              const CMPIInstance* const instance =
                                  requireObject("getInstance of " + path.className, [&](CMPIStatus* status) {
                                      return CBGetInstance(request.broker, request.context, far, properties, status);
                                  });
                              require("returnInstance", CMReturnInstance(result, instance));
                          });
    });
}

CMPIStatus associatorNames(CMPIAssociationMI* mi, const CMPIContext* context, const CMPIResult* result,
                           const CMPIObjectPath* source, const char* associationClass, const char* resultClass,
                           const char* role, const char* resultRole) {
    return perform(servedBy(mi), context, result, source, [&](const Request& request) {
        forEachAssociated(servedBy(mi), request, source, {associationClass, resultClass, role, resultRole},
                          [&](const Path& path) { returnPath(request, result, path); });
    });
}

CMPIStatus references(CMPIAssociationMI* mi, const CMPIContext* context, const CMPIResult* result,
                      const CMPIObjectPath* source, const char* resultClass, const char* role,
                      const char** properties) {
    return perform(servedBy(mi), context, result, source, [&](const Request& request) {
        forEachLink(servedBy(mi), request, source, {.associationClass = resultClass, .role = role},
                    [&](const Link& link) { returnInstance(request, result, link.association, properties); });
    });
}

CMPIStatus referenceNames(CMPIAssociationMI* mi, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* source, const char* resultClass, const char* role) {
    return perform(servedBy(mi), context, result, source, [&](const Request& request) {
        forEachLink(servedBy(mi), request, source, {.associationClass = resultClass, .role = role},
                    [&](const Link& link) { returnPath(request, result, link.association.path); });
    });
}

} // namespace

std::vector<Path> Request::namesOf(const char* inNameSpace, const char* className) const {
    const CMPIObjectPath* const classPath = newPath(broker, {inNameSpace, className, {}});
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const CMPIEnumeration* const names = CBEnumInstanceNames(broker, context, classPath, &status);
    const CMPIrc notServed[] = {CMPI_RC_ERR_INVALID_NAMESPACE, CMPI_RC_ERR_INVALID_CLASS, CMPI_RC_ERR_NOT_SUPPORTED,
                                CMPI_RC_ERR_NOT_FOUND};
    if (std::find(std::begin(notServed), std::end(notServed), status.rc) != std::end(notServed)) {
        return {};
    }
    require(std::string("enumerateInstanceNames of ") + className, status);
    std::vector<Path> paths;
    while (!isNull(names) && CMHasNext(names, &status)) {
        const CMPIData name = CMGetNext(names, &status);
        require("getNext", status);
        if (name.type != CMPI_ref || isNull(name.value.ref)) {
            throw OperationError(CMPI_RC_ERR_FAILED, std::string("enumerateInstanceNames of ") + className +
                                                         " gave something else than object paths.");
        }
        paths.push_back(pathOf(name.value.ref));
    }
    return paths;
}

ServedClass::ServedClass(const char* name)
    : _instanceName(std::string("instance") + name), _associationName(std::string("association") + name),
      _instanceTable{CMPICurrentVersion, CMPICurrentVersion, _instanceName.c_str(), cleanup,        enumInstanceNames,
                     enumInstances,      getInstance,        createInstance,        modifyInstance, deleteInstance,
                     execQuery},
      _associationTable{CMPICurrentVersion, CMPICurrentVersion, _associationName.c_str(),
                        associationCleanup, associators,        associatorNames,
                        references,         referenceNames},
      _instanceMI{this, &_instanceTable}, _associationMI{this, &_associationTable} {}

CMPIInstanceMI* ServedClass::instanceMI(const CMPIBroker* broker) {
    _broker = broker;
    return &_instanceMI;
}

CMPIAssociationMI* ServedClass::associationMI(const CMPIBroker* broker) {
    _broker = broker;
    return &_associationMI;
}

} // namespace Norv::Provider

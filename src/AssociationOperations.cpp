#include "AssociationOperations.h"

#include "BrokerObjects.h"
#include "Operation.h"

#include "Norv/Common.h"

#include <map>

namespace Norv::PowerStateManagementServiceProvider {

namespace {

/** The key properties with which factories of services and of capabilities are made. */
constexpr const char* srcKey = "Name";
constexpr const char* targetKey = "InstanceID";

/** The records that provide the power states: one copy for a whole operation. */
Records recordsFor(PowerStates powerStates, PowerStateManagementObjFactory& factory) {
    return powerStates == PowerStates::none ? Records() : factory.getPowerStateManagementMap();
}

void setEnds(const AssociationProvider& provider, const CMPIInstance* association, const CMPIObjectPath* first,
             const CMPIObjectPath* second) {
    setProperty(association, provider.first.role, first);
    setProperty(association, provider.second.role, second);
}

void setPowerStates(const CMPIInstance* association, PowerStateManagement& record) {
    setProperty(association, "PowerState", record.getPowerState());
    setProperty(association, "RequestedPowerState", record.getRequestedPowerState());
}

/** Whether two class names are equal. The case of ASCII letters is ignored, whatever the process's locale. */
bool isSameName(const char* left, const char* right) {
    const auto lower = [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; };
    while (*left != '\0' && lower(*left) == lower(*right)) {
        ++left;
        ++right;
    }
    return lower(*left) == lower(*right);
}

/** Whether a request with this result class, which may be null, asks for objects of this end. */
bool isResultClass(const AssociationEnd& end, const char* resultClass) {
    return end.resultClassAlias == nullptr || resultClass == nullptr || isSameName(resultClass, end.className) ||
           isSameName(resultClass, end.resultClassAlias);
}

/** One request to the provider of an association: the steps that its operations have in common. */
class AssociationRequest {
public:
    /** @param ref the request's path: the class of an enumeration, or the source of a traversal. */
    AssociationRequest(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                       const CMPIObjectPath* ref, const Site& site)
        : operation(provider.category, site), factory(srcKey), _provider(provider), _broker(broker), _context(context),
          _ref(ref) {}

    Operation operation;
    /** Makes the objects of services. */
    PowerStateManagementObjFactory factory;

    /** The namespace of the request. */
    const char* nameSpace() { return textOf(CMGetNameSpace(_ref, &operation.status)); }

    /**
     * Visits the pairs of object paths, one path of each end, until a visit fails.
     *
     * @return whether all visits and all steps in between succeeded. A failed step has been reported.
     */
    template <typename Visit>
    bool forEachPair(const PairTexts& texts, Visit visit) {
        return forEachPathOf(_provider.first, nullptr, texts, [&](CMPIObjectPath* first) {
            return forEachPathOf(_provider.second, first, texts,
                                 [&](CMPIObjectPath* second) { return visit(first, second); });
        });
    }

    /** Makes a path of the association without keys. If the broker cannot make it, reports that and returns null. */
    CMPIObjectPath* newAssociationPath(const PairTexts& texts) {
        CMPIObjectPath* const path = newClassPath(_broker, nameSpace(), _provider.className, &operation.status);
        isUsable(path, texts.associationPathFailed);
        return path;
    }

    /** Finds the far end of a traversal. @return false if the association does not link the class of the source. */
    bool resolve(const char* assocClass, const char* resultClass) {
        _target = factory.get_assoc_targetClass_ObjectPath(_broker, _ref, assocClass, resultClass, &operation.status);
        return !isNull(_target);
    }

    /**
     * Finds the far end of a reference. The association is always this provider's own, whichever class the request
     * names.
     */
    bool resolveReference() {
        const bool resolved = resolve(_provider.className, nullptr);
        _referencePath = CMNewObjectPath(_broker, nameSpace(), _provider.className, &operation.status);
        return resolved;
    }

    /** The far end after it was resolved; null if its class is at neither end of this association. */
    const AssociationEnd* farEnd() {
        const char* const className = textOf(CMGetClassName(_target, &operation.status));
        if (isText(className, _provider.first.className)) {
            return &_provider.first;
        }
        return isText(className, _provider.second.className) ? &_provider.second : nullptr;
    }

    /**
     * Visits the path of each object at the far end. If the objects are not available, reports `notAvailable` and
     * returns false.
     */
    template <typename Visit>
    bool forEachFarPath(const AssociationEnd& end, const char* notAvailable, Visit visit) {
        return forEachPath(end, _target, notAvailable, [&](CMPIObjectPath* path) {
            visit(path);
            return true;
        });
    }

    /** The same for instances. Those of another provider have all their properties. */
    template <typename Visit>
    bool forEachFarInstance(const AssociationEnd& end, char const** properties, bool keysOnly, const char* notAvailable,
                            Visit visit) {
        const auto visitOne = [&](const CMPIInstance* instance) {
            visit(instance);
            return true;
        };
        if (end.source == ObjectSource::objectManager) {
            const CMPIEnumeration* const all =
                _broker->bft->enumerateInstances(_broker, _context, _target, nullptr, &operation.status);
            return forEachEnumerated(
                all, notAvailable, [](const CMPIData& data) { return data.value.inst; }, visitOne);
        }
        const auto all = end.source == ObjectSource::services
                             ? &PowerStateManagementObjFactory::getAllPMCMPIInstances
                             : &PowerStateManagementObjFactory::getAllPMCapCMPIInstances;
        return forEachMade<CMPIInstance>(
            end, notAvailable,
            [&](PowerStateManagementObjFactory& source, std::vector<CMPIInstance*>& instances) {
                return (source.*all)(_broker, _target, properties, keysOnly, instances, &operation.status);
            },
            visitOne);
    }

    /** Makes an instance of the association, without properties; null if the broker cannot make it. */
    const CMPIInstance* newReference() {
        const CMPIInstance* const reference = CMNewInstance(_broker, _referencePath, &operation.status);
        return isNull(reference) ? nullptr : reference;
    }

    /** Sets the references of an association to the source and to an object at the far end. */
    void setReferenceEnds(const CMPIInstance* reference, const AssociationEnd& end, const CMPIObjectPath* far) const {
        const bool farIsFirst = &end == &_provider.first;
        setEnds(_provider, reference, farIsFirst ? far : _ref, farIsFirst ? _ref : far);
    }

    /** Sets the namespace of a path to the request's, and its host name to the managed system's. */
    void place(CMPIObjectPath* path) {
        CMSetNameSpace(path, nameSpace());
        CMSetHostname(path, getSystemName().c_str());
    }

private:
    bool isUsable(const CMPIObjectPath* path, const char* failure) const {
        const bool usable = !isNull(path);
        if (!usable) {
            operation.report(failure);
        }
        return usable;
    }

    /**
     * Visits the paths of an end for an enumeration. Paths of this library's classes get the request's namespace.
     *
     * @param outer the current path at the first end, if `end` is the second one; else null.
     */
    template <typename Visit>
    bool forEachPathOf(const AssociationEnd& end, const CMPIObjectPath* outer, const PairTexts& texts, Visit visit) {
        if (end.source == ObjectSource::objectManager) {
            const CMPIObjectPath* const classPath =
                CMNewObjectPath(_broker, nameSpace(), end.className, &operation.status);
            return isUsable(classPath, "Create CMPIObjectPath failed for ComputerSystemClass.") &&
                   forEachPath(end, classPath, computerSystemsNotAvailable, visit);
        }
        const bool areServices = end.source == ObjectSource::services;
        const char* const notAvailable = areServices ? texts.servicesNotAvailable : texts.capabilitiesNotAvailable;
        return forEachPath(end, _ref, notAvailable, [&](CMPIObjectPath* path) {
            // For a path of capabilities, the service's path is checked once more, and not this path.
            if (!(areServices ? isUsable(path, texts.servicePathNull) : isUsable(outer, texts.capabilitiesPathNull))) {
                return false;
            }
            CMSetNameSpace(path, nameSpace());
            return visit(path);
        });
    }

    /**
     * Visits the paths of an end, which are made after `classPath`, until a visit returns false. @return whether no
     * visit did.
     */
    template <typename Visit>
    bool forEachPath(const AssociationEnd& end, const CMPIObjectPath* classPath, const char* notAvailable,
                     Visit visit) {
        if (end.source == ObjectSource::objectManager) {
            const CMPIEnumeration* const names = CBEnumInstanceNames(_broker, _context, classPath, &operation.status);
            return forEachEnumerated(
                names, notAvailable, [](const CMPIData& data) { return data.value.ref; }, visit);
        }
        const auto all = end.source == ObjectSource::services
                             ? &PowerStateManagementObjFactory::getAllPMCMPIObjPaths
                             : &PowerStateManagementObjFactory::getAllPMCapCMPIObjPaths;
        return forEachMade<CMPIObjectPath>(
            end, notAvailable,
            [&](PowerStateManagementObjFactory& source, std::vector<CMPIObjectPath*>& paths) {
                return (source.*all)(_broker, classPath, paths, &operation.status);
            },
            visit);
    }

    /**
     * Visits the objects that an up-call returned. A null enumeration counts as empty, and null objects are skipped.
     */
    template <typename Get, typename Visit>
    bool forEachEnumerated(const CMPIEnumeration* enumeration, const char* notAvailable, Get get, Visit visit) {
        if (operation.status.rc != CMPI_RC_OK) {
            operation.report(notAvailable);
            return false;
        }
        if (isNull(enumeration)) {
            return true;
        }
        while (CMHasNext(enumeration, &operation.status)) {
            auto* const object = get(CMGetNext(enumeration, &operation.status));
            if (!isNull(object) && !visit(object)) {
                return false;
            }
        }
        return true;
    }

    /** Visits the objects that the factory of an end makes. */
    template <typename Object, typename Make, typename Visit>
    bool forEachMade(const AssociationEnd& end, const char* notAvailable, Make make, Visit visit) {
        std::vector<Object*> objects;
        const auto makeAll = [&](PowerStateManagementObjFactory& source) {
            objects.reserve(source.getNumberOfInstances());
            return make(source, objects) == PowerStateManagementObjFactory::done;
        };
        bool made = false;
        if (end.source == ObjectSource::services) {
            made = makeAll(factory);
        } else {
            PowerStateManagementObjFactory capabilities(targetKey);
            made = makeAll(capabilities);
        }
        if (!made) {
            operation.report(notAvailable);
            return false;
        }
        return forEach(objects, visit);
    }

    const AssociationProvider& _provider;
    const CMPIBroker* _broker;
    const CMPIContext* _context;
    const CMPIObjectPath* _ref;
    CMPIObjectPath* _target = nullptr;
    const CMPIObjectPath* _referencePath = nullptr;
};

/** The association class that a request asks for; the provider's own if the request names none. */
const char* requestedClass(const AssociationProvider& provider, const char* assocClass) {
    return assocClass == nullptr ? provider.className : assocClass;
}

} // namespace

unsigned short buildAssociations(const AssociationProvider& provider, const CMPIBroker* broker,
                                 const CMPIContext* context, const CMPIObjectPath* ref, char const** properties,
                                 std::vector<CMPIInstance*>& instances, const Site& site) {
    AssociationRequest request(provider, broker, context, ref, site);
    Records records = recordsFor(provider.inInstances, request.factory);
    const bool complete =
        request.forEachPair(provider.instances, [&](const CMPIObjectPath* first, const CMPIObjectPath* second) {
            const CMPIObjectPath* const path = request.newAssociationPath(provider.instances);
            if (path == nullptr) {
                return false;
            }
            CMPIInstance* const instance = CMNewInstance(broker, path, nullptr);
            if (!isNull(instance)) {
                CMSetPropertyFilter(instance, properties, provider.filterKeys);
                setEnds(provider, instance, first, second);
                if (!records.empty()) {
                    setPowerStates(instance, records.begin()->second);
                }
            }
            instances.push_back(instance);
            return true;
        });
    if (!complete) {
        return CMPI_RC_ERR_FAILED;
    }
    request.operation.markExit();
    return CMPI_RC_OK;
}

CMPIStatus enumAssociationNames(const AssociationProvider& provider, const CMPIBroker* broker,
                                const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* ref,
                                const Site& site) {
    AssociationRequest request(provider, broker, context, ref, site);
    Operation& operation = request.operation;
    const bool complete =
        request.forEachPair(provider.names, [&](const CMPIObjectPath* first, const CMPIObjectPath* second) {
            CMPIObjectPath* const path = request.newAssociationPath(provider.names);
            if (path == nullptr) {
                if (provider.onNamesPathFailed != nullptr) {
                    provider.onNamesPathFailed(broker, &operation.status);
                }
                return false;
            }
            addKey(path, provider.first.role, first);
            addKey(path, provider.second.role, second);
            CMReturnObjectPath(result, path);
            return true;
        });
    if (!complete) {
        return operation.status;
    }
    if (provider.namesCloseBeforeExit) {
        return operation.complete(result);
    }
    operation.markExit();
    CMReturnDone(result);
    return operation.status;
}

CMPIStatus enumAssociations(const AssociationProvider& provider, const CMPIContext* context, const CMPIResult* result,
                            const CMPIObjectPath* ref, char const** properties, const Site& site) {
    const Operation operation(provider.category, site);
    const PowerStateManagementObjFactory factory(srcKey);
    std::vector<CMPIInstance*> instances;
    if (provider.build(ref, properties, context, instances) == CMPI_RC_OK) {
        returnAll(result, instances);
    }
    return operation.complete(result);
}

CMPIStatus getAssociation(const AssociationProvider& provider, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* ref, char const** properties, const Site& site) {
    Operation operation(provider.category, site);
    const PowerStateManagementObjFactory factory(srcKey);
    if (CMGetKeyCount(ref, &operation.status) == 0) {
        operation.report("At least one key should be passed");
        return operation.complete(result);
    }
    std::vector<CMPIInstance*> instances;
    if (provider.build(ref, properties, context, instances) == CMPI_RC_OK) {
        returnFirstMatch(result, instances, ref, true, &operation.status);
    }
    return operation.complete(result);
}

CMPIStatus associatorNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                           const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                           const char* resultClass, const Site& site) {
    AssociationRequest request(provider, broker, context, op, site);
    if (!request.resolve(requestedClass(provider, assocClass), resultClass)) {
        return request.operation.fail(provider.targetNull.associatorNames);
    }
    if (const AssociationEnd* const end = request.farEnd()) {
        const auto deliver = [&](CMPIObjectPath* path) {
            if (end->placedByAssociatorNames) {
                request.place(path);
            }
            CMReturnObjectPath(result, path);
        };
        if (!isResultClass(*end, resultClass) ||
            !request.forEachFarPath(*end, end->notAvailable.associatorNames, deliver)) {
            return request.operation.status;
        }
    }
    request.operation.markExit();
    return request.operation.status;
}

CMPIStatus associators(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                       const CMPIResult* result, const CMPIObjectPath* op, const char* assocClass,
                       const char* resultClass, char const** properties, const Site& site) {
    AssociationRequest request(provider, broker, context, op, site);
    if (!request.resolve(requestedClass(provider, assocClass), resultClass)) {
        return request.operation.fail(provider.targetNull.associators);
    }
    if (const AssociationEnd* const end = request.farEnd()) {
        const auto deliver = [&](const CMPIInstance* instance) { CMReturnInstance(result, instance); };
        if (!isResultClass(*end, resultClass) ||
            !request.forEachFarInstance(*end, properties, false, end->notAvailable.associators, deliver)) {
            return request.operation.status;
        }
    }
    request.operation.markExit();
    return request.operation.status;
}

CMPIStatus referenceNames(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                          const CMPIResult* result, const CMPIObjectPath* op, const Site& site) {
    AssociationRequest request(provider, broker, context, op, site);
    CMPIStatus& status = request.operation.status;
    if (!request.resolveReference()) {
        return request.operation.fail(provider.targetNull.referenceNames);
    }
    if (const AssociationEnd* const end = request.farEnd()) {
        const auto deliver = [&](CMPIObjectPath* far) {
            const CMPIInstance* const reference = request.newReference();
            if (reference == nullptr) {
                return;
            }
            if (end->source != ObjectSource::objectManager) {
                request.place(far);
            }
            request.setReferenceEnds(reference, *end, far);
            CMPIObjectPath* const path = CMGetObjectPath(reference, &status);
            if (!isNull(path)) {
                CMSetNameSpace(path, request.nameSpace());
                CMReturnObjectPath(result, path);
            }
        };
        if (!request.forEachFarPath(*end, end->notAvailable.referenceNames, deliver)) {
            return status;
        }
    }
    request.operation.markExit();
    return status;
}

namespace {

/** Sets the properties of a reference. @return false if the reference must not be returned. */
bool fillReference(const AssociationRequest& request, const CMPIInstance* reference, const AssociationEnd& end,
                   const CMPIObjectPath* far, Records& records) {
    if (end.inReferences == PowerStates::everyRecord) {
        for (auto& [key, record] : records) {
            request.setReferenceEnds(reference, end, far);
            setPowerStates(reference, record);
        }
        return !records.empty();
    }
    request.setReferenceEnds(reference, end, far);
    if (!records.empty()) {
        setPowerStates(reference, records.begin()->second);
    }
    return true;
}

} // namespace

CMPIStatus references(const AssociationProvider& provider, const CMPIBroker* broker, const CMPIContext* context,
                      const CMPIResult* result, const CMPIObjectPath* op, char const** properties, const Site& site) {
    AssociationRequest request(provider, broker, context, op, site);
    CMPIStatus& status = request.operation.status;
    if (!request.resolveReference()) {
        return request.operation.fail(provider.targetNull.references);
    }
    if (const AssociationEnd* const end = request.farEnd()) {
        Records records = recordsFor(end->inReferences, request.factory);
        const auto deliver = [&](const CMPIObjectPath* far) {
            const CMPIInstance* const reference = request.newReference();
            if (reference != nullptr && fillReference(request, reference, *end, far, records)) {
                CMReturnInstance(result, reference);
            }
        };
        const auto deliverPathOf = [&](const CMPIInstance* instance) {
            CMPIObjectPath* const far = isNull(instance) ? nullptr : CMGetObjectPath(instance, &status);
            if (!isNull(far)) {
                request.place(far);
                deliver(far);
            }
        };
        const char* const notAvailable = end->notAvailable.references;
        const bool keysOnly = provider.referencesOfKeysOnly || properties != nullptr;
        const bool delivered = end->source == ObjectSource::objectManager
                                   ? request.forEachFarPath(*end, notAvailable, deliver)
                                   : request.forEachFarInstance(*end, nullptr, keysOnly, notAvailable, deliverPathOf);
        if (!delivered) {
            return status;
        }
    }
    request.operation.markExit();
    return status;
}

} // namespace Norv::PowerStateManagementServiceProvider

/* Up-calls: operations for which a provider asks the object manager while it serves one itself. */
#include "broker/Objects.h"

#include <memory>
#include <utility>

namespace ObjectManager {

namespace {

/** The invocation of an up-call: the user and the flags of the context, and the meter of the request. */
Invocation invocationOf(const CMPIContext* context, const Request& request) {
    Invocation invocation;
    invocation.meter = request.meter();
    const NamedItemsContent* content = contentOf(context, nullptr);
    if (content == nullptr) {
        return invocation;
    }
    if (const NamedItem* principal = findItem(content->items, CMPIPrincipal);
        principal != nullptr && !principal->item.null && principal->item.type == CMPI_string) {
        invocation.principal = principal->item.content.text;
    }
    if (const NamedItem* flags = findItem(content->items, CMPIInvocationFlags);
        flags != nullptr && !flags->item.null && flags->item.type == CMPI_uint32) {
        std::memcpy(&invocation.flags, &flags->item.content.scalar, sizeof invocation.flags);
    }
    return invocation;
}

CMPIStatus failed(CMPIrc code, const std::string& message) {
    return {code, returnedString(message.c_str(), nullptr)};
}

/**
 * Does one up-call: `call` gets the operations that serve it, the request in which it makes objects, and the
 * invocation.
 *
 * @return a status; if `call` throws a CimError, the status has its code and message.
 */
template <typename Call>
CMPIStatus upCall(const CMPIBroker* handle, const CMPIContext* context, Call call) {
    if (handle == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    CMPIStatus status;
    if (contentOf(context, &status) == nullptr) {
        return status;
    }
    Request* request = requestFor(&status);
    if (request == nullptr) {
        return status;
    }
    Operations* operations = static_cast<const Broker*>(handle->hdl)->upCalls();
    if (operations == nullptr) {
        return statusOf(CMPI_RC_ERR_NOT_SUPPORTED);
    }
    if (request->depth() >= Broker::maximumDepth) {
        return failed(CMPI_RC_ERR_FAILED, "requests of providers nest deeper than " +
                                              std::to_string(Broker::maximumDepth) +
                                              " levels: does a provider ask for itself?");
    }
    try {
        call(*operations, *request, invocationOf(context, *request));
    } catch (const CimError& error) {
        return failed(error.code, error.what());
    }
    return statusOf(CMPI_RC_OK);
}

/** Does an up-call whose target is an object path. `call` gets the path as its last argument. */
template <typename Call>
CMPIStatus pathCall(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path, Call call) {
    CMPIStatus status;
    const PathContent* content = contentOf(path, &status);
    if (content == nullptr) {
        return status;
    }
    return upCall(broker, context, [&](Operations& operations, Request& request, const Invocation& invocation) {
        call(operations, request, invocation, toModel(*content));
    });
}

/** Does an up-call that has an object path and an instance. `call` gets both as its last arguments. */
template <typename Call>
CMPIStatus instanceCall(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                        const CMPIInstance* instance, Call call) {
    CMPIStatus status;
    const InstanceContent* content = contentOf(instance, &status);
    if (content == nullptr) {
        return status;
    }
    return pathCall(
        broker, context, path,
        [&](Operations& operations, Request& request, const Invocation& invocation, const ObjectPath& target) {
            call(operations, request, invocation, target, fullInstance(*content, request.broker().classes()));
        });
}

/** Collects paths or instances, and makes an enumeration of them in a request. */
class Elements {
public:
    Elements(Request& request, CMPIType type) : _request(request), _type(type) {}

    template <typename Object>
    void add(Object&& object) {
        const Value value{_type, std::make_shared<const Object>(std::forward<Object>(object))};
        _items.push_back(fromModel(_request.memory(), value));
    }

    CMPIEnumeration* enumeration() {
        const auto count = static_cast<std::uint32_t>(_items.size());
        Item* elements = newElements(_request.memory(), count);
        std::copy(_items.begin(), _items.end(), elements);
        return newObjectOf<CMPIEnumeration>(_request, {{_type, count, elements}, 0});
    }

private:
    Request& _request;
    CMPIType _type;
    std::vector<Item> _items;
};

/** Sets `rc` to the status, unless `rc` is null. @return the object, which is null if the call failed. */
template <typename Handle>
Handle* answer(Handle* object, const CMPIStatus& status, CMPIStatus* rc) {
    if (rc != nullptr) {
        *rc = status;
    }
    return object;
}

CMPIEnumeration* enumerateInstanceNames(const CMPIBroker* broker, const CMPIContext* context,
                                        const CMPIObjectPath* path, CMPIStatus* rc) {
    CMPIEnumeration* result = nullptr;
    const CMPIStatus status =
        pathCall(broker, context, path,
                 [&](Operations& operations, Request& request, const auto& invocation, const auto& target) {
                     Elements names(request, CMPI_ref);
                     operations.enumerateInstanceNames(invocation, target,
                                                       [&](ObjectPath&& name) { names.add(std::move(name)); });
                     result = names.enumeration();
                 });
    return answer(result, status, rc);
}

CMPIInstance* getInstance(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                          const char** properties, CMPIStatus* rc) {
    CMPIInstance* result = nullptr;
    const CMPIStatus status =
        pathCall(broker, context, path,
                 [&](Operations& operations, Request& request, const auto& invocation, const auto& target) {
                     result = request.instance(operations.getInstance(invocation, target, propertyListOf(properties)));
                 });
    return answer(result, status, rc);
}

CMPIObjectPath* createInstance(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                               const CMPIInstance* instance, CMPIStatus* rc) {
    CMPIObjectPath* result = nullptr;
    const CMPIStatus status =
        instanceCall(broker, context, path, instance,
                     [&](Operations& operations, Request& request, const auto& invocation, const auto& target,
                         const Instance& created) {
                         result = request.objectPath(operations.createInstance(invocation, target, created));
                     });
    return answer(result, status, rc);
}

CMPIStatus modifyInstance(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                          const CMPIInstance* instance, const char** properties) {
    return instanceCall(
        broker, context, path, instance,
        [&](Operations& operations, Request&, const auto& invocation, const auto& target, const Instance& modified) {
            operations.modifyInstance(invocation, target, modified, propertyListOf(properties));
        });
}

CMPIStatus deleteInstance(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path) {
    return pathCall(broker, context, path,
                    [](Operations& operations, Request&, const auto& invocation, const auto& target) {
                        operations.deleteInstance(invocation, target);
                    });
}

CMPIEnumeration* execQuery(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                           const char* query, const char* language, CMPIStatus* rc) {
    if (query == nullptr || language == nullptr) {
        return failure(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    CMPIEnumeration* result = nullptr;
    const CMPIStatus status =
        pathCall(broker, context, path,
                 [&](Operations& operations, Request& request, const auto& invocation, const auto& target) {
                     Elements found(request, CMPI_instance);
                     operations.execQuery(invocation, target, query, language,
                                          [&](Instance&& instance) { found.add(std::move(instance)); });
                     result = found.enumeration();
                 });
    return answer(result, status, rc);
}

CMPIEnumeration* enumerateInstances(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                    const char** properties, CMPIStatus* rc) {
    CMPIEnumeration* result = nullptr;
    const CMPIStatus status =
        pathCall(broker, context, path,
                 [&](Operations& operations, Request& request, const auto& invocation, const auto& target) {
                     Elements found(request, CMPI_instance);
                     operations.enumerateInstances(invocation, target, propertyListOf(properties),
                                                   [&](Instance&& instance) { found.add(std::move(instance)); });
                     result = found.enumeration();
                 });
    return answer(result, status, rc);
}

CMPIData invokeMethod(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                      const char* method, const CMPIArgs* in, CMPIArgs* out, CMPIStatus* rc) {
    CMPIStatus status;
    if (method == nullptr) {
        return noData(rc, CMPI_RC_ERR_INVALID_PARAMETER);
    }
    const NamedItemsContent* arguments = contentOf(in, &status);
    NamedItemsContent* answers = arguments != nullptr ? contentOf(out, &status) : nullptr;
    if (answers == nullptr) {
        return noData(rc, status.rc);
    }
    CMPIData data = noData(nullptr, CMPI_RC_OK);
    status = pathCall(broker, context, path,
                      [&](Operations& operations, Request& request, const auto& invocation, const auto& target) {
                          const MethodResult result =
                              operations.invokeMethod(invocation, target, method, toModel(arguments->items));
                          Memory& memory = *headerOf(out).memory;
                          for (const NamedValue& argument : result.outArguments) {
                              setItem(memory, answers->items, argument.name, fromModel(memory, argument.value));
                          }
                          data = dataOf(fromModel(request.memory(), result.returnValue), CMPI_goodValue, nullptr);
                      });
    if (rc != nullptr) {
        *rc = status;
    }
    return data;
}

/** The filter of an association call, whose names may be null. */
AssociationFilter filterOf(const char* associationClass, const char* resultClass, const char* role,
                           const char* resultRole) {
    return {orEmpty(associationClass), orEmpty(resultClass), orEmpty(role), orEmpty(resultRole)};
}

/**
 * Does an up-call for associated objects: `call` gets the operations, the invocation, the source, and a function that
 * takes the objects found.
 */
template <typename Call>
CMPIEnumeration* associationCall(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                 CMPIType type, CMPIStatus* rc, Call call) {
    CMPIEnumeration* result = nullptr;
    const CMPIStatus status =
        pathCall(broker, context, path,
                 [&](Operations& operations, Request& request, const auto& invocation, const auto& source) {
                     Elements found(request, type);
                     call(operations, invocation, source, [&](auto objects) {
                         for (auto& object : objects) {
                             found.add(std::move(object));
                         }
                     });
                     result = found.enumeration();
                 });
    return answer(result, status, rc);
}

/*
 * An enumeration of CMPI cannot tell the association class of an object. Therefore it has the objects of one
 * association class after those of another one.
 */

CMPIEnumeration* associators(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                             const char* associationClass, const char* resultClass, const char* role,
                             const char* resultRole, const char** properties, CMPIStatus* rc) {
    return associationCall(
        broker, context, path, CMPI_instance, rc,
        [&](Operations& operations, const auto& invocation, const auto& source, const auto& take) {
            const AssociationFilter filter = filterOf(associationClass, resultClass, role, resultRole);
            for (auto& each : operations.associators(invocation, source, filter, propertyListOf(properties))) {
                take(std::move(each.objects));
            }
        });
}

CMPIEnumeration* associatorNames(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                 const char* associationClass, const char* resultClass, const char* role,
                                 const char* resultRole, CMPIStatus* rc) {
    return associationCall(broker, context, path, CMPI_ref, rc,
                           [&](Operations& operations, const auto& invocation, const auto& source, const auto& take) {
                               const AssociationFilter filter =
                                   filterOf(associationClass, resultClass, role, resultRole);
                               for (auto& each : operations.associatorNames(invocation, source, filter)) {
                                   take(std::move(each.objects));
                               }
                           });
}

CMPIEnumeration* references(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                            const char* associationClass, const char* role, const char** properties, CMPIStatus* rc) {
    return associationCall(broker, context, path, CMPI_instance, rc,
                           [&](Operations& operations, const auto& invocation, const auto& source, const auto& take) {
                               const AssociationFilter filter = filterOf(associationClass, nullptr, role, nullptr);
                               take(operations.references(invocation, source, filter, propertyListOf(properties)));
                           });
}

CMPIEnumeration* referenceNames(const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* path,
                                const char* associationClass, const char* role, CMPIStatus* rc) {
    return associationCall(
        broker, context, path, CMPI_ref, rc,
        [&](Operations& operations, const auto& invocation, const auto& source, const auto& take) {
            take(operations.referenceNames(invocation, source, filterOf(associationClass, nullptr, role, nullptr)));
        });
}

/* Threads that providers start. */

/** The request of an attached thread; it lasts until detachThread is called, or the thread ends. */
thread_local std::unique_ptr<Request> attachedRequest;

CMPIContext* prepareAttachThread(const CMPIBroker* broker, const CMPIContext* context) {
    return broker != nullptr ? clone(context, nullptr) : nullptr;
}

CMPIStatus attachThread(const CMPIBroker* broker, const CMPIContext* context) {
    CMPIStatus status;
    if (broker == nullptr || contentOf(context, &status) == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    if (Request::current() != nullptr) {
        return failed(CMPI_RC_ERR_FAILED, "this thread serves a request already");
    }
    attachedRequest = std::make_unique<Request>(*static_cast<const Broker*>(broker->hdl));
    return status;
}

/** Ends the thread's request, and releases the context, if it is the one that prepareAttachThread made. */
CMPIStatus detachThread(const CMPIBroker* broker, const CMPIContext* context) {
    CMPIStatus status;
    if (broker == nullptr || contentOf(context, &status) == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    if (attachedRequest == nullptr || attachedRequest.get() != Request::current()) {
        return failed(CMPI_RC_ERR_FAILED, "this thread is not attached");
    }
    if (const std::string& misuse = attachedRequest->misuse(); !misuse.empty()) {
        attachedRequest->broker().message(
            {BrokerMessage::Kind::log, CMPI_SEV_ERROR, "attached thread", "a provider's thread " + misuse});
    }
    attachedRequest.reset();
    return isClone(headerOf(context)) ? release(const_cast<CMPIContext*>(context)) : status;
}

/* The following slots are not supported. */

CMPIStatus unsupported(const CMPIBroker* broker) {
    return statusOf(broker != nullptr ? CMPI_RC_ERR_NOT_SUPPORTED : CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus deliverIndication(const CMPIBroker* broker, const CMPIContext*, const char*, const CMPIInstance*) {
    return unsupported(broker);
}

CMPIStatus setProperty(const CMPIBroker* broker, const CMPIContext*, const CMPIObjectPath*, const char*,
                       const CMPIValue*, CMPIType) {
    return unsupported(broker);
}

CMPIData getProperty(const CMPIBroker* broker, const CMPIContext*, const CMPIObjectPath*, const char*, CMPIStatus* rc) {
    return noData(rc, unsupported(broker).rc);
}

} // namespace

const CMPIBrokerFT upCallTable = {
    CMPI_MB_InstanceManipulation | CMPI_MB_AssociationTraversal | CMPI_MB_OSEncapsulationSupport |
        CMPI_MB_Supports_MemEnhancements | CMPI_MB_Supports_Extended_Error,
    CMPIVersion200,
    "orv-objectmanager",
    prepareAttachThread,
    attachThread,
    detachThread,
    deliverIndication,
    enumerateInstanceNames,
    getInstance,
    createInstance,
    modifyInstance,
    deleteInstance,
    execQuery,
    enumerateInstances,
    associators,
    associatorNames,
    references,
    referenceNames,
    invokeMethod,
    setProperty,
    getProperty,
};

} // namespace ObjectManager

/**
 * The interface of CIM operations. Operations on behalf of clients go through it, and so do the up-calls of providers:
 * the operations for which a provider asks the object manager while it serves one itself.
 */
#ifndef MODEL_OPERATIONS_H
#define MODEL_OPERATIONS_H

#include "model/CimError.h"
#include "model/Model.h"

#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace ObjectManager {

/**
 * Counts the memory that an operation takes for CMPI objects and for blocks of its providers, and may delay or refuse
 * an allocation. Only the operation's thread uses it.
 */
class MemoryMeter {
public:
    MemoryMeter() = default;
    MemoryMeter(const MemoryMeter&) = delete;
    MemoryMeter& operator=(const MemoryMeter&) = delete;
    virtual ~MemoryMeter() = default;

    /**
     * Called before the operation allocates `bytes` more. The function may wait. If it throws, no memory is allocated,
     * and the exception leaves the allocation.
     */
    virtual void take(std::size_t bytes) = 0;
    /** Called when the operation has given `bytes` back. */
    virtual void give(std::size_t bytes) noexcept = 0;
};

/** Who asks for an operation, and how the operation has to be done. */
struct Invocation {
    /** The name of the user who asks; empty if the user is not known, since clients need not log in. */
    std::string principal;
    /** The flags of the operation: CMPI_FLAG_ bits of CMPI, or-ed. */
    CMPIUint32 flags = 0;
    /** The network address of the user's client; empty if the client is this process. */
    std::string address{};
    /**
     * Counts the memory of this operation, and of the operations for which its providers ask. May be null; must outlive
     * the operation.
     */
    MemoryMeter* meter = nullptr;
};

/** The names of the properties that instances are to have; no value means all properties. */
using PropertyList = std::optional<std::vector<std::string>>;

/** The result of an extrinsic method. */
struct MethodResult {
    Value returnValue;
    std::vector<NamedValue> outArguments;
};

/**
 * The conditions that restrict a walk over associations, from the parameters of the association operations (DSP0200).
 * Names are compared with `equalNames`; an empty name is no condition.
 */
struct AssociationFilter {
    /** The class of the associations, or a superclass of it. */
    std::string associationClass;
    /** The class of the associated objects, or a superclass of it. Empty for `references` and `referenceNames`. */
    std::string resultClass;
    /** The property of the associations that refers to the source. */
    std::string role;
    /**
     * The property of the associations that refers to the associated object. Empty for `references` and
     * `referenceNames`.
     */
    std::string resultRole;
};

/** The objects that are associated with a source through the associations of one class. */
template <typename Object>
struct Associated {
    std::string associationClass;
    std::vector<Object> objects;
};

/* A sink takes the objects of an enumeration one by one, so that not all of them have to be in memory. */

using PathSink = std::function<void(ObjectPath&& path)>;
using InstanceSink = std::function<void(Instance&& instance)>;

/**
 * The CIM operations (DSP0200). Every operation throws CimError if it fails. Each path names the namespace and the
 * class that the operation is about. An operation with a sink calls it only after the provider has succeeded: if the
 * operation fails, the sink gets no object. Exceptions of a sink pass through the operation.
 */
class Operations {
public:
    Operations() = default;
    Operations(const Operations&) = delete;
    Operations& operator=(const Operations&) = delete;
    virtual ~Operations() = default;

    virtual void enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath,
                                        const PathSink& sink) = 0;
    virtual void enumerateInstances(const Invocation& invocation, const ObjectPath& classPath,
                                    const PropertyList& properties, const InstanceSink& sink) = 0;
    virtual Instance getInstance(const Invocation& invocation, const ObjectPath& path,
                                 const PropertyList& properties) = 0;
    /** @return the path of the new instance. */
    virtual ObjectPath createInstance(const Invocation& invocation, const ObjectPath& path,
                                      const Instance& instance) = 0;
    virtual void modifyInstance(const Invocation& invocation, const ObjectPath& path, const Instance& instance,
                                const PropertyList& properties) = 0;
    virtual void deleteInstance(const Invocation& invocation, const ObjectPath& path) = 0;
    virtual void execQuery(const Invocation& invocation, const ObjectPath& classPath, const std::string& query,
                           const std::string& language, const InstanceSink& sink) = 0;
    virtual MethodResult invokeMethod(const Invocation& invocation, const ObjectPath& path, const std::string& method,
                                      const std::vector<NamedValue>& arguments) = 0;

    /*
     * These operations follow the associations that refer to a source instance. The associations of one class yield no
     * object twice; an object that is associated through several association classes comes once for each of them. The
     * objects are in the order in which their association classes were registered; the objects of one association class
     * are in the order in which its provider returned them.
     */

    virtual std::vector<Associated<Instance>> associators(const Invocation& invocation, const ObjectPath& source,
                                                          const AssociationFilter& filter,
                                                          const PropertyList& properties) = 0;
    virtual std::vector<Associated<ObjectPath>> associatorNames(const Invocation& invocation, const ObjectPath& source,
                                                                const AssociationFilter& filter) = 0;
    /** @return the association instances. */
    virtual std::vector<Instance> references(const Invocation& invocation, const ObjectPath& source,
                                             const AssociationFilter& filter, const PropertyList& properties) = 0;
    virtual std::vector<ObjectPath> referenceNames(const Invocation& invocation, const ObjectPath& source,
                                                   const AssociationFilter& filter) = 0;

    /* These return the objects as a whole, instead of passing them to a sink. */

    std::vector<ObjectPath> enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath);
    std::vector<Instance> enumerateInstances(const Invocation& invocation, const ObjectPath& classPath,
                                             const PropertyList& properties);
    std::vector<Instance> execQuery(const Invocation& invocation, const ObjectPath& classPath, const std::string& query,
                                    const std::string& language);
};

} // namespace ObjectManager

#endif

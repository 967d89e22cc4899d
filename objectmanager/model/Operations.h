/** The CIM operations on values: what a client asks for, and what providers ask of the object manager in their turn. */
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

/** Is told how much memory an operation takes for what providers make. Used by the operation's thread only. */
class MemoryMeter {
public:
    MemoryMeter() = default;
    MemoryMeter(const MemoryMeter&) = delete;
    MemoryMeter& operator=(const MemoryMeter&) = delete;
    virtual ~MemoryMeter() = default;

    /** Called before so many bytes more are taken. May wait. What it throws, the allocation throws, and takes nothing.
     */
    virtual void take(std::size_t bytes) = 0;
    /** Called when so many bytes are given back. */
    virtual void give(std::size_t bytes) noexcept = 0;
};

/** On whose behalf and how an operation is done. */
struct Invocation {
    /** The authenticated user; empty where there is none. */
    std::string principal;
    /** Any of the CMPI_FLAG_ bits. */
    CMPIUint32 flags = 0;
    /** Where the user's client is; empty where it is this process. */
    std::string address{};
    /**
     * Told of the memory of this operation and of those that its providers ask for in their turn. May be null; outlives
     * the operation.
     */
    MemoryMeter* meter = nullptr;
};

/** The properties wanted of an instance; nothing means all of them. */
using PropertyList = std::optional<std::vector<std::string>>;

struct MethodResult {
    Value returnValue;
    std::vector<NamedValue> outArguments;
};

/** What a walk over associations is restricted to. Names are taken in any letter case; an empty one restricts nothing.
 */
struct AssociationFilter {
    /** The associations' class, or an ancestor of it. */
    std::string associationClass;
    /** The associated objects' class, or an ancestor of it. Not for references. */
    std::string resultClass;
    /** The associations' property that refers to the source. */
    std::string role;
    /** The associations' property that refers to the associated object. Not for references. */
    std::string resultRole;
};

/** The objects that are associated with a source through the associations of one class. */
template <typename Object>
struct Associated {
    std::string associationClass;
    std::vector<Object> objects;
};

/* Take what an enumeration gives, one after the other, so that only one is there at a time. */

using PathSink = std::function<void(ObjectPath&& path)>;
using InstanceSink = std::function<void(Instance&& instance)>;

/**
 * Every operation throws CimError where it fails. Paths name the namespace and class in which they are looked up. A
 * sink is called once the operation is known to succeed, and not at all where it fails.
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
    /** The path of the new instance. */
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
     * The walks from an instance over the associations that refer to it. No object comes twice from the associations of
     * one class; one that is reached through several classes comes once from each. The order is that in which the
     * classes were registered, then the provider's.
     */

    virtual std::vector<Associated<Instance>> associators(const Invocation& invocation, const ObjectPath& source,
                                                          const AssociationFilter& filter,
                                                          const PropertyList& properties) = 0;
    virtual std::vector<Associated<ObjectPath>> associatorNames(const Invocation& invocation, const ObjectPath& source,
                                                                const AssociationFilter& filter) = 0;
    /** The associations themselves. */
    virtual std::vector<Instance> references(const Invocation& invocation, const ObjectPath& source,
                                             const AssociationFilter& filter, const PropertyList& properties) = 0;
    virtual std::vector<ObjectPath> referenceNames(const Invocation& invocation, const ObjectPath& source,
                                                   const AssociationFilter& filter) = 0;

    /* The enumerations as a whole. */

    std::vector<ObjectPath> enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath);
    std::vector<Instance> enumerateInstances(const Invocation& invocation, const ObjectPath& classPath,
                                             const PropertyList& properties);
    std::vector<Instance> execQuery(const Invocation& invocation, const ObjectPath& classPath, const std::string& query,
                                    const std::string& language);
};

} // namespace ObjectManager

#endif

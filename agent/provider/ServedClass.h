/**
 * Implements the instance and association provider of a class whose instances are computed. Derived classes only make
 * the instances.
 *
 * Each operation either closes its result and returns CMPI_RC_OK, or leaves the result open and returns the error; no
 * exception leaves it. Clients can neither create nor modify nor delete instances.
 */
#ifndef PROVIDER_SERVEDCLASS_H
#define PROVIDER_SERVEDCLASS_H

#include "provider/Objects.h"

#include "cmpidt.h"
#include "cmpift.h"

#include <string>
#include <vector>

namespace Norv::Provider {

/** A request to the provider, and access to the object manager that made it. */
struct Request {
    const CMPIBroker* broker;
    const CMPIContext* context;
    /** The namespace of the request. */
    std::string nameSpace;

    /**
     * The paths of a class's instances in a namespace, as the object manager returns them; none if no provider serves
     * the class there.
     *
     * @throws OperationError if the object manager fails for another reason.
     */
    std::vector<Path> namesOf(const char* inNameSpace, const char* className) const;
};

class ServedClass {
public:
    /** @param name the name of the provider, as in the names of its factories. It must outlive this object. */
    explicit ServedClass(const char* name);
    ServedClass(const ServedClass&) = delete;
    ServedClass& operator=(const ServedClass&) = delete;
    virtual ~ServedClass() = default;

    /**
     * All instances in the namespace of the request. The keys of an association are its references.
     *
     * @throws OperationError, with which the operation then fails.
     */
    virtual std::vector<Instance> instances(const Request& request) const = 0;

    /** The classes that the references of an association refer to. A source of any other class has no associations. */
    virtual std::vector<const char*> ends() const { return {}; }

    /** Called with the reason when an operation fails. */
    virtual void report(const char* message) const = 0;

    /* The function tables that the factories return. They live as long as this object. The functions may be called
       again, from any thread, but not while an operation of an earlier table runs. */

    CMPIInstanceMI* instanceMI(const CMPIBroker* broker);
    CMPIAssociationMI* associationMI(const CMPIBroker* broker);

    const CMPIBroker* broker() const { return _broker; }

private:
    const CMPIBroker* _broker = nullptr;
    std::string _instanceName;
    std::string _associationName;
    CMPIInstanceMIFT _instanceTable;
    CMPIAssociationMIFT _associationTable;
    CMPIInstanceMI _instanceMI;
    CMPIAssociationMI _associationMI;
};

} // namespace Norv::Provider

#endif

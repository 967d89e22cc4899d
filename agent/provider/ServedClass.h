/**
 * A class whose instances a provider makes of what it knows, as providers of instances and of associations.
 *
 * An operation either closes its result and reports CMPI_RC_OK, or leaves it open and reports why. No exception leaves
 * it. Instances are neither made nor changed by clients.
 */
#ifndef PROVIDER_SERVEDCLASS_H
#define PROVIDER_SERVEDCLASS_H

#include "provider/Objects.h"

#include "cmpidt.h"
#include "cmpift.h"

#include <string>
#include <vector>

namespace Norv::Provider {

/** What a provider is asked, and whom it may ask in its turn. */
struct Request {
    const CMPIBroker* broker;
    const CMPIContext* context;
    /** In which the instances are served. */
    std::string nameSpace;

    /**
     * The paths of a class's instances in a namespace, as the object manager gives them; none where nobody serves the
     * class there.
     *
     * @throws OperationError where the object manager fails otherwise.
     */
    std::vector<Path> namesOf(const char* inNameSpace, const char* className) const;
};

class ServedClass {
public:
    /** @param name names the class's factories. It lives as long as this. */
    explicit ServedClass(const char* name);
    ServedClass(const ServedClass&) = delete;
    ServedClass& operator=(const ServedClass&) = delete;
    virtual ~ServedClass() = default;

    /**
     * All instances in the namespace of the request. Of an association, the keys are its references.
     *
     * @throws OperationError, which is the operation's failure.
     */
    virtual std::vector<Instance> instances(const Request& request) const = 0;

    /** The classes of which one has to be that of an association's source: others are not looked for. */
    virtual std::vector<const char*> ends() const { return {}; }

    /** Takes why an operation failed. */
    virtual void report(const char* message) const = 0;

    /* The function tables for the factories, which may be called again and from any thread, but not while an operation
       is running that came before. They live as long as this does. */

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

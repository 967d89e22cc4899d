/**
 * Makes object paths and instances of the power-managed elements.
 */
#ifndef POWERSTATEMANAGEMENTOBJFACTORY_H
#define POWERSTATEMANAGEMENTOBJFACTORY_H

#include "PowerStateManagement.h"

#include "cmpidt.h"

#include <map>
#include <string>
#include <vector>

namespace Norv::PowerStateManagementServiceProvider {

constexpr const char* powerManagementServiceClass = "TALVO_PowerManagementService";
constexpr const char* powerManagementCapabilitiesClass = "TALVO_PowerManagementCapabilities";
constexpr const char* computerSystemClass = "TALVO_ComputerSystem";
constexpr const char* associatedPowerManagementServiceClass = "TALVO_AssociatedPowerManagementService";
constexpr const char* powerManagementElementCapabilitiesClass = "TALVO_PowerManagementElementCapabilities";
constexpr const char* powerManagementHostedServiceClass = "TALVO_PowerManagementHostedService";

/**
 * The power-managed elements at the time of one request, and the CMPI objects that stand for them.
 *
 * A provider makes a factory for each request and destroys it at the end of the request: nothing is cached in between.
 *
 * The operations make their objects through `broker`, in the namespace of the request's path `ref`, with the managed
 * system's name as host. The objects belong to the object manager's request. The operations append to vectors and never
 * clear them. They pass the status, which may be null, to calls of the broker, and never write it themselves. They
 * throw only if memory is short, or if the broker or the agent throws.
 *
 * `properties` is the request's property list: an array of names that ends with a null; letter case matters. Null
 * stands for all properties. Key properties are always set.
 */
class PowerStateManagementObjFactory {
public:
    /** What an operation returns. */
    enum Result : unsigned short {
        done = 0,
        /** There is no element, or none with the key. */
        nothingFound = 1,
        pathCreationFailed = 2,
    };

    /**
     * Reads the instrumentation tree. A failure is logged, not thrown: the factory then has the elements that were read
     * before it.
     *
     * @param keyProperty the property by which the elements are ordered and looked up: "Name" or "InstanceID".
     */
    explicit PowerStateManagementObjFactory(std::string keyProperty);

    unsigned short getNumberOfInstances();

    /** A copy of the elements by key. */
    Records getPowerStateManagementMap();

    /** Appends the path of each service. Returns done, nothingFound, or pathCreationFailed after some of the paths. */
    unsigned short getAllPMCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                        std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status);

    /** Appends the path of each capabilities object; returns the same as `getAllPMCMPIObjPaths`. */
    unsigned short getAllPMCapCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                           std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status);

    /**
     * Appends the instance of each service.
     *
     * @param isObjPath true if the caller needs only the paths of the instances: without a property list, the instances
     *                  then have their keys only, and no property filter.
     * @return done or nothingFound. For an instance that cannot be made, whatever the broker returned is appended,
     * possibly null.
     */
    unsigned short getAllPMCMPIInstances(const CMPIBroker* broker, const CMPIObjectPath* ref, char const** properties,
                                         bool isObjPath, std::vector<CMPIInstance*>& instances, CMPIStatus* rc);

    /** The same as `getAllPMCMPIInstances` for capabilities objects, but returns done if there are none, too. */
    unsigned short getAllPMCapCMPIInstances(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                            char const** properties, bool isObjPath,
                                            std::vector<CMPIInstance*>& instances, CMPIStatus* rc);

    /** Appends the instance of the service whose key is `key`. Returns done or nothingFound. */
    unsigned short getOnePMCMPIInstance(const CMPIBroker* broker, const CMPIObjectPath* objectPath, CMPIString* key,
                                        char const** properties, std::vector<CMPIInstance*>& instances,
                                        CMPIStatus* status);

    /** Appends the instance of the capabilities object whose key is `key`. Returns done or nothingFound. */
    unsigned short getOnePMCapCMPIInstance(const CMPIBroker* broker, const CMPIObjectPath* ref, CMPIString* key,
                                           char const** properties, std::vector<CMPIInstance*>& instances,
                                           CMPIStatus* rc);

    /** Makes the instance of TALVO_PowerManagementService for an element; null if its path cannot be made. */
    CMPIInstance* makePMInstance(const CMPIBroker* broker, const CMPIObjectPath* ref, PowerStateManagement pm,
                                 char const** properties, bool isObjPath, CMPIStatus* rc);

    /** Makes the instance of TALVO_PowerManagementCapabilities for an element; null if its path cannot be made. */
    CMPIInstance* makePMCapInstance(const CMPIBroker* broker, const CMPIObjectPath* ref, PowerStateManagement pm,
                                    char const** properties, bool isObjPath, CMPIStatus* rc);

    /**
     * Finds the class at the far end of an association.
     *
     * Class names are compared exactly, never by inheritance.
     *
     * @param ref the source; only its class name matters.
     * @param refLeftClass the association's class; null matches no association.
     * @param refRightClass the request's result class, which is logged and has no other effect. May be null.
     * @return one of the class names above, or an empty text if the association does not link the source's class. The
     * caller must not free it.
     */
    const char* get_assoc_targetClass_Name(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                           const char* refLeftClass, const char* refRightClass, CMPIStatus* rc);

    /** Makes a path of that class, without keys; null if there is no such class or the broker cannot make the path. */
    CMPIObjectPath* get_assoc_targetClass_ObjectPath(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                                     const char* refLeftClass, const char* refRightClass,
                                                     CMPIStatus* rc);

private:
    Records _powerStateManagementMap;
};

} // namespace Norv::PowerStateManagementServiceProvider

#endif

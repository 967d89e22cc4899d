/**
 * Object paths and instances of the power-managed elements.
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
 * A provider builds one for each request and drops it when the request ends: nothing is cached in between.
 *
 * The operations make their objects through `broker`, in the namespace of the path `ref` that the request came with and
 * with the managed system's name as host. The objects belong to the object manager's request. Vectors are appended to,
 * never cleared. The status, which may be null, is handed to the broker's calls and never written here. Nothing throws
 * but for lack of memory, or where the broker or the agent does.
 *
 * `properties` is the request's property list: names ended by a null, compared with regard to letter case; null asks
 * for all properties. Key properties are always set.
 */
class PowerStateManagementObjFactory {
public:
    /** What an operation reports. */
    enum Result : unsigned short {
        done = 0,
        /** There is no element, or none under the key. */
        nothingFound = 1,
        pathCreationFailed = 2,
    };

    /**
     * Reads the instrumentation tree. A failure is logged, not thrown: then the factory has the elements that were read
     * until then.
     *
     * @param keyProperty the property that the elements are ordered by and looked up with: "Name" or "InstanceID".
     */
    explicit PowerStateManagementObjFactory(std::string keyProperty);

    unsigned short getNumberOfInstances();

    /** A copy of the elements by key. */
    Records getPowerStateManagementMap();

    /** Appends the path of each service. Returns done, nothingFound, or pathCreationFailed after some of the paths. */
    unsigned short getAllPMCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                        std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status);

    /** Appends the path of each capabilities object; as `getAllPMCMPIObjPaths`. */
    unsigned short getAllPMCapCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                           std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status);

    /**
     * Appends the instance of each service.
     *
     * @param isObjPath true where the instances are wanted for their paths: without a property list they have their
     *                  keys only, and no filter is set on them.
     * @return done, or nothingFound. An instance that cannot be made is appended as the broker returned it, perhaps
     * null.
     */
    unsigned short getAllPMCMPIInstances(const CMPIBroker* broker, const CMPIObjectPath* ref, char const** properties,
                                         bool isObjPath, std::vector<CMPIInstance*>& instances, CMPIStatus* rc);

    /** As `getAllPMCMPIInstances`, for capabilities objects; returns done where there is none, too. */
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

    /** The instance of TALVO_PowerManagementService for an element; null where its path cannot be made. */
    CMPIInstance* makePMInstance(const CMPIBroker* broker, const CMPIObjectPath* ref, PowerStateManagement pm,
                                 char const** properties, bool isObjPath, CMPIStatus* rc);

    /** The instance of TALVO_PowerManagementCapabilities for an element; null where its path cannot be made. */
    CMPIInstance* makePMCapInstance(const CMPIBroker* broker, const CMPIObjectPath* ref, PowerStateManagement pm,
                                    char const** properties, bool isObjPath, CMPIStatus* rc);

    /**
     * The class at the far end of an association.
     *
     * Class names are compared exactly, never by inheritance.
     *
     * @param ref the source, of which only the class name counts.
     * @param refLeftClass the association's class; null matches no association.
     * @param refRightClass the request's result class, which is reported but decides nothing. May be null.
     * @return one of the class names above, or an empty text where the association does not link the source's class;
     * not to be freed.
     */
    const char* get_assoc_targetClass_Name(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                           const char* refLeftClass, const char* refRightClass, CMPIStatus* rc);

    /** The path of that class, without keys; null where there is none or the broker cannot make it. */
    CMPIObjectPath* get_assoc_targetClass_ObjectPath(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                                     const char* refLeftClass, const char* refRightClass,
                                                     CMPIStatus* rc);

private:
    Records _powerStateManagementMap;
};

} // namespace Norv::PowerStateManagementServiceProvider

#endif

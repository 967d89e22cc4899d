#include "PowerStateManagementObjFactory.h"

#include "BrokerObjects.h"
#include "Operation.h"

#include "Norv/Common.h"
#include "Norv/Locale.h"

#include <utility>

namespace Norv::PowerStateManagementServiceProvider {

static const std::string loggerPowerMgmtObjFactory = "Corvane.PowerMgmtObjFactory";

namespace {

using Factory = PowerStateManagementObjFactory;

void logFailure(const char* text, const Site& site = Site::here()) {
    logMessage(loggerPowerMgmtObjFactory, failureLevel, text, site);
}

/** What is particular to object paths of TALVO_PowerManagementService. */
struct Service {
    static constexpr const char* className = powerManagementServiceClass;
    static inline const char* keys[] = {"CreationClassName", "Name", "SystemCreationClassName", "SystemName", nullptr};
    static constexpr const char* pathCreationFailed =
        "Create CMPIObjectPath                                  failed for Power Management Service.";

    /** Calls `set` with each key and its value, in order. */
    template <typename Set>
    static void setKeys(PowerStateManagement& record, Set set) {
        set(keys[0], powerManagementServiceClass);
        set(keys[1], record.getName().c_str());
        set(keys[2], computerSystemClass);
        set(keys[3], getSystemName().c_str());
    }
};

/** What is particular to object paths of TALVO_PowerManagementCapabilities. */
struct Capabilities {
    static constexpr const char* className = powerManagementCapabilitiesClass;
    static inline const char* keys[] = {"InstanceID", nullptr};
    static constexpr const char* pathCreationFailed =
        "Create CMPIObjectPath                                  failed for PowerManagement                             "
        "     Capabilities Class.";

    template <typename Set>
    static void setKeys(PowerStateManagement& record, Set set) {
        set(keys[0], record.getInstanceID().c_str());
    }
};

/** The namespace of the request's path; null if it has none. */
const char* nameSpaceOf(const CMPIObjectPath* ref, CMPIStatus* status) {
    return textOf(CMGetNameSpace(ref, status));
}

/** Appends the path of each record, in order. */
template <typename Class>
Factory::Result appendObjectPaths(const Records& records, const CMPIBroker* broker, const CMPIObjectPath* ref,
                                  std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status,
                                  const Site& site = Site::here()) {
    if (records.empty()) {
        logFailure("***No ObjPaths found***", site);
        return Factory::nothingFound;
    }
    for (const auto& [key, stored] : records) {
        PowerStateManagement record = stored;
        CMPIObjectPath* const path = newClassPath(broker, nameSpaceOf(ref, status), Class::className, status);
        if (path == nullptr) {
            logFailure(Class::pathCreationFailed, site);
            return Factory::pathCreationFailed;
        }
        Class::setKeys(record, [path](const char* name, const char* value) { addKey(path, name, value); });
        objectPaths.push_back(path);
    }
    return Factory::done;
}

/** The properties that a request asks for; letter case matters. */
class RequestedProperties {
public:
    RequestedProperties(char const** properties, bool isObjPath) : _all(properties == nullptr && !isObjPath) {
        if (properties == nullptr) {
            return;
        }
        // The index has 16 bits, so only the first 65,536 names are used.
        unsigned short i = 0;
        while (properties[i] != nullptr) {
            _names.emplace(properties[i], properties[i]);
            if (++i == 0) {
                break;
            }
        }
    }

    bool contains(const char* name) const { return _all || _names.contains(name); }

private:
    bool _all;
    std::map<std::string, std::string> _names;
};

/**
 * Makes an instance with its property filter and its keys. If the broker makes none, returns what the broker returned;
 * null if the path cannot be made.
 */
template <typename Class>
CMPIInstance* newInstance(const CMPIBroker* broker, const CMPIObjectPath* ref, PowerStateManagement& record,
                          char const** properties, bool isObjPath, CMPIStatus* rc) {
    const CMPIObjectPath* const path = newClassPath(broker, nameSpaceOf(ref, rc), Class::className, rc);
    if (path == nullptr) {
        return nullptr;
    }
    CMPIInstance* const instance = CMNewInstance(broker, path, nullptr);
    if (isNull(instance)) {
        return instance;
    }
    if (!isObjPath) {
        CMSetPropertyFilter(instance, properties, Class::keys);
    }
    Class::setKeys(record, [instance](const char* name, const char* value) { setProperty(instance, name, value); });
    return instance;
}

/** The text of a resource id in the language of the environment, in UTF-8. */
std::string localizedText(const std::wstring& id) {
    constexpr unsigned int powerManagementTexts = 2;
    const ResourceString text(Locale::getResourceLibrary(powerManagementTexts, Locale::getLanguageId()), id);
    return make_string(text);
}

/** Sets a property to an array of codes. If the array cannot be made, the property is left out. */
void setCodes(const CMPIBroker* broker, const CMPIInstance* instance, const char* property,
              const std::vector<unsigned short>& codes, const char* failed, CMPIStatus* rc, const Site& site) {
    const auto count = static_cast<unsigned short>(codes.size());
    CMPIArray* const array = CMNewArray(broker, count, CMPI_uint16, rc);
    if (array == nullptr) {
        logFailure(failed, site);
        return;
    }
    for (unsigned short i = 0; i < count; ++i) {
        CMPIValue code = {};
        code.uint16 = codes.at(i);
        CMSetArrayElementAt(array, i, &code, CMPI_uint16);
    }
    setProperty(instance, property, array);
}

/** The record with a key. If there is none, logs that and returns null. */
const PowerStateManagement* findRecord(const Records& records, const std::string& key,
                                       const Site& site = Site::here()) {
    const auto found = records.find(key);
    if (found == records.end()) {
        logFailure("_powerStateManagementMap Empty", site);
        return nullptr;
    }
    return &found->second;
}

/** A row of the table that maps the class of a source and an association class to the class at the far end. */
struct AssociationTarget {
    const char* sourceClass;
    const char* associationClass;
    const char* targetClass;
    const char* message;
};

constexpr AssociationTarget associationTargets[] = {
    {powerManagementServiceClass, associatedPowerManagementServiceClass, computerSystemClass,
     "Target Class is TALVO_ComputerSystem"},
    {computerSystemClass, associatedPowerManagementServiceClass, powerManagementServiceClass,
     "Target Class is TALVO_PowerManagementService"},
    {powerManagementServiceClass, powerManagementHostedServiceClass, computerSystemClass,
     "Target Class is TALVO_ComputerSystem"},
    {computerSystemClass, powerManagementHostedServiceClass, powerManagementServiceClass,
     "Target Class is TALVO_PowerManagementService"},
    {powerManagementServiceClass, powerManagementElementCapabilitiesClass, powerManagementCapabilitiesClass,
     "Target Class is                          TALVO_PowerManagementCapabilities"},
    {powerManagementCapabilitiesClass, powerManagementElementCapabilitiesClass, powerManagementServiceClass,
     "Target Class is TALVO_PowerManagementService"},
};

constexpr AssociationTarget noAssociationTarget = {nullptr, nullptr, "", "Target Class is empty"};

const AssociationTarget& findAssociationTarget(const char* sourceClass, const char* associationClass) {
    for (const AssociationTarget& target : associationTargets) {
        if (isText(sourceClass, target.sourceClass) && isText(associationClass, target.associationClass)) {
            return target;
        }
    }
    return noAssociationTarget;
}

std::string keyText(const CMPIString* key) {
    const char* const text = textOf(key);
    return text == nullptr ? std::string() : std::string(text);
}

} // namespace

// The interface of the factory is fixed: its operations are members that are neither const nor static.
// NOLINTBEGIN(readability-make-member-function-const, readability-convert-member-functions-to-static)

PowerStateManagementObjFactory::PowerStateManagementObjFactory(std::string keyProperty) {
    if (getPowerStateManagementInstances(_powerStateManagementMap, std::move(keyProperty)) != 0) {
        logFailure(" getPowerStateManagementInstances Failed");
    }
}

unsigned short PowerStateManagementObjFactory::getNumberOfInstances() {
    return static_cast<unsigned short>(_powerStateManagementMap.size());
}

Records PowerStateManagementObjFactory::getPowerStateManagementMap() {
    return _powerStateManagementMap;
}

unsigned short PowerStateManagementObjFactory::getAllPMCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                                                    std::vector<CMPIObjectPath*>& objectPaths,
                                                                    CMPIStatus* status) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " objectPaths=", &objectPaths,
                         " status=", status);
    call.entering();
    const Result result = appendObjectPaths<Service>(_powerStateManagementMap, broker, ref, objectPaths, status);
    if (result == done) {
        call.exiting();
    }
    return result;
}

unsigned short PowerStateManagementObjFactory::getAllPMCapCMPIObjPaths(const CMPIBroker* broker,
                                                                       const CMPIObjectPath* ref,
                                                                       std::vector<CMPIObjectPath*>& objectPaths,
                                                                       CMPIStatus* status) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " objectPaths=", &objectPaths,
                         " status=", status);
    call.entering();
    // Unlike its twin, this operation marks no exit.
    return appendObjectPaths<Capabilities>(_powerStateManagementMap, broker, ref, objectPaths, status);
}

unsigned short PowerStateManagementObjFactory::getAllPMCMPIInstances(const CMPIBroker* broker,
                                                                     const CMPIObjectPath* ref, char const** properties,
                                                                     bool isObjPath,
                                                                     std::vector<CMPIInstance*>& instances,
                                                                     CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " properties=", properties,
                         " isObjPath=", isObjPath, " instances=", &instances, " rc=", rc);
    call.entering();
    if (_powerStateManagementMap.empty()) {
        logFailure("***No instance found***");
        return nothingFound;
    }
    for (const auto& [key, record] : _powerStateManagementMap) {
        instances.push_back(makePMInstance(broker, ref, record, properties, isObjPath, rc));
    }
    // Unlike its twin, this operation marks no exit.
    return done;
}

unsigned short PowerStateManagementObjFactory::getAllPMCapCMPIInstances(const CMPIBroker* broker,
                                                                        const CMPIObjectPath* ref,
                                                                        char const** properties, bool isObjPath,
                                                                        std::vector<CMPIInstance*>& instances,
                                                                        CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " properties=", properties,
                         " isObjPath=", isObjPath, " instances=", &instances, " rc=", rc);
    call.entering();
    for (const auto& [key, record] : _powerStateManagementMap) {
        instances.push_back(makePMCapInstance(broker, ref, record, properties, isObjPath, rc));
    }
    call.exiting();
    return done;
}

unsigned short PowerStateManagementObjFactory::getOnePMCMPIInstance(const CMPIBroker* broker,
                                                                    const CMPIObjectPath* objectPath, CMPIString* key,
                                                                    char const** properties,
                                                                    std::vector<CMPIInstance*>& instances,
                                                                    CMPIStatus* status) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " objectPath=", objectPath, " key=", key,
                         " properties=", properties, " instances=", &instances, " status=", status);
    call.entering();
    const std::string name = keyText(key);
    logVariable(loggerPowerMgmtObjFactory, "name", name.c_str());
    const PowerStateManagement* const record = findRecord(_powerStateManagementMap, name);
    if (record == nullptr) {
        return nothingFound;
    }
    instances.push_back(makePMInstance(broker, objectPath, *record, properties, false, status));
    call.exiting();
    return done;
}

unsigned short PowerStateManagementObjFactory::getOnePMCapCMPIInstance(const CMPIBroker* broker,
                                                                       const CMPIObjectPath* ref, CMPIString* key,
                                                                       char const** properties,
                                                                       std::vector<CMPIInstance*>& instances,
                                                                       CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " key=", key,
                         " properties=", properties, " instances=", &instances, " rc=", rc);
    call.entering();
    const PowerStateManagement* const record = findRecord(_powerStateManagementMap, keyText(key));
    if (record == nullptr) {
        return nothingFound;
    }
    instances.push_back(makePMCapInstance(broker, ref, *record, properties, false, rc));
    call.exiting();
    return done;
}

CMPIInstance* PowerStateManagementObjFactory::makePMInstance(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                                             PowerStateManagement pm, char const** properties,
                                                             bool isObjPath, CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " pm=", &pm,
                         " isObjPath=", isObjPath, " rc=", rc);
    call.entering();
    CMPIInstance* const instance = newInstance<Service>(broker, ref, pm, properties, isObjPath, rc);
    if (!isNull(instance)) {
        const RequestedProperties requested(properties, isObjPath);
        if (requested.contains("Caption")) {
            setProperty(instance, "Caption", localizedText(L"MSGID_POWER_MANAGEMENT_CAPTION").c_str());
        }
        if (requested.contains("Description")) {
            setProperty(instance, "Description", localizedText(L"MSGID_POWER_MANAGEMENT_DESCRIPTION").c_str());
        }
        if (requested.contains("ElementName")) {
            setProperty(instance, "ElementName", pm.getElementName().c_str());
        }
    }
    call.exiting();
    return instance;
}

CMPIInstance* PowerStateManagementObjFactory::makePMCapInstance(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                                                PowerStateManagement pm, char const** properties,
                                                                bool isObjPath, CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " broker=", broker, " ref=", ref, " pm=", &pm,
                         " properties=", properties, " isObjPath=", isObjPath, " rc=", rc);
    call.entering();
    CMPIInstance* const instance = newInstance<Capabilities>(broker, ref, pm, properties, isObjPath, rc);
    if (!isNull(instance)) {
        const RequestedProperties requested(properties, isObjPath);
        if (requested.contains("PowerChangeCapabilities")) {
            setCodes(broker, instance, "PowerChangeCapabilities", pm.getPowerChangeCapabilities(),
                     "Create Array for Property                                             PowerChangeCapabilities "
                     "failed.",
                     rc, Site::here());
        }
        if (requested.contains("ElementName")) {
            setProperty(instance, "ElementName", pm.getCapabilitiesElementName().c_str());
        }
        if (requested.contains("PowerStatesSupported")) {
            setCodes(broker, instance, "PowerStatesSupported", pm.getPowerStatesSupported(),
                     "Create Array for Property                                             PowerStatesSupported "
                     "failed.",
                     rc, Site::here());
        }
    }
    call.exiting();
    return instance;
}

const char* PowerStateManagementObjFactory::get_assoc_targetClass_Name(const CMPIBroker* broker,
                                                                       const CMPIObjectPath* ref,
                                                                       const char* refLeftClass,
                                                                       const char* refRightClass, CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " _broker=", broker, " ref=", ref, " _RefLeftClass=", refLeftClass,
                         " _RefRightClass=", refRightClass, " rc=", rc);
    call.entering();
    const AssociationTarget& target = findAssociationTarget(textOf(CMGetClassName(ref, rc)), refLeftClass);
    logMessage(loggerPowerMgmtObjFactory, operationLevel, target.message);
    return target.targetClass;
}

CMPIObjectPath* PowerStateManagementObjFactory::get_assoc_targetClass_ObjectPath(const CMPIBroker* broker,
                                                                                 const CMPIObjectPath* ref,
                                                                                 const char* refLeftClass,
                                                                                 const char* refRightClass,
                                                                                 CMPIStatus* rc) {
    const CallTrace call(loggerPowerMgmtObjFactory, " _broker=", broker, " ref=", ref, " _RefLeftClass=", refLeftClass,
                         " _RefRightClass=", refRightClass, " rc=", rc);
    call.entering();
    const char* const targetName = get_assoc_targetClass_Name(broker, ref, refLeftClass, refRightClass, rc);
    logVariable(loggerPowerMgmtObjFactory, "targetName", targetName);
    CMPIObjectPath* const path =
        *targetName == '\0' ? nullptr : newClassPath(broker, nameSpaceOf(ref, rc), targetName, rc);
    call.exiting();
    return path;
}

// NOLINTEND(readability-make-member-function-const, readability-convert-member-functions-to-static)

} // namespace Norv::PowerStateManagementServiceProvider

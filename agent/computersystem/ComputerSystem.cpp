#include "ComputerSystem.h"

#include "BrokerCalls.h"

namespace Norv::ComputerSystemProvider {

namespace {

/* Values of CIM_EnabledLogicalElement and CIM_ComputerSystem. */
constexpr CMPIUint16 enabledStateEnabled = 2;
constexpr CMPIUint16 requestedStateNotApplicable = 12;
constexpr CMPIUint16 dedicatedNotDedicated = 0;

/** CIM_ComputerSystem calls the name of an Internet host "IP"; a name that was configured may be any text. */
const char* nameFormatOf(const std::string& name) {
    constexpr const char* hostNameCharacters = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-.";
    return name.find_first_not_of(hostNameCharacters) == std::string::npos ? "IP" : "Other";
}

void setProperty(const CMPIInstance* instance, const char* property, const void* value, CMPIType type) {
    require(std::string("setProperty(") + property + ')', CMSetProperty(instance, property, value, type));
}

void setText(const CMPIInstance* instance, const char* property, const std::string& text) {
    setProperty(instance, property, text.c_str(), CMPI_chars);
}

/**
 * Sets an array.
 *
 * @param elementType the type of the array's elements.
 * @param valueType the type in which `valueOf(index)`, a pointer, hands them over.
 */
template <typename ValueOf>
void setArray(const CMPIBroker* broker, const CMPIInstance* instance, const char* property, std::size_t size,
              CMPIType elementType, CMPIType valueType, ValueOf valueOf) {
    const auto count = static_cast<CMPICount>(size);
    CMPIArray* const array = requireObject(std::string("newArray for ") + property, [&](CMPIStatus* status) {
        return CMNewArray(broker, count, elementType, status);
    });
    for (CMPICount i = 0; i < count; ++i) {
        require(std::string("setElementAt(") + std::to_string(i) + ") for " + property,
                CMSetArrayElementAt(array, i, valueOf(i), valueType));
    }
    setProperty(instance, property, &array, static_cast<CMPIType>(elementType | CMPI_ARRAY));
}

/** Sets one text of each fact. */
void setTexts(const CMPIBroker* broker, const CMPIInstance* instance, const char* property,
              const std::vector<IdentifyingFact>& facts, std::string IdentifyingFact::*text) {
    setArray(broker, instance, property, facts.size(), CMPI_string, CMPI_chars,
             [&](CMPICount i) { return (facts[i].*text).c_str(); });
}

} // namespace

CMPIObjectPath* newSystemPath(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name) {
    const std::string nameSpace = requireText("getNameSpace of the request's path",
                                              [&](CMPIStatus* status) { return CMGetNameSpace(reference, status); });
    CMPIObjectPath* const path =
        requireObject("newObjectPath(" + nameSpace + ", " + computerSystemClass + ')', [&](CMPIStatus* status) {
            return CMNewObjectPath(broker, nameSpace.c_str(), computerSystemClass, status);
        });
    require("setHostname(" + name + ')', CMSetHostname(path, name.c_str()));
    require(std::string("addKey(") + creationClassNameKey + ')',
            CMAddKey(path, creationClassNameKey, computerSystemClass, CMPI_chars));
    require(std::string("addKey(") + nameKey + ')', CMAddKey(path, nameKey, name.c_str(), CMPI_chars));
    return path;
}

CMPIInstance* newSystemInstance(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name,
                                const std::vector<IdentifyingFact>& facts, const char** properties) {
    const CMPIObjectPath* const path = newSystemPath(broker, reference, name);
    CMPIInstance* const instance =
        requireObject(std::string("newInstance of ") + computerSystemClass,
                      [&](CMPIStatus* status) { return CMNewInstance(broker, path, status); });
    static const char* keys[] = {creationClassNameKey, nameKey, nullptr};
    require("setPropertyFilter", CMSetPropertyFilter(instance, properties, keys));

    setText(instance, creationClassNameKey, computerSystemClass);
    setText(instance, nameKey, name);
    setText(instance, "ElementName", name);
    setText(instance, "NameFormat", nameFormatOf(name));
    setProperty(instance, "EnabledState", &enabledStateEnabled, CMPI_uint16);
    setProperty(instance, "RequestedState", &requestedStateNotApplicable, CMPI_uint16);
    setArray(broker, instance, "Dedicated", 1, CMPI_uint16, CMPI_uint16,
             [](CMPICount) { return &dedicatedNotDedicated; });
    if (!facts.empty()) {
        setTexts(broker, instance, "OtherIdentifyingInfo", facts, &IdentifyingFact::value);
        setTexts(broker, instance, "IdentifyingDescriptions", facts, &IdentifyingFact::description);
    }
    return instance;
}

} // namespace Norv::ComputerSystemProvider

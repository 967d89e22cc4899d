#include "ComputerSystem.h"

#include "BrokerCalls.h"

namespace Norv::ComputerSystemProvider {

namespace {

/* Values of CIM_EnabledLogicalElement and CIM_ComputerSystem. */
constexpr CMPIUint16 enabledStateEnabled = 2;
constexpr CMPIUint16 requestedStateNotApplicable = 12;
constexpr CMPIUint16 dedicatedNotDedicated = 0;

/**
 * The name's format in CIM_ComputerSystem: "IP" for the name of an Internet host. A configured name may be any text.
 */
const char* nameFormatOf(const std::string& name) {
    constexpr const char* hostNameCharacters = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-.";
    return name.find_first_not_of(hostNameCharacters) == std::string::npos ? "IP" : "Other";
}

/*
 * A value is passed as a whole CMPIValue, since some brokers copy all of it; only a text is passed as a pointer to its
 * characters.
 */

/** For the type CMPI_chars, the pointer to the value is a pointer to the text. */
const CMPIValue* textValue(const char* text) {
    return reinterpret_cast<const CMPIValue*>(text);
}

CMPIValue numberValue(CMPIUint16 number) {
    CMPIValue value = {};
    value.uint16 = number;
    return value;
}

void setProperty(const CMPIInstance* instance, const char* property, const CMPIValue* value, CMPIType type) {
    require(std::string("setProperty(") + property + ')', CMSetProperty(instance, property, value, type));
}

void setText(const CMPIInstance* instance, const char* property, const std::string& text) {
    setProperty(instance, property, textValue(text.c_str()), CMPI_chars);
}

void setNumber(const CMPIInstance* instance, const char* property, CMPIUint16 number) {
    const CMPIValue value = numberValue(number);
    setProperty(instance, property, &value, CMPI_uint16);
}

/**
 * Sets a property to an array.
 *
 * @param valueOf returns the element at an index. It must have exactly the array's type: object managers do not convert
 * elements.
 */
template <typename ValueOf>
void setArray(const CMPIBroker* broker, const CMPIInstance* instance, const char* property, std::size_t size,
              CMPIType type, ValueOf valueOf) {
    const auto count = static_cast<CMPICount>(size);
    CMPIArray* const array = requireObject(std::string("newArray for ") + property,
                                           [&](CMPIStatus* status) { return CMNewArray(broker, count, type, status); });
    for (CMPICount i = 0; i < count; ++i) {
        const CMPIValue element = valueOf(i);
        require(std::string("setElementAt(") + std::to_string(i) + ") for " + property,
                CMSetArrayElementAt(array, i, &element, type));
    }
    CMPIValue value = {};
    value.array = array;
    setProperty(instance, property, &value, static_cast<CMPIType>(type | CMPI_ARRAY));
}

/** Sets a property to an array with one text of each fact. */
void setTexts(const CMPIBroker* broker, const CMPIInstance* instance, const char* property,
              const std::vector<IdentifyingFact>& facts, std::string IdentifyingFact::*text) {
    setArray(broker, instance, property, facts.size(), CMPI_string, [&](CMPICount i) {
        CMPIValue value = {};
        value.string = requireObject(std::string("newString for ") + property, [&](CMPIStatus* status) {
            return CMNewString(broker, (facts[i].*text).c_str(), status);
        });
        return value;
    });
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
            CMAddKey(path, creationClassNameKey, textValue(computerSystemClass), CMPI_chars));
    require(std::string("addKey(") + nameKey + ')', CMAddKey(path, nameKey, textValue(name.c_str()), CMPI_chars));
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
    setNumber(instance, "EnabledState", enabledStateEnabled);
    setNumber(instance, "RequestedState", requestedStateNotApplicable);
    setArray(broker, instance, "Dedicated", 1, CMPI_uint16,
             [](CMPICount) { return numberValue(dedicatedNotDedicated); });
    if (!facts.empty()) {
        setTexts(broker, instance, "OtherIdentifyingInfo", facts, &IdentifyingFact::value);
        setTexts(broker, instance, "IdentifyingDescriptions", facts, &IdentifyingFact::description);
    }
    return instance;
}

} // namespace Norv::ComputerSystemProvider

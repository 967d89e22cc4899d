#include "ComputerSystem.h"

#include "provider/Objects.h"

namespace Norv::ComputerSystemProvider {

namespace {

using Provider::Path;
using Provider::Property;

/* Values of CIM_EnabledLogicalElement and CIM_ComputerSystem. */
constexpr CMPIUint16 enabledStateEnabled = 2;
constexpr CMPIUint16 requestedStateNotApplicable = 12;
constexpr CMPIUint16 dedicatedNotDedicated = 0;

/**
 * The name's format in CIM_ComputerSystem: "IP" for the name of an Internet host. A configured name may be any text.
 */
std::string nameFormatOf(const std::string& name) {
    constexpr const char* hostNameCharacters = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-.";
    return name.find_first_not_of(hostNameCharacters) == std::string::npos ? "IP" : "Other";
}

Path pathOf(const CMPIObjectPath* reference, const std::string& name) {
    return {Provider::nameSpaceOf(reference),
            computerSystemClass,
            {{creationClassNameKey, std::string(computerSystemClass)}, {nameKey, name}},
            name};
}

/** One text of each fact. */
Property textsOf(const char* property, const std::vector<IdentifyingFact>& facts, std::string IdentifyingFact::*text) {
    std::vector<std::string> texts;
    texts.reserve(facts.size());
    for (const IdentifyingFact& fact : facts) {
        texts.push_back(fact.*text);
    }
    return {property, std::move(texts)};
}

} // namespace

CMPIObjectPath* newSystemPath(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name) {
    return Provider::newPath(broker, pathOf(reference, name));
}

CMPIInstance* newSystemInstance(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name,
                                const std::vector<IdentifyingFact>& facts, const char** properties) {
    Provider::Instance system{pathOf(reference, name),
                              {{"ElementName", name},
                               {"NameFormat", nameFormatOf(name)},
                               {"EnabledState", enabledStateEnabled},
                               {"RequestedState", requestedStateNotApplicable},
                               {"Dedicated", std::vector{dedicatedNotDedicated}}}};
    if (!facts.empty()) {
        system.properties.push_back(textsOf("OtherIdentifyingInfo", facts, &IdentifyingFact::value));
        system.properties.push_back(textsOf("IdentifyingDescriptions", facts, &IdentifyingFact::description));
    }
    return Provider::newInstance(broker, system, properties);
}

} // namespace Norv::ComputerSystemProvider

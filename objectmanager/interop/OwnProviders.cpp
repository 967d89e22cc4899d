#include "interop/OwnProviders.h"

#include "provider/ServedClass.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <functional>
#include <utility>

namespace ObjectManager::Interop {

namespace {

namespace Provider = Norv::Provider;
using Provider::Path;
using Provider::Request;

constexpr const char* managerClass = "CIM_ObjectManager";
constexpr const char* nameSpaceClass = "CIM_Namespace";
constexpr const char* mechanismClass = "CIM_CIMXMLCommunicationMechanism";

/* Values of CIM_EnabledLogicalElement. */
constexpr CMPIUint16 enabled = 2;
constexpr CMPIUint16 noStateWasAskedFor = 12;

/* Values of CIM_Namespace. */
constexpr CMPIUint16 classInfoOther = 1;
constexpr CMPIUint16 classTypeCim = 2;
constexpr const char* cimVersion = "2.41.0";

/* Values of CIM_ObjectManagerCommunicationMechanism and CIM_CIMXMLCommunicationMechanism. */
constexpr CMPIUint16 mechanismCimXml = 2;
constexpr CMPIUint16 authenticationNone = 2;
constexpr CMPIUint16 authenticationBasic = 3;
constexpr CMPIUint16 notAdvertised = 2;
constexpr CMPIUint16 cimXmlVersion1 = 1;
enum FunctionalProfile : CMPIUint16 {
    basicRead = 2,
    basicWrite = 3,
    instanceManipulation = 5,
    associationTraversal = 6,
    queryExecution = 7,
    pulledRead = 10,
    pulledQueryExecution = 12,
};

std::string ownHostName() {
    std::array<char, 256> name{};
    return gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "localhost";
}

/** The class and name of the machine: those of TALVO_ComputerSystem, if a provider serves it. */
std::pair<std::string, std::string> systemOf(const Request& request, const Facts& facts) {
    for (const std::string& nameSpace : facts.nameSpaces) {
        for (const Path& system : request.namesOf(nameSpace.c_str(), "TALVO_ComputerSystem")) {
            const auto key = [&](const char* name) {
                const auto found =
                    std::find_if(system.keys.begin(), system.keys.end(), [&](const Provider::Property& property) {
                        return Provider::isSameName(property.name, name);
                    });
                return found == system.keys.end() ? "" : std::get<std::string>(found->value);
            };
            return {key("CreationClassName"), key("Name")};
        }
    }
    return {"CIM_ComputerSystem", ownHostName()};
}

/** The path of an object that the machine hosts. */
Path hosted(const Request& request, const Facts& facts, const char* className, const std::string& name) {
    auto [systemClass, systemName] = systemOf(request, facts);
    return {request.nameSpace,
            className,
            {{"SystemCreationClassName", std::move(systemClass)},
             {"SystemName", std::move(systemName)},
             {"CreationClassName", std::string(className)},
             {"Name", name}}};
}

/** The path of the object manager. Its name contains the machine's, so that it is unique in the network. */
Path managerPath(const Request& request, const Facts& facts) {
    Path path = hosted(request, facts, managerClass, "");
    path.keys[3].value = "orvcim:" + std::get<std::string>(path.keys[1].value);
    return path;
}

std::vector<Path> nameSpacePaths(const Request& request, const Facts& facts) {
    const Path manager = managerPath(request, facts);
    std::vector<Path> paths;
    for (const std::string& name : facts.nameSpaces) {
        paths.push_back({request.nameSpace,
                         nameSpaceClass,
                         {manager.keys[0],
                          manager.keys[1],
                          {"ObjectManagerCreationClassName", manager.keys[2].value},
                          {"ObjectManagerName", manager.keys[3].value},
                          {"CreationClassName", std::string(nameSpaceClass)},
                          {"Name", name}}});
    }
    return paths;
}

std::vector<Path> mechanismPaths(const Request& request, const Facts& facts) {
    return facts.communication ? std::vector{hosted(request, facts, mechanismClass, facts.communication->url)}
                               : std::vector<Path>();
}

std::vector<Provider::Instance> managers(const Request& request, const Facts& facts) {
    return {{managerPath(request, facts),
             {{"ElementName", std::string("orvcim")},
              {"Caption", std::string("Object manager of power management")},
              {"Description", "orvcim, the object manager of power management, version " + facts.version},
              {"EnabledState", enabled},
              {"RequestedState", noStateWasAskedFor},
              {"GatherStatisticalData", false}}}};
}

std::vector<Provider::Instance> nameSpaces(const Request& request, const Facts& facts) {
    std::vector<Provider::Instance> instances;
    for (Path& path : nameSpacePaths(request, facts)) {
        std::string name = std::get<std::string>(path.keys.back().value);
        instances.push_back({std::move(path),
                             {{"ElementName", std::move(name)},
                              {"ClassInfo", classInfoOther},
                              {"DescriptionOfClassInfo", std::string("CIM ") + cimVersion},
                              {"ClassType", classTypeCim},
                              {"ClassTypeVersion", std::string(cimVersion)}}});
    }
    return instances;
}

std::vector<Provider::Instance> mechanisms(const Request& request, const Facts& facts) {
    std::vector<Provider::Instance> instances;
    for (Path& path : mechanismPaths(request, facts)) {
        const CMPIUint16 authentication = facts.communication->authenticated ? authenticationBasic : authenticationNone;
        instances.push_back(
            {std::move(path),
             {{"ElementName", facts.communication->url},
              {"EnabledState", enabled},
              {"RequestedState", noStateWasAskedFor},
              {"CommunicationMechanism", mechanismCimXml},
              {"FunctionalProfilesSupported",
               std::vector<CMPIUint16>{basicRead, basicWrite, instanceManipulation, associationTraversal,
                                       queryExecution, pulledRead, pulledQueryExecution}},
              {"MultipleOperationsSupported", false},
              {"AuthenticationMechanismsSupported", std::vector{authentication}},
              {"Version", std::string("1.0")},
              {"AdvertiseTypes", std::vector{notAdvertised}},
              {"CIMXMLProtocolVersion", cimXmlVersion1},
              {"CIMValidated", false}}});
    }
    return instances;
}

/** The associations of a class from the object manager to each of the dependents. */
template <typename Dependents>
std::vector<Provider::Instance> dependencies(const Request& request, const Facts& facts, const char* className,
                                             Dependents dependents) {
    std::vector<Provider::Instance> instances;
    for (Path& dependent : dependents(request, facts)) {
        instances.push_back({{request.nameSpace,
                              className,
                              {{"Antecedent", managerPath(request, facts)}, {"Dependent", std::move(dependent)}}},
                             {}});
    }
    return instances;
}

std::vector<Provider::Instance> nameSpacesInManager(const Request& request, const Facts& facts) {
    return dependencies(request, facts, "CIM_NamespaceInManager", nameSpacePaths);
}

std::vector<Provider::Instance> mechanismsForManager(const Request& request, const Facts& facts) {
    return dependencies(request, facts, "CIM_CommMechanismForManager", mechanismPaths);
}

/** A provider: its name, and the function that makes its instances. */
struct Row {
    const char* name;
    std::vector<Provider::Instance> (*instances)(const Request& request, const Facts& facts);
    /** If the provider serves an association, the classes that it associates. */
    std::vector<const char*> ends;
};

const std::vector<Row>& rows() {
    static const std::vector<Row> all = {
        {"ObjectManagerProvider", managers, {}},
        {"NamespaceProvider", nameSpaces, {}},
        {"NamespaceInManagerProvider", nameSpacesInManager, {managerClass, nameSpaceClass}},
        {"CommunicationMechanismProvider", mechanisms, {}},
        {"CommMechanismForManagerProvider", mechanismsForManager, {managerClass, mechanismClass}},
    };
    return all;
}

class OwnClass final : public Provider::ServedClass {
public:
    OwnClass(const Row& row, std::function<Facts()> facts)
        : ServedClass(row.name), _row(row), _facts(std::move(facts)) {}

    std::vector<Provider::Instance> instances(const Request& request) const override {
        return _row.instances(request, _facts());
    }

    std::vector<const char*> ends() const override { return _row.ends; }

    /** Does nothing: the client gets the error, and no other reader needs it. */
    void report(const char* /*message*/) const override {}

private:
    const Row& _row;
    std::function<Facts()> _facts;
};

} // namespace

OwnProviders::OwnProviders(Facts facts) : _facts(std::move(facts)) {
    for (const Row& row : rows()) {
        _providers.emplace(row.name, std::make_unique<OwnClass>(row, [this] { return this->facts(); }));
    }
}

OwnProviders::~OwnProviders() = default;

void OwnProviders::answerOn(const Communication& communication) {
    const std::lock_guard lock(_mutex);
    _facts.communication = communication;
}

Facts OwnProviders::facts() const {
    const std::lock_guard lock(_mutex);
    return _facts;
}

Norv::Provider::ServedClass* OwnProviders::find(std::string_view provider) const {
    const auto found = _providers.find(provider);
    return found == _providers.end() ? nullptr : found->second.get();
}

CMPIInstanceMI* OwnProviders::instanceProvider(std::string_view provider, const CMPIBroker* broker) {
    Norv::Provider::ServedClass* const served = find(provider);
    return served == nullptr ? nullptr : served->instanceMI(broker);
}

CMPIAssociationMI* OwnProviders::associationProvider(std::string_view provider, const CMPIBroker* broker) {
    Norv::Provider::ServedClass* const served = find(provider);
    return served == nullptr || served->ends().empty() ? nullptr : served->associationMI(broker);
}

} // namespace ObjectManager::Interop

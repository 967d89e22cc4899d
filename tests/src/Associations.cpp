#include "Associations.h"

#include <algorithm>
#include <stdexcept>

namespace OrvTest {
namespace {

const std::string noSystems = "CBEnumInstanceNames Failed for the target Class";

const OperationTexts noTarget = {
    .associatorNames = "Object Path is NULL in AssociatorNames.",
    .associators = "Object Path is NULL in Associators.",
    .referenceNames = "Object Path is NULL in ReferenceNames.",
    .references = "Object Path is NULL in References.",
};

const OperationTexts noServices = {
    .associatorNames = "***Can't get Service processor ObjectPaths.                     Exiting AssociatorNames***",
    .associators = "***Can't get Power Management Service ObjectPaths.                  Exiting Associators***",
    .referenceNames = "***Can't get Power Management Service instances                 Exiting References***",
    .references = "***Can't get Power Management Service instances                 Exiting References***",
};

} // namespace

const Association associatedService = {
    .prefix = "AssociatedPowerManagementService",
    .className = "TALVO_AssociatedPowerManagementService",
    .source = {"Corvane.AssociatedPowerMgmtProvider", "src/AssociatedPowerManagementServiceProvider.cpp"},
    .builder = "AssociatedPowerManagementServiceCMPIInstances",
    .first = {"ServiceProvided", "TALVO_PowerManagementService", &serviceClass, noServices, true},
    .second = {"UserOfService", "TALVO_ComputerSystem", nullptr, {noSystems, noSystems, noSystems, noSystems}},
    .filterKeys = "{ServiceProvided, UserOfService}",
    .names =
        {
            "***Can't get Power Management Service ObjectPaths.             Exiting EnumerateInstanceNames***",
            "CMPIObjectPath is NULL for Power Management Service",
            "Create CMPIObjectPath failed for                     TALVO_AssociatedPowerManagementService.",
        },
    .instances =
        {
            "***Can't get Power Management Service ObjectPaths.             Exiting EnumerateInstanceNames***",
            "CMPIObjectPath is NULL for Power Management Service",
            "Create CMPIObjectPath failed for                      TALVO_AssociatedPowerManagementService.",
        },
    .noTarget = noTarget,
    .hasPowerStates = true,
};

const Association elementCapabilities = {
    .prefix = "PowerManagementElementCapabilities",
    .className = "TALVO_PowerManagementElementCapabilities",
    .source = {"Corvane.PowerElementCapProvider", "src/PowerManagementElementCapabilitiesProvider.cpp"},
    .builder = "PowerManagementElementCapabilities",
    .first =
        {
            "ManagedElement",
            "TALVO_PowerManagementService",
            &serviceClass,
            {
                .associatorNames = "getAllPMCMPIObjPaths Failed For powerManagementServiceClass",
                .associators = "getAllPMCMPIInstances Failed For powerManagementServiceClass",
                .referenceNames = "getAllPMCMPIObjPaths Failed for powerManagementServiceClass",
                .references = "getAllPMCMPIInstances Failed for powerManagementServiceClass",
            },
        },
    .second =
        {
            "Capabilities",
            "TALVO_PowerManagementCapabilities",
            &capabilitiesClass,
            {
                .associatorNames = "getAllPMCMPIObjPaths Failed For powerManagementCapabilitiesClass",
                .associators = " getAllPMCapCMPIInstances Failed for powerManagementCapabilitiesClass class",
                .referenceNames = "getAllPMCapCMPIObjPaths Failed for powerManagementCapabilitiesClass",
                .references = "getAllPMCapCMPIInstances Failed for powerManagementCapabilitiesClass",
            },
        },
    .filterKeys = "{ManagedElement, Capabilities}",
    .names =
        {
            "***Can't get Power Management Service ObjectPaths.           Exiting EnumerateInstanceNames***",
            "CMPIObjectPath is NULL for Power Management Service",
            "Create CMPIObjectPath failed for                     PowerManagementElementCapabilities.",
        },
    .instances =
        {
            "***Can't get Power Management Service ObjectPaths.             Exiting EnumerateInstanceNames***",
            "CMPIObjectPath is NULL for Power Management Service",
            "Create CMPIObjectPath failed for                     PowerManagementElementCapabilities.",
        },
    .noTarget =
        {
            .associatorNames = noTarget.associatorNames,
            .associators = "Object Path is NULL in Associations.",
            .referenceNames = noTarget.referenceNames,
            .references = noTarget.references,
        },
    .referencesWantPaths = true,
};

const Association hostedService = {
    .prefix = "PowerManagementHostedService",
    .className = "TALVO_PowerManagementHostedService",
    .source = {"Corvane.PowerMgmtHostedSvcProvider", "src/PowerManagementHostedServiceProvider.cpp"},
    .builder = "PowerManagementHostedServiceCMPIInstances",
    .first = {"Antecedent",
              "TALVO_ComputerSystem",
              nullptr,
              {noSystems, noSystems, noSystems, noSystems},
              false,
              {"TALVO_ComputerSystem", "CIM_ComputerSystem"}},
    .second = {"Dependent",
               "TALVO_PowerManagementService",
               &serviceClass,
               noServices,
               true,
               {"TALVO_PowerManagementService", "CIM_PowerManagementService"}},
    .filterKeys = "{GroupComponent, PartComponent}",
    .names =
        {
            "***Can't get Power Management Service ObjectPaths.                Exiting EnumerateInstanceNames***",
            "CMPIObjectPath is NULL for Power Management Service",
            "Create CMPIObjectPath failed for                      TALVO_PowerManagementHostedService",
        },
    .instances =
        {
            "***Can't get Power Management Service ObjectPaths.                 Exiting EnumerateInstanceNames***",
            "CMPIObjectPath is NULL for Power Management service",
            "Create CMPIObjectPath failed for                      TALVO_PowerManagementHostedService.",
        },
    .noTarget = noTarget,
    .namesCloseBeforeExit = true,
};

const std::string& OperationTexts::of(const std::string& operation) const {
    if (operation == "AssociatorNames") {
        return associatorNames;
    }
    if (operation == "Associators") {
        return associators;
    }
    if (operation == "ReferenceNames") {
        return referenceNames;
    }
    if (operation == "References") {
        return references;
    }
    throw std::invalid_argument(operation + " is not an association operation");
}

const std::vector<const Association*> associations = {&associatedService, &elementCapabilities, &hostedService};

AssociationFixture::AssociationFixture(const Association& testedAssociation) : tested(testedAssociation) {
    ref = broker.path("ref", "root/cimv2", tested.className);
    for (const Association* each : associations) {
        broker.keyProperties[each->className] = {each->first.property, each->second.property};
    }
}

void AssociationFixture::haveSystems(int count) {
    for (int number = 1; number <= count; ++number) {
        const std::string name = "system" + std::to_string(number);
        CMPIObjectPath* path = broker.path(name, "root/cimv2", "TALVO_ComputerSystem", {{"Name", name}});
        systems.push_back(name);
        broker.instanceNames["TALVO_ComputerSystem"].push_back(path);
        broker.instances["TALVO_ComputerSystem"].push_back(broker.instance(name + ".instance", path));
    }
}

void AssociationFixture::haveRecords(int count) {
    const Node all[] = {{"b", 8U, {}}, {"a", 1U, {}}};
    agent.nodes.assign(std::end(all) - count, std::end(all));
    nodes = count == 1 ? Lines{"a"} : Lines{"a", "b"};
}

void AssociationFixture::comeFrom(const End& end) {
    ref = broker.path("ref", "root/cimv2", end.className, {{"Name", "source"}});
}

void AssociationFixture::askFor(const std::vector<std::pair<std::string, CMPIObjectPath*>>& keys) {
    ref = broker.path("ref", "root/cimv2", tested.className);
    for (const auto& [key, path] : keys) {
        broker.setKey(ref, key, referenceValue(path));
    }
}

CMPIStatus AssociationFixture::traverse(const std::string& operation, const char** list) {
    if (operation == "AssociatorNames") {
        return associatorNames(tested.className.c_str());
    }
    if (operation == "Associators") {
        return associators(tested.className.c_str(), nullptr, list);
    }
    return operation == "ReferenceNames" ? referenceNames() : references(list);
}

Lines AssociationFixture::calls() const {
    Lines all = transcript.calls();
    all.erase(std::remove_if(all.begin(), all.end(),
                             [](const std::string& line) { return line.find("path#1.getClassName()") == 0; }),
              all.end());
    return all;
}

Lines AssociationFixture::opening(const std::string& operation, const End& far, const char* resultClass) const {
    return lines(entry(operation), agent.nodes.empty() ? failedDiscovery() : discovery(),
                 targetFound(tested.className, resultClass, far.className));
}

std::string AssociationFixture::set(const std::string& object, const std::string& call, const std::string& name,
                                    const std::string& value) {
    return object + '.' + call + '(' + name + ", CMPI_ref, " + value + ')';
}

Lines AssociationFixture::endsSet(const std::string& instance, const End& far, const std::string& value) const {
    const bool firstIsFar = &far == &tested.first;
    return {set(instance, "setProperty", tested.first.property, firstIsFar ? value : "ref"),
            set(instance, "setProperty", tested.second.property, firstIsFar ? "ref" : value)};
}

Lines AssociationFixture::statesSet(const std::string& instance, int powerState) {
    return {instance + ".setProperty(PowerState, CMPI_uint16, " + std::to_string(powerState) + ')',
            instance + ".setProperty(RequestedPowerState, CMPI_uint16, 12)"};
}

Lines AssociationFixture::pairs(bool asNames, const std::string& filter) const {
    Lines walk;
    int paths = 0;
    int instances = 0;
    int enumerations = 0;
    const auto add = [&](const auto&... parts) { walk = lines(walk, parts...); };

    const auto link = [&](const std::string& first, const std::string& second) {
        const std::string path = numbered("path", ++paths);
        add(newPath(paths, className()), namespaceSet(path), hostSet(path));
        if (asNames) {
            add(set(path, "addKey", tested.first.property, first), set(path, "addKey", tested.second.property, second),
                "result.returnObjectPath(" + path + ')');
            return;
        }
        const std::string instance = numbered("instance", ++instances);
        add("broker.newInstance(" + path + ") -> " + instance + ", no status",
            instance + ".setPropertyFilter(" + filter + ", " + tested.filterKeys + ')',
            set(instance, "setProperty", tested.first.property, first),
            set(instance, "setProperty", tested.second.property, second),
            tested.hasPowerStates ? statesSet(instance, 2) : Lines());
    };
    const auto forEachSystem = [&](const auto& visit) {
        const std::string enumeration = numbered("enumeration", ++enumerations);
        ++paths;
        add(newPath(paths, "TALVO_ComputerSystem"),
            "broker.enumerateInstanceNames(context, " + numbered("path", paths) + ") -> " + enumeration);
        for (const std::string& system : systems) {
            add(enumeration + ".getNext() -> " + system);
            visit(system);
        }
    };
    const auto forEachElement = [&](const ElementClass& element, const auto& visit) {
        add(element.allPaths(nodes, {.paths = paths}));
        int number = paths;
        paths += static_cast<int>(nodes.size());
        for (std::size_t i = 0; i < nodes.size(); ++i) {
            const std::string path = numbered("path", ++number);
            add(namespaceSet(path));
            visit(path);
        }
    };

    if (tested.first.element == nullptr) {
        forEachSystem([&](const std::string& system) {
            forEachElement(serviceClass, [&](const std::string& service) { link(system, service); });
        });
    } else if (tested.second.element == nullptr) {
        forEachElement(serviceClass, [&](const std::string& service) {
            forEachSystem([&](const std::string& system) { link(service, system); });
        });
    } else {
        forEachElement(serviceClass, [&](const std::string& service) {
            add(discovery());
            forEachElement(capabilitiesClass, [&](const std::string& capabilities) { link(service, capabilities); });
        });
    }
    return walk;
}

void expectOk(const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(status.msg, nullptr);
}

Lines before(const Lines& all, const std::string& line, int occurrence) {
    for (auto found = all.begin(); found != all.end(); ++found) {
        if (*found == line && --occurrence == 0) {
            return {all.begin(), found};
        }
    }
    throw std::invalid_argument("there are not so many lines " + line);
}

std::string numbered(const std::string& kind, int number) {
    return kind + '#' + std::to_string(number);
}

} // namespace OrvTest

/**
 * Walks the graph of computer systems, services and capabilities as a client does: along all three associations, by
 * names and by instances, in both directions. All operations must link the same objects.
 */
#include "Associations.h"

#include "cmpimacs.h"

#include <set>

namespace OrvTest {
namespace {

using Texts = std::multiset<std::string>;

/** A path as text: its class and its keys, whatever their order; references in brackets. Hosts do not count. */
std::string textOf(const CMPIObjectPath* path) {
    std::set<std::string> keys;
    for (CMPICount i = 0; i < CMGetKeyCount(path, nullptr); ++i) {
        CMPIString* name = nullptr;
        const CMPIData key = CMGetKeyAt(path, i, &name, nullptr);
        keys.insert(std::string(CMGetCharPtr(name)) + '=' +
                    (key.type == CMPI_ref ? '[' + textOf(key.value.ref) + ']' : CMGetCharPtr(key.value.string)));
    }
    std::string text =
        std::string(CMGetCharPtr(CMGetNameSpace(path, nullptr))) + ':' + CMGetCharPtr(CMGetClassName(path, nullptr));
    for (const std::string& key : keys) {
        text += ' ' + key;
    }
    return text;
}

std::string textOf(const CMPIInstance* instance) {
    return textOf(CMGetObjectPath(instance, nullptr));
}

/** A client of the whole library. */
class Walk : public RequestFixture {
protected:
    Walk() {
        for (const Association* association : associations) {
            broker.keyProperties[association->className] = {association->first.property, association->second.property};
        }
        broker.keyProperties["TALVO_PowerManagementCapabilities"] = {"InstanceID"};
        broker.keyProperties["TALVO_PowerManagementService"] = {"CreationClassName", "Name", "SystemCreationClassName",
                                                                "SystemName"};
        agent.pathsEqual = [](const CMPIObjectPath* left, const CMPIObjectPath* right, bool) {
            return textOf(left) == textOf(right);
        };
    }

    void have(const std::vector<std::string>& nodes, const std::vector<std::string>& systems) {
        for (const std::string& node : nodes) {
            agent.nodes.push_back({node, 1U, {}});
        }
        for (const std::string& system : systems) {
            CMPIObjectPath* path = broker.path(system, "root/cimv2", "TALVO_ComputerSystem",
                                               {{"CreationClassName", "TALVO_ComputerSystem"}, {"Name", system}});
            broker.instanceNames["TALVO_ComputerSystem"].push_back(path);
            broker.instances["TALVO_ComputerSystem"].push_back(broker.instance(system + ".instance", path));
        }
    }

    struct Answer {
        CMPIStatus status;
        std::vector<const CMPIObjectPath*> paths;
        std::vector<const CMPIInstance*> instances;
        unsigned int closed;

        /** What was returned, each as the text of its path. */
        Texts texts() const {
            Texts all;
            for (const CMPIObjectPath* path : paths) {
                all.insert(textOf(path));
            }
            for (const CMPIInstance* instance : instances) {
                all.insert(textOf(instance));
            }
            return all;
        }
    };

    template <typename Ask>
    Answer ask(Ask operation) {
        CMPIResult* const result = broker.result("result");
        const CMPIStatus status = operation(result);
        EXPECT_EQ(status.rc, CMPI_RC_OK);
        const RecordingBroker::Returned& returned = broker.returned(result);
        return {status, returned.paths, returned.instances, returned.closed};
    }

    CMPIInstanceMI* instanceMI(const std::string& provider) { return library.instanceMI(provider, broker); }
    CMPIAssociationMI* associationMI(const Association& association) {
        return library.associationMI(association.provider(), broker);
    }

    /* The seven operations */

    Answer names(const std::string& provider, const std::string& className) {
        CMPIInstanceMI* mi = instanceMI(provider);
        CMPIObjectPath* path = broker.path("class", "root/cimv2", className);
        return ask([&](CMPIResult* result) { return mi->ft->enumerateInstanceNames(mi, context, result, path); });
    }
    Answer instances(const std::string& provider, const std::string& className) {
        CMPIInstanceMI* mi = instanceMI(provider);
        CMPIObjectPath* path = broker.path("class", "root/cimv2", className);
        return ask([&](CMPIResult* result) { return mi->ft->enumerateInstances(mi, context, result, path, nullptr); });
    }
    Answer instance(const std::string& provider, const CMPIObjectPath* path) {
        CMPIInstanceMI* mi = instanceMI(provider);
        return ask([&](CMPIResult* result) { return mi->ft->getInstance(mi, context, result, path, nullptr); });
    }
    Answer associatorNames(const Association& association, const CMPIObjectPath* source) {
        CMPIAssociationMI* mi = associationMI(association);
        return ask([&](CMPIResult* result) {
            return mi->ft->associatorNames(mi, context, result, source, association.className.c_str(), nullptr, nullptr,
                                           nullptr);
        });
    }
    Answer associators(const Association& association, const CMPIObjectPath* source) {
        CMPIAssociationMI* mi = associationMI(association);
        return ask([&](CMPIResult* result) {
            return mi->ft->associators(mi, context, result, source, association.className.c_str(), nullptr, nullptr,
                                       nullptr, nullptr);
        });
    }
    Answer referenceNames(const Association& association, const CMPIObjectPath* source) {
        CMPIAssociationMI* mi = associationMI(association);
        return ask(
            [&](CMPIResult* result) { return mi->ft->referenceNames(mi, context, result, source, nullptr, nullptr); });
    }
    Answer references(const Association& association, const CMPIObjectPath* source) {
        CMPIAssociationMI* mi = associationMI(association);
        return ask([&](CMPIResult* result) {
            return mi->ft->references(mi, context, result, source, nullptr, nullptr, nullptr);
        });
    }

    /** The objects at one end, as their own class enumerates them. */
    std::vector<const CMPIObjectPath*> objectsAt(const End& end) {
        if (end.element != nullptr) {
            return names(end.element->provider(), end.className).paths;
        }
        const std::vector<CMPIObjectPath*>& systems = broker.instanceNames[end.className];
        return {systems.begin(), systems.end()};
    }

    /** The association between two objects as the text of its path. */
    static std::string linked(const Association& association, const CMPIObjectPath* first,
                              const CMPIObjectPath* second) {
        const std::set<std::string> keys = {association.first.property + "=[" + textOf(first) + ']',
                                            association.second.property + "=[" + textOf(second) + ']'};
        return "root/cimv2:" + association.className + ' ' + *keys.begin() + ' ' + *keys.rbegin();
    }

    /** What a reference refers to at one end. */
    static const CMPIObjectPath* referred(const CMPIInstance* reference, const End& end) {
        return CMGetProperty(reference, end.property.c_str(), nullptr).value.ref;
    }

    ProviderLibrary library;
    CMPIContext* context = broker.context("context");
};

struct Machine {
    std::string name;
    std::vector<std::string> nodes;
    std::vector<std::string> systems;
};

void PrintTo(const Machine& machine, std::ostream* out) {
    *out << machine.nodes.size() << " nodes, " << machine.systems.size() << " systems";
}

class MachineWalk : public Walk, public testing::WithParamInterface<Machine> {
protected:
    MachineWalk() { have(GetParam().nodes, GetParam().systems); }
};

INSTANTIATE_TEST_SUITE_P(Machines, MachineWalk,
                         testing::Values(Machine{"OneOfEach", {"rack"}, {"host"}},
                                         Machine{"TwoServices", {"rack/1", "rack/2"}, {"host"}},
                                         Machine{"TwoSystems", {"rack"}, {"alpha", "beta"}},
                                         Machine{"Several", {"c", "a", "b"}, {"alpha", "beta"}},
                                         Machine{"NoSystem", {"a", "b"}, {}},
                                         Machine{"EqualPaths", {"a", "b", "a"}, {"host"}}),
                         [](const auto& tested) { return tested.param.name; });

TEST_P(MachineWalk, AllSevenOperationsSayTheSameAboutEveryPair) {
    for (const Association* association : associations) {
        SCOPED_TRACE(association->className);
        const std::vector<const CMPIObjectPath*> firsts = objectsAt(association->first);
        const std::vector<const CMPIObjectPath*> seconds = objectsAt(association->second);
        Texts pairs;
        for (const CMPIObjectPath* first : firsts) {
            for (const CMPIObjectPath* second : seconds) {
                pairs.insert(linked(*association, first, second));
            }
        }
        const Answer named = names(association->provider(), association->className);
        EXPECT_EQ(named.texts(), pairs);
        EXPECT_EQ(named.closed, 1);
        const Answer enumerated = instances(association->provider(), association->className);
        EXPECT_EQ(enumerated.texts(), pairs);
        EXPECT_EQ(enumerated.closed, 1);

        for (const CMPIObjectPath* path : named.paths) {
            const Answer got = instance(association->provider(), path);
            EXPECT_EQ(got.texts(), Texts{textOf(path)});
            EXPECT_EQ(got.closed, 1);
        }

        for (const bool fromFirst : {true, false}) {
            const End& near = fromFirst ? association->first : association->second;
            const End& far = fromFirst ? association->second : association->first;
            Texts byReferenceNames;
            Texts byReferences;
            for (const CMPIObjectPath* source : fromFirst ? firsts : seconds) {
                Texts farTexts;
                for (const CMPIObjectPath* object : fromFirst ? seconds : firsts) {
                    farTexts.insert(textOf(object));
                }
                EXPECT_EQ(associatorNames(*association, source).texts(), farTexts);
                EXPECT_EQ(associators(*association, source).texts(), farTexts);
                byReferenceNames.merge(referenceNames(*association, source).texts());
                const Answer references = this->references(*association, source);
                byReferences.merge(references.texts());
                Texts referredFar;
                for (const CMPIInstance* reference : references.instances) {
                    EXPECT_EQ(textOf(referred(reference, near)), textOf(source));
                    referredFar.insert(textOf(referred(reference, far)));
                }
                EXPECT_EQ(referredFar, farTexts);
            }
            EXPECT_EQ(byReferenceNames, pairs);
            EXPECT_EQ(byReferences, pairs);
        }
    }
}

TEST_P(MachineWalk, AssociationOperationsLeaveTheirResultsOpen) {
    for (const Association* association : associations) {
        for (const End* end : {&association->first, &association->second}) {
            for (const CMPIObjectPath* source : objectsAt(*end)) {
                EXPECT_EQ(associatorNames(*association, source).closed, 0);
                EXPECT_EQ(associators(*association, source).closed, 0);
                EXPECT_EQ(referenceNames(*association, source).closed, 0);
                EXPECT_EQ(references(*association, source).closed, 0);
            }
        }
    }
}

TEST_P(MachineWalk, ReferencesCarryWhatGetInstanceSays) {
    for (const Association* association : associations) {
        for (const End* end : {&association->first, &association->second}) {
            for (const CMPIObjectPath* source : objectsAt(*end)) {
                for (const CMPIInstance* reference : references(*association, source).instances) {
                    const Answer got = instance(association->provider(), CMGetObjectPath(reference, nullptr));
                    ASSERT_EQ(got.instances.size(), 1);
                    for (const char* state : {"PowerState", "RequestedPowerState"}) {
                        const CMPIData expected = CMGetProperty(got.instances[0], state, nullptr);
                        const CMPIData actual = CMGetProperty(reference, state, nullptr);
                        EXPECT_EQ(actual.state, expected.state) << state;
                        EXPECT_EQ(actual.value.uint16, expected.value.uint16) << state;
                        EXPECT_EQ(actual.type == CMPI_uint16, association->hasPowerStates) << state;
                    }
                }
            }
        }
    }
}

TEST_P(MachineWalk, FromTheComputerSystemToTheCapabilitiesAndBack) {
    const Texts systems = [&] {
        Texts all;
        for (const CMPIObjectPath* path : broker.instanceNames["TALVO_ComputerSystem"]) {
            all.insert(textOf(path));
        }
        return all;
    }();
    for (const Association* toService : {&associatedService, &hostedService}) {
        for (const CMPIObjectPath* system : broker.instanceNames["TALVO_ComputerSystem"]) {
            const Answer services = associatorNames(*toService, system);
            ASSERT_FALSE(services.paths.empty());
            for (const CMPIObjectPath* service : services.paths) {
                EXPECT_EQ(instance("PowerManagementServiceProvider", service).texts(), Texts{textOf(service)});
                const Answer capabilities = associatorNames(elementCapabilities, service);
                EXPECT_EQ(capabilities.paths.size(), services.paths.size());
                for (const CMPIObjectPath* each : capabilities.paths) {
                    EXPECT_EQ(instance("PowerManagementCapabilitiesProvider", each).texts(), Texts{textOf(each)});
                    EXPECT_EQ(associatorNames(elementCapabilities, each).texts(), services.texts());
                }
                EXPECT_EQ(associatorNames(*toService, service).texts(), systems);
            }
        }
    }
}

TEST_P(MachineWalk, TheSameByInstances) {
    for (const Association* toService : {&associatedService, &hostedService}) {
        for (const CMPIObjectPath* system : broker.instanceNames["TALVO_ComputerSystem"]) {
            for (const CMPIInstance* service : associators(*toService, system).instances) {
                const CMPIObjectPath* servicePath = CMGetObjectPath(service, nullptr);
                for (const CMPIInstance* capabilities : associators(elementCapabilities, servicePath).instances) {
                    const Answer back = associators(elementCapabilities, CMGetObjectPath(capabilities, nullptr));
                    EXPECT_EQ(back.texts().count(textOf(service)), 1);
                }
                EXPECT_EQ(associators(*toService, servicePath).texts().count(textOf(system)), 1);
            }
        }
    }
}

TEST_F(Walk, AMachineWithoutNodesHasNothingToWalkTo) {
    have({}, {"host"});
    const CMPIObjectPath* system = broker.instanceNames["TALVO_ComputerSystem"][0];
    for (const Association* association : associations) {
        EXPECT_TRUE(names(association->provider(), association->className).paths.empty());
        const Answer enumerated = instances(association->provider(), association->className);
        EXPECT_TRUE(enumerated.instances.empty());
        EXPECT_EQ(enumerated.closed, 1);
        EXPECT_TRUE(associatorNames(*association, system).paths.empty());
        EXPECT_TRUE(associators(*association, system).instances.empty());
        EXPECT_TRUE(referenceNames(*association, system).paths.empty());
        EXPECT_TRUE(references(*association, system).instances.empty());
    }
}

} // namespace
} // namespace OrvTest

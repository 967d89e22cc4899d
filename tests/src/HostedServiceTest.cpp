/**
 * What is particular to TALVO_PowerManagementHostedService: the result class of associators, and the properties that a
 * property list leaves out.
 */
#include "Associations.h"

namespace OrvTest {
namespace {

class HostedService : public AssociationFixture {
protected:
    HostedService() : AssociationFixture(hostedService) {
        haveRecords();
        haveSystems(2);
    }

    static bool has(const CMPIInstance* instance, const std::string& property) {
        return (instance->ft->getProperty(instance, property.c_str(), nullptr).state & CMPI_notFound) == 0;
    }
};

/** A result class, and whether it names computer systems or services. */
struct ResultClass {
    const char* name;
    bool systems;
    bool services;
};

void PrintTo(const ResultClass& resultClass, std::ostream* out) {
    *out << (resultClass.name == nullptr ? "none" : resultClass.name);
}

class HostedServiceResults : public HostedService, public testing::WithParamInterface<ResultClass> {
protected:
    /** Asks from the other end of `far` and says how many were returned, each with both operations. */
    void expectResults(const End& far, bool wanted) {
        for (const std::string operation : {"AssociatorNames", "Associators"}) {
            SCOPED_TRACE(operation + " to " + far.className);
            transcript.clear();
            comeFrom(otherEnd(far));
            const std::size_t count = returned.paths.size() + returned.instances.size();
            expectOk(operation == "AssociatorNames" ? associatorNames(className().c_str(), GetParam().name)
                                                    : associators(className().c_str(), GetParam().name));
            EXPECT_EQ(returned.paths.size() + returned.instances.size(), count + (wanted ? 2 : 0));
            if (wanted) {
                EXPECT_THAT(calls(), testing::IsSupersetOf(opening(operation, far, GetParam().name)));
                EXPECT_THAT(calls(), testing::IsSupersetOf(exit(operation)));
            } else {
                EXPECT_TRUE(sameLines(opening(operation, far, GetParam().name), calls()));
            }
        }
        EXPECT_EQ(returned.closed, 0);
    }
};

INSTANTIATE_TEST_SUITE_P(
    Classes, HostedServiceResults,
    testing::Values(ResultClass{nullptr, true, true}, ResultClass{"TALVO_ComputerSystem", true, false},
                    ResultClass{"CIM_ComputerSystem", true, false}, ResultClass{"talvo_computersystem", true, false},
                    ResultClass{"CIM_COMPUTERSYSTEM", true, false}, ResultClass{"cim_ComputerSystem", true, false},
                    ResultClass{"TALVO_PowerManagementService", false, true},
                    ResultClass{"CIM_PowerManagementService", false, true},
                    ResultClass{"TALVO_POWERMANAGEMENTSERVICE", false, true},
                    ResultClass{"cim_powermanagementservice", false, true}, ResultClass{"", false, false},
                    ResultClass{"CIM_System", false, false}, ResultClass{"CIM_ManagedElement", false, false},
                    ResultClass{"TALVO_PowerManagementCapabilities", false, false},
                    ResultClass{"TALVO_PowerManagementHostedService", false, false},
                    ResultClass{"CIM_ComputerSystem ", false, false}, ResultClass{"CIM_Computer", false, false}));

TEST_P(HostedServiceResults, AreTheComputerSystemsWhereItNamesThem) {
    expectResults(tested.first, GetParam().systems);
}

TEST_P(HostedServiceResults, AreTheServicesWhereItNamesThem) {
    expectResults(tested.second, GetParam().services);
}

TEST_F(HostedService, ReferencesHaveNoResultClass) {
    comeFrom(tested.second);
    expectOk(association->ft->referenceNames(association, context, result, ref, "CIM_Other", nullptr));
    expectOk(association->ft->references(association, context, result, ref, "CIM_Other", nullptr, nullptr));
    EXPECT_EQ(returned.paths.size(), 2);
    EXPECT_EQ(returned.instances.size(), 2);
}

TEST_F(HostedService, APropertyListTakesAwayTheEndsThatItDoesNotName) {
    for (const End* end : {&tested.first, &tested.second}) {
        const char* list[] = {end->property.c_str(), nullptr};
        expectOk(enumInstances(list));
        ASSERT_FALSE(returned.instances.empty());
        EXPECT_TRUE(has(returned.instances.back(), end->property));
        EXPECT_FALSE(has(returned.instances.back(), otherEnd(*end).property));
    }
    expectOk(enumInstances(properties));
    EXPECT_FALSE(has(returned.instances.back(), "Antecedent"));
    EXPECT_FALSE(has(returned.instances.back(), "Dependent"));
}

TEST_F(HostedService, TheServicesOfOneComputerSystemComeTogether) {
    expectOk(enumInstances());
    Lines linked;
    for (const CMPIInstance* instance : returned.instances) {
        const auto end = [&](const End& each) {
            const CMPIData data = instance->ft->getProperty(instance, each.property.c_str(), nullptr);
            return transcript.nameOf(data.value.ref);
        };
        linked.push_back(end(tested.first) + ' ' + end(tested.second));
    }
    EXPECT_THAT(linked, testing::ElementsAre("system1 path#2", "system1 path#3", "system2 path#6", "system2 path#7"));
}

TEST_F(HostedService, WithoutComputerSystemsNobodyMissesTheServices) {
    agent.nodes.clear();
    systems.clear();
    broker.instanceNames.clear();
    expectOk(enumInstanceNames());
    EXPECT_CALLS(entry("EnumInstanceNames"), failedDiscovery(), pairs(true), "result.returnDone()",
                 exit("EnumInstanceNames"));
    transcript.clear();
    expectOk(enumInstances());
    EXPECT_CALLS(entry("EnumInstances"), failedDiscovery(), builderEntry(), failedDiscovery(), pairs(false),
                 builderExit(), "result.returnDone()", exit("EnumInstances"));
}

TEST_F(HostedService, ReferencesOfAServiceDoNotNeedARecord) {
    agent.nodes.clear();
    comeFrom(tested.second);
    expectOk(references());
    EXPECT_EQ(returned.instances.size(), 2);
    EXPECT_THAT(calls(), testing::Each(testing::Not(testing::HasSubstr("PowerState,"))));
}

} // namespace
} // namespace OrvTest

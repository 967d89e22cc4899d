/**
 * What is particular to TALVO_AssociatedPowerManagementService: the power states, and the nodes from which they come.
 */
#include "Associations.h"

#include "cmpimacs.h"

namespace OrvTest {
namespace {

class AssociatedPowerManagementService : public AssociationFixture {
protected:
    AssociatedPowerManagementService() : AssociationFixture(associatedService) {}

    /** Nodes in the order of the tree, which is not that of their keys, with the values read as their states. */
    void haveStates(const std::vector<std::pair<std::string, std::optional<unsigned int>>>& states) {
        agent.nodes.clear();
        for (const auto& [path, state] : states) {
            agent.nodes.push_back({path, state, {}});
        }
    }

    /** The power state and the requested one of each instance returned since the last time. */
    std::vector<std::pair<int, int>> statesReturned() {
        std::vector<std::pair<int, int>> states;
        for (; _seen < returned.instances.size(); ++_seen) {
            const CMPIInstance* instance = returned.instances[_seen];
            const CMPIData current = CMGetProperty(instance, "PowerState", nullptr);
            const CMPIData requested = CMGetProperty(instance, "RequestedPowerState", nullptr);
            EXPECT_EQ(current.type, CMPI_uint16);
            EXPECT_EQ(requested.type, CMPI_uint16);
            states.emplace_back(current.value.uint16, requested.value.uint16);
        }
        return states;
    }

private:
    std::size_t _seen = 0;
};

using States = std::vector<std::pair<int, int>>;

TEST_F(AssociatedPowerManagementService, InstancesHaveTheStatesOfTheFirstRecord) {
    haveSystems(2);
    haveStates({{"c", 10U}, {"a", 8U}, {"b", 1U}});
    expectOk(enumInstances());
    EXPECT_EQ(statesReturned(), States(6, {7, 12}));
}

TEST_F(AssociatedPowerManagementService, ReferencesOfAComputerSystemHaveTheStatesOfTheFirstRecord) {
    haveStates({{"c", 10U}, {"a", 8U}, {"b", 1U}});
    comeFrom(tested.second);
    expectOk(references());
    EXPECT_EQ(statesReturned(), States(3, {7, 12}));
}

TEST_F(AssociatedPowerManagementService, ReferencesOfAServiceHaveTheStatesOfTheLastRecord) {
    haveSystems(2);
    haveStates({{"c", 10U}, {"a", 8U}, {"b", 1U}});
    comeFrom(tested.first);
    expectOk(references());
    EXPECT_EQ(statesReturned(), States(2, {12, 12}));
}

TEST_F(AssociatedPowerManagementService, ReferencesOfAServiceAreSetOncePerRecord) {
    haveSystems(1);
    haveStates({{"c", 10U}, {"a", 8U}, {"b", 1U}});
    comeFrom(tested.first);
    expectOk(references());
    Lines written;
    for (const int state : {7, 2, 12}) {
        written = lines(written, endsSet("instance#1", tested.second, "system1"), statesSet("instance#1", state));
    }
    EXPECT_TRUE(sameLines(lines(opening("References", tested.second), newPath(2, className()),
                                "broker.enumerateInstanceNames(context, path#1) -> enumeration#1",
                                "enumeration#1.getNext() -> system1", "broker.newInstance(path#2) -> instance#1",
                                written, "result.returnInstance(instance#1)", exit("References")),
                          calls()));
}

TEST_F(AssociatedPowerManagementService, WithOneRecordAllAgreeOnItsStates) {
    haveSystems(1);
    for (const auto& [read, state] : std::vector<std::pair<unsigned int, int>>{{1, 2}, {8, 7}, {10, 12}, {9, 1}}) {
        haveStates({{"a", read}});
        expectOk(enumInstances());
        comeFrom(tested.first);
        expectOk(references());
        comeFrom(tested.second);
        expectOk(references());
        EXPECT_EQ(statesReturned(), States(3, {state, 12})) << read;
    }
}

TEST_F(AssociatedPowerManagementService, WithoutAStateInTheTreeItIsZero) {
    haveSystems(1);
    haveStates({{"a", {}}});
    expectOk(enumInstances());
    EXPECT_EQ(statesReturned(), States(1, {0, 12}));
}

TEST_F(AssociatedPowerManagementService, WithoutRecordsAServiceHasNoReferences) {
    haveSystems(2);
    comeFrom(tested.first);
    expectOk(references());
    EXPECT_TRUE(sameLines(lines(opening("References", tested.second), newPath(2, className()),
                                "broker.enumerateInstanceNames(context, path#1) -> enumeration#1",
                                "enumeration#1.getNext() -> system1", "broker.newInstance(path#2) -> instance#1",
                                "enumeration#1.getNext() -> system2", "broker.newInstance(path#2) -> instance#2",
                                exit("References")),
                          calls()));
    EXPECT_TRUE(returned.instances.empty());
}

TEST_F(AssociatedPowerManagementService, WithoutRecordsAServiceStillHasReferenceNames) {
    haveSystems(2);
    comeFrom(tested.first);
    expectOk(referenceNames());
    EXPECT_EQ(returned.paths.size(), 2);
}

TEST_F(AssociatedPowerManagementService, PropertyListsFilterTheStatesButNotTheEnds) {
    haveSystems(1);
    haveStates({{"a", 1U}});
    const char* list[] = {"PowerState", nullptr};
    expectOk(enumInstances(list));
    ASSERT_EQ(returned.instances.size(), 1);
    const CMPIInstance* instance = returned.instances[0];
    for (const char* property : {"ServiceProvided", "UserOfService", "PowerState"}) {
        EXPECT_EQ(CMGetProperty(instance, property, nullptr).state & CMPI_notFound, 0) << property;
    }
    EXPECT_NE(CMGetProperty(instance, "RequestedPowerState", nullptr).state & CMPI_notFound, 0);
}

TEST_F(AssociatedPowerManagementService, ResultClassesDoNotFilter) {
    haveSystems(2);
    haveStates({{"a", 1U}});
    for (const char* resultClass : {"TALVO_PowerManagementService", "TALVO_ComputerSystem", "no class", ""}) {
        for (const End* end : {&tested.first, &tested.second}) {
            transcript.clear();
            comeFrom(*end);
            expectOk(associatorNames(className().c_str(), resultClass));
            expectOk(associators(className().c_str(), resultClass));
            EXPECT_THAT(calls(), testing::IsSupersetOf(exit("AssociatorNames"))) << resultClass;
            EXPECT_THAT(calls(), testing::IsSupersetOf(opening("Associators", otherEnd(*end), resultClass)));
        }
    }
    EXPECT_EQ(returned.paths.size(), 4 * (1 + 2));
    EXPECT_EQ(returned.instances.size(), 4 * (1 + 2));
}

} // namespace
} // namespace OrvTest

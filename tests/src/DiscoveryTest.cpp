#include "PowerStateManagement.h"

#include "Expected.h"
#include "RequestFixture.h"
#include "StandardError.h"

#include <stdexcept>

namespace OrvTest {
namespace {

using Norv::PowerStateManagementServiceProvider::getPowerStateManagementInstances;
using Norv::PowerStateManagementServiceProvider::PowerStateManagement;
using testing::ElementsAre;
using testing::Pair;

class Discovery : public RequestFixture {
protected:
    unsigned short discover(const std::string& keyProperty = "Name") {
        return getPowerStateManagementInstances(records, keyProperty);
    }

    Lines keys() const {
        Lines result;
        for (const auto& [key, record] : records) {
            result.push_back(key);
        }
        return result;
    }

    std::map<std::string, PowerStateManagement> records;
};

TEST_F(Discovery, ReadsEveryNodeInTheOrderOfTheTree) {
    agent.nodes = {{"rack/b", 1, std::vector<unsigned int>{1, 9, 12}}, {"rack/a", 10, {}}};
    EXPECT_EQ(discover(), 0);
    EXPECT_CALLS(
        "Instrumentation()", "instrumentation.selectNode(40) -> true", "instrumentation.getPathToNode() -> \"node/0\"",
        "instrumentation.convertPathToString(\"node/0\") -> \"rack/b\"",
        "instrumentation.getProperty(125, []) -> true, [1, 9, 12]", "instrumentation.getProperty(123, 0) -> true, 1",
        "++instrumentation", "instrumentation.getPathToNode() -> \"node/1\"",
        "instrumentation.convertPathToString(\"node/1\") -> \"rack/a\"",
        "instrumentation.getProperty(125, [1, 9, 12]) -> false", "instrumentation.getProperty(123, 1) -> true, 10",
        "++instrumentation", "~Instrumentation()");
}

TEST_F(Discovery, FillsARecordFromANode) {
    agent.nodes = {{"rack/a", 8, std::vector<unsigned int>{1, 9, 12}}};
    EXPECT_EQ(discover(), 0);
    ASSERT_EQ(keys(), Lines{"PowerStateManagement_rack/a"});
    PowerStateManagement& record = records.begin()->second;
    EXPECT_EQ(record.getInstanceID(), "rack/a");
    EXPECT_EQ(record.getName(), "PowerStateManagement_rack/a");
    EXPECT_EQ(record.getElementName(), "PowerStateManagement_rack/a");
    EXPECT_EQ(record.getCapabilitiesElementName(), "PowerStateManagementCapabilities_rack/a");
    EXPECT_EQ(record.getPowerState(), 7);
    EXPECT_THAT(record.getPowerStatesSupported(), ElementsAre(2, 5, 8));
    EXPECT_THAT(record.getPowerChangeCapabilities(), ElementsAre(3, 4, 8));
}

TEST_F(Discovery, KeysTheRecordsByName) {
    haveNodes({"b", "a"});
    for (const char* keyProperty : {"Name", ""}) {
        records.clear();
        EXPECT_EQ(discover(keyProperty), 0);
        EXPECT_EQ(keys(), (Lines{"PowerStateManagement_a", "PowerStateManagement_b"})) << keyProperty;
    }
}

TEST_F(Discovery, KeysTheRecordsByInstanceID) {
    haveNodes({"b", "a", "B"});
    EXPECT_EQ(discover("InstanceID"), 0);
    EXPECT_EQ(keys(), (Lines{"B", "a", "b"}));
    EXPECT_EQ(records["b"].getName(), "PowerStateManagement_b");
}

TEST_F(Discovery, StoresNothingUnderAnyOtherKey) {
    haveNodes({"a"});
    for (const char* keyProperty : {"name", "NAME", "ElementName", "instanceid", "InstanceId", "Name ", " "}) {
        EXPECT_EQ(discover(keyProperty), 0) << keyProperty;
        EXPECT_EQ(keys(), Lines()) << keyProperty;
    }
}

TEST_F(Discovery, WalksTheWholeTreeEvenWhereItStoresNothing) {
    haveNodes({"a", "b"});
    EXPECT_EQ(discover("ElementName"), 0);
    EXPECT_CALLS(discovery());
}

TEST_F(Discovery, TheLaterOfTwoNodesWithTheSamePathStays) {
    agent.nodes = {{"a", 1, {}}, {"a", 10, {}}};
    EXPECT_EQ(discover(), 0);
    ASSERT_EQ(keys(), Lines{"PowerStateManagement_a"});
    EXPECT_EQ(records.begin()->second.getPowerState(), 12);
}

TEST_F(Discovery, AddsToWhatTheMapHolds) {
    records["kept"].setName("kept");
    haveNodes({"a"});
    EXPECT_EQ(discover(), 0);
    EXPECT_EQ(keys(), (Lines{"PowerStateManagement_a", "kept"}));
    EXPECT_EQ(records["kept"].getName(), "kept");
}

TEST_F(Discovery, ANodeWithoutPowerStateDoesNotTakeThatOfTheNodeBefore) {
    agent.nodes = {{"a", 1, {}}, {"b", {}, {}}, {"c", 8, {}}};
    EXPECT_EQ(discover("InstanceID"), 0);
    EXPECT_EQ(records["a"].getPowerState(), 2);
    EXPECT_EQ(records["b"].getPowerState(), 0);
    EXPECT_EQ(records["c"].getPowerState(), 7);
}

TEST_F(Discovery, TheNumberIsKeptFromNodeToNode) {
    agent.nodes = {{"a", 1, {}}, {"b", {}, {}}, {"c", 8, {}}};
    EXPECT_EQ(discover(), 0);
    Lines reads;
    for (const std::string& line : transcript.calls()) {
        if (line.find("getProperty(123") != std::string::npos) {
            reads.push_back(line);
        }
    }
    EXPECT_EQ(reads,
              (Lines{"instrumentation.getProperty(123, 0) -> true, 1", "instrumentation.getProperty(123, 1) -> false",
                     "instrumentation.getProperty(123, 1) -> true, 8"}));
}

TEST_F(Discovery, ATreeWithoutNodesIsReportedAndNothingElse) {
    records["kept"];
    const StandardError standardError;
    EXPECT_EQ(discover(), 1);
    EXPECT_EQ(standardError.text(), "");
    EXPECT_EQ(keys(), Lines{"kept"});
    EXPECT_CALLS("Instrumentation()", "instrumentation.selectNode(40) -> false", "~Instrumentation()");
}

TEST_F(Discovery, ANodeWithoutPathEndsTheWalk) {
    haveNodes({"a", "", "c"});
    const StandardError standardError;
    EXPECT_EQ(discover(), 1);
    EXPECT_EQ(standardError.text(), "Failed while setting InstanceID.\n");
    EXPECT_EQ(keys(), Lines{"PowerStateManagement_a"});
    EXPECT_CALLS("Instrumentation()", "instrumentation.selectNode(40) -> true",
                 "instrumentation.getPathToNode() -> \"node/0\"",
                 "instrumentation.convertPathToString(\"node/0\") -> \"a\"",
                 "instrumentation.getProperty(125, []) -> false", "instrumentation.getProperty(123, 0) -> false",
                 "++instrumentation", "instrumentation.getPathToNode() -> \"node/1\"",
                 "instrumentation.convertPathToString(\"node/1\") -> \"\"", "~Instrumentation()");
}

class DiscoveryExceptions : public Discovery, public testing::WithParamInterface<const char*> {};

TEST_P(DiscoveryExceptions, AStandardExceptionIsPrintedAndReported) {
    haveNodes({"a"});
    agent.faults.at(GetParam(), 1, throws(std::runtime_error("the tree is gone")));
    const StandardError standardError;
    EXPECT_EQ(discover(), 1);
    EXPECT_EQ(standardError.text(), "the tree is gone\n");
    EXPECT_EQ(agent.instrumentations, 0);
}

TEST_P(DiscoveryExceptions, AnyOtherExceptionPasses) {
    haveNodes({"a"});
    agent.faults.at(GetParam(), 1, throws(42));
    const StandardError standardError;
    EXPECT_THROW(discover(), int);
    EXPECT_EQ(standardError.text(), "");
    EXPECT_EQ(agent.instrumentations, 0);
}

INSTANTIATE_TEST_SUITE_P(Discovery, DiscoveryExceptions,
                         testing::Values("Instrumentation", "selectNode", "bool", "getPathToNode",
                                         "convertPathToString", "getProperty", "++"));

TEST_F(Discovery, RecordsReadBeforeAnExceptionStay) {
    haveNodes({"a", "b", "c"});
    agent.faults.at("getPathToNode", 2, throws(std::bad_alloc()));
    const StandardError standardError;
    EXPECT_EQ(discover(), 1);
    EXPECT_EQ(standardError.text(), std::string(std::bad_alloc().what()) + '\n');
    EXPECT_EQ(keys(), Lines{"PowerStateManagement_a"});
}

TEST_F(Discovery, EveryCallReadsTheTreeAfresh) {
    haveNodes({"a"});
    EXPECT_EQ(discover(), 0);
    agent.nodes = {{"b", 1, {}}};
    records.clear();
    EXPECT_EQ(discover(), 0);
    EXPECT_EQ(keys(), Lines{"PowerStateManagement_b"});
    EXPECT_EQ(records.begin()->second.getPowerState(), 2);
}

} // namespace
} // namespace OrvTest

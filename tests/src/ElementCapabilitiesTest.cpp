/**
 * What is particular to TALVO_PowerManagementElementCapabilities: both ends are this library's own, and one failure
 * reaches the client as an error.
 */
#include "Associations.h"

namespace OrvTest {
namespace {

const std::string pathRefused =
    "Create CMPIObjectPath failed for                     PowerManagementElementCapabilities";

class ElementCapabilities : public AssociationFixture {
protected:
    ElementCapabilities() : AssociationFixture(elementCapabilities) {}

    /** Makes the first association path of the next walk fail. With two nodes it is the fifth path. */
    void refuseAssociationPath(CMPIrc status = CMPI_RC_ERR_ACCESS_DENIED) {
        broker.faults.at("newObjectPath", 5, nullObject(status));
    }

    Lines walkToAssociationPath() const {
        const std::string line = newPath(5, className());
        return lines(entry("EnumInstanceNames"), discovery(), before(pairs(true), line),
                     line.substr(0, line.find("path#")) + "null", message("EnumInstanceNames", pathRefused + '.'));
    }

    const std::string traced =
        "broker.trace(1, \"PowerManagementElementCapabilitiesProvider\", \"" + pathRefused + ".\", null)";
};

TEST_F(ElementCapabilities, NothingIsAskedOfTheObjectManager) {
    haveRecords();
    haveSystems(2);
    expectOk(enumInstanceNames());
    expectOk(enumInstances());
    for (const End* end : {&tested.first, &tested.second}) {
        comeFrom(*end);
        for (const char* operation : {"AssociatorNames", "Associators", "ReferenceNames", "References"}) {
            expectOk(traverse(operation));
        }
    }
    EXPECT_THAT(calls(), testing::Each(testing::Not(testing::HasSubstr("enumerateInstance"))));
    EXPECT_THAT(calls(), testing::Each(testing::Not(testing::HasSubstr("PowerState,"))));
}

TEST_F(ElementCapabilities, TheTreeIsReadAgainForTheCapabilitiesOfEachService) {
    haveRecords();
    expectOk(enumInstanceNames());
    EXPECT_THAT(calls(), testing::Contains("Instrumentation()").Times(1 + 2));
    transcript.clear();
    expectOk(enumInstances());
    EXPECT_THAT(calls(), testing::Contains("Instrumentation()").Times(1 + 1 + 2));
}

TEST_F(ElementCapabilities, CapabilitiesThatAreGoneMeanwhileEndTheWalk) {
    const std::string text =
        "***Can't get ObjectPaths for PowerManagementCapabilities.                 Exiting EnumerateInstanceNames***";
    const Lines failed =
        lines(failedDiscovery(), factorySource.entering("getAllPMCapCMPIObjPaths", capabilitiesClass.pathsParameters()),
              factorySource.message(6000, "getAllPMCapCMPIObjPaths", "***No ObjPaths found***"));
    const auto loseNodes = [&] {
        haveRecords();
        transcript.clear();
        broker.faults.clear();
        broker.faults.at("addKey", 8, {.action = [this] { agent.nodes.clear(); }});
        return discovery();
    };
    const Lines found = loseNodes();
    expectOk(enumInstanceNames());
    const Lines walk = lines(serviceClass.allPaths(nodes), namespaceSet("path#1"), failed);
    EXPECT_CALLS(entry("EnumInstanceNames"), found, walk, message("EnumInstanceNames", text));
    EXPECT_EQ(returned.closed, 0);
    loseNodes();
    expectOk(enumInstances());
    EXPECT_CALLS(entry("EnumInstances"), found, builderEntry(), found, walk, builderMessage(text),
                 "result.returnDone()", exit("EnumInstances"));
}

TEST_F(ElementCapabilities, TheServicePathIsTestedAgainForEachCapabilitiesPath) {
    const std::string text = "CMPIObjectPath is NULL for PowerManagementCapabilities";
    haveRecords();
    // The first pair's association path is on the managed system: after that, the service's path loses what it held.
    const auto lose = [this] {
        transcript.clear();
        broker.faults.clear();
        broker.faults.at("setHostname", 5, {.action = [this] { broker.pathCalled("path#1")->hdl = nullptr; }});
    };
    const auto walked = [&](bool asNames) { return before(pairs(asNames), namespaceSet("path#4"), 2); };
    lose();
    expectOk(enumInstanceNames());
    EXPECT_CALLS(entry("EnumInstanceNames"), discovery(), walked(true), message("EnumInstanceNames", text));
    EXPECT_EQ(returned.paths.size(), 1);
    EXPECT_EQ(returned.closed, 0);
    lose();
    expectOk(enumInstances());
    EXPECT_CALLS(entry("EnumInstances"), discovery(), builderEntry(), discovery(), walked(false), builderMessage(text),
                 "result.returnDone()", exit("EnumInstances"));
    EXPECT_TRUE(returned.instances.empty());
}

TEST_F(ElementCapabilities, ACapabilitiesPathThatHoldsNothingIsNotNoticed) {
    haveRecords();
    const auto lose = [this] {
        transcript.clear();
        broker.faults.clear();
        broker.faults.at("addKey", 10, {.action = [this] { broker.pathCalled("path#4")->hdl = nullptr; }});
    };
    lose();
    expectOk(enumInstanceNames());
    EXPECT_TRUE(sameLines(pairs(true), [this] {
        const Lines all = calls();
        const std::size_t opening = entry("EnumInstanceNames").size() + discovery().size();
        return Lines(all.begin() + static_cast<std::ptrdiff_t>(opening), all.end() - 3);
    }()));
    lose();
    expectOk(enumInstances());
    EXPECT_EQ(returned.instances.size(), 4);
}

TEST_F(ElementCapabilities, AnAssociationPathThatCannotBeMadeIsTheOneError) {
    haveRecords();
    refuseAssociationPath();
    const CMPIStatus status = enumInstanceNames();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(transcript.nameOf(status.msg), "string#1");
    EXPECT_CALLS(walkToAssociationPath(), "broker.newString(\"" + pathRefused + "\") -> string#1, no status", traced);
    EXPECT_EQ(returned.closed, 0);
}

TEST_F(ElementCapabilities, TheErrorHasNoMessageWhereTheBrokerMakesNone) {
    haveRecords();
    refuseAssociationPath();
    broker.faults.always("newString", nullObject());
    const CMPIStatus status = enumInstanceNames();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(status.msg, nullptr);
    EXPECT_CALLS(walkToAssociationPath(), "broker.newString(\"" + pathRefused + "\") -> null, no status", traced);
}

TEST_F(ElementCapabilities, TheErrorDoesNotDependOnTheBrokersTrace) {
    haveRecords();
    refuseAssociationPath(CMPI_RC_OK);
    broker.faults.always("trace", reports(CMPI_RC_ERR_NOT_SUPPORTED));
    EXPECT_EQ(enumInstanceNames().rc, CMPI_RC_ERR_FAILED);
}

TEST_F(ElementCapabilities, OnlyNamesHaveThatError) {
    haveRecords();
    refuseAssociationPath();
    expectOk(enumInstances());
    EXPECT_THAT(calls(), testing::Each(testing::Not(testing::HasSubstr("broker.newString("))));
    EXPECT_THAT(calls(), testing::Each(testing::Not(testing::HasSubstr("broker.trace("))));
}

TEST_F(ElementCapabilities, PropertyListsDoNotTakeTheEndsAway) {
    haveRecords(1);
    expectOk(enumInstances(properties));
    ASSERT_EQ(returned.instances.size(), 1);
    for (const End* end : {&tested.first, &tested.second}) {
        EXPECT_EQ(returned.instances[0]->ft->getProperty(returned.instances[0], end->property.c_str(), nullptr).type,
                  CMPI_ref);
    }
}

TEST_F(ElementCapabilities, ResultClassesDoNotFilter) {
    haveRecords(1);
    for (const char* resultClass : {"TALVO_ComputerSystem", "no class", ""}) {
        for (const End* end : {&tested.first, &tested.second}) {
            comeFrom(*end);
            expectOk(associatorNames(className().c_str(), resultClass));
            expectOk(associators(className().c_str(), resultClass));
        }
    }
    EXPECT_EQ(returned.paths.size(), 6);
    EXPECT_EQ(returned.instances.size(), 6);
}

} // namespace
} // namespace OrvTest

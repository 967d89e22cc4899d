#include "PowerStateManagementObjFactory.h"

#include "Expected.h"
#include "RequestFixture.h"
#include "StandardError.h"

#include "cmpimacs.h"

#include <stdexcept>

namespace OrvTest {
namespace {

using Factory = Norv::PowerStateManagementServiceProvider::PowerStateManagementObjFactory;

class FactoryLifecycle : public RequestFixture {};

TEST_F(FactoryLifecycle, ReadsTheTreeOnceAndWritesNothing) {
    haveNodes({"b", "a"});
    Factory factory("Name");
    EXPECT_CALLS(discovery());
    EXPECT_EQ(factory.getNumberOfInstances(), 2);
    EXPECT_CALLS(discovery());
}

TEST_F(FactoryLifecycle, KeysTheRecordsAsItIsTold) {
    haveNodes({"b", "a"});
    EXPECT_EQ(Factory("Name").getPowerStateManagementMap().count("PowerStateManagement_a"), 1);
    EXPECT_EQ(Factory("InstanceID").getPowerStateManagementMap().count("a"), 1);
    EXPECT_EQ(Factory("ElementName").getNumberOfInstances(), 0);
}

TEST_F(FactoryLifecycle, GivesACopyOfTheRecords) {
    haveNodes({"a"});
    Factory factory("InstanceID");
    auto copy = factory.getPowerStateManagementMap();
    copy["a"].setName("changed");
    copy.erase("a");
    EXPECT_EQ(factory.getNumberOfInstances(), 1);
    EXPECT_EQ(factory.getPowerStateManagementMap()["a"].getName(), "PowerStateManagement_a");
}

TEST_F(FactoryLifecycle, ATreeWithoutNodesIsLogged) {
    Factory factory("Name");
    EXPECT_CALLS("Instrumentation()", "instrumentation.selectNode(40) -> false", "~Instrumentation()",
                 "log+trace 6000 Corvane.PowerMgmtObjFactory PowerStateManagementObjFactory "
                 "src/PowerStateManagementObjFactory.cpp: MESSAGE [File: src/PowerStateManagementObjFactory.cpp, "
                 "Line: <line>]:  getPowerStateManagementInstances Failed");
    EXPECT_EQ(factory.getNumberOfInstances(), 0);
}

TEST_F(FactoryLifecycle, AFailureLeavesTheRecordsThatWereRead) {
    haveNodes({"a", "b"});
    agent.faults.at("getPathToNode", 2, throws(std::runtime_error("the tree is gone")));
    const StandardError standardError;
    Factory factory("Name");
    EXPECT_EQ(factory.getNumberOfInstances(), 1);
    EXPECT_THAT(transcript.calls(),
                testing::Contains(factorySource.message(6000, "PowerStateManagementObjFactory",
                                                        " getPowerStateManagementInstances Failed")));
    std::vector<CMPIObjectPath*> paths;
    EXPECT_EQ(factory.getAllPMCMPIObjPaths(&broker, ref, paths, nullptr), 0);
    EXPECT_EQ(paths.size(), 1);
}

TEST_F(FactoryLifecycle, CountsInSixteenBits) {
    haveMany(65537);
    Factory factory("Name");
    EXPECT_EQ(factory.getPowerStateManagementMap().size(), 65537);
    EXPECT_EQ(static_cast<unsigned short>(factory.getNumberOfInstances()), 1);
}

TEST(FactoryConstants, AreTheClassNames) {
    namespace Provider = Norv::PowerStateManagementServiceProvider;
    EXPECT_STREQ(Provider::powerManagementServiceClass, "TALVO_PowerManagementService");
    EXPECT_STREQ(Provider::powerManagementCapabilitiesClass, "TALVO_PowerManagementCapabilities");
    EXPECT_STREQ(Provider::computerSystemClass, "TALVO_ComputerSystem");
}

class FactoryPaths : public RequestFixture {
protected:
    unsigned short services(const std::string& key = "Name") {
        return Factory(key).getAllPMCMPIObjPaths(&broker, ref, paths, &status);
    }

    unsigned short capabilities(const std::string& key = "InstanceID") {
        return Factory(key).getAllPMCapCMPIObjPaths(&broker, ref, paths, &status);
    }

    std::vector<CMPIObjectPath*> paths;
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    NamedAddress pathsName{&paths, "paths"};
    NamedAddress statusName{&status, "status"};

    /** The lines of the builders' own, spelled out. */
    static std::string own(const std::string& level, const std::string& function, const std::string& text) {
        return "log+trace " + level + " Corvane.PowerMgmtObjFactory " + function +
               " src/PowerStateManagementObjFactory.cpp: " + text;
    }

    const std::string enteringServices =
        own("3000", "getAllPMCMPIObjPaths",
            "ENTERING: getAllPMCMPIObjPaths() in src/PowerStateManagementObjFactory.cpp [Line: <line>],"
            "Parameters List:  broker=&broker ref=&ref objectPaths=&paths status=&status");
    const std::string exitingServices =
        own("3000", "getAllPMCMPIObjPaths",
            "EXITING: getAllPMCMPIObjPaths() in src/PowerStateManagementObjFactory.cpp [Line: <line>],"
            "Parameters List:  broker=&broker ref=&ref objectPaths=&paths status=&status");
    const std::string enteringCapabilities =
        own("3000", "getAllPMCapCMPIObjPaths",
            "ENTERING: getAllPMCapCMPIObjPaths() in src/PowerStateManagementObjFactory.cpp [Line: <line>],"
            "Parameters List:  broker=&broker ref=&ref objectPaths=&paths status=&status");
};

TEST_F(FactoryPaths, AServiceHasFourKeys) {
    haveNodes({"rack/a"});
    EXPECT_EQ(services(), 0);
    EXPECT_CALLS(discovery(), enteringServices,
                 "broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementService\") -> path#1",
                 "path#1.setNameSpace(\"root/cimv2\")", "path#1.setHostname(\"managed.example.org\")",
                 "path#1.addKey(CreationClassName, CMPI_chars, \"TALVO_PowerManagementService\")",
                 "path#1.addKey(Name, CMPI_chars, \"PowerStateManagement_rack/a\")",
                 "path#1.addKey(SystemCreationClassName, CMPI_chars, \"TALVO_ComputerSystem\")",
                 "path#1.addKey(SystemName, CMPI_chars, \"managed.example.org\")", exitingServices);
    ASSERT_EQ(paths.size(), 1);
    EXPECT_EQ(CMGetKeyCount(paths[0], nullptr), 4);
}

TEST_F(FactoryPaths, ACapabilitiesObjectHasOneKeyAndNoExitingLine) {
    haveNodes({"rack/a"});
    EXPECT_EQ(capabilities(), 0);
    EXPECT_CALLS(discovery(), enteringCapabilities,
                 "broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementCapabilities\") -> path#1",
                 "path#1.setNameSpace(\"root/cimv2\")", "path#1.setHostname(\"managed.example.org\")",
                 "path#1.addKey(InstanceID, CMPI_chars, \"rack/a\")");
    ASSERT_EQ(paths.size(), 1);
    EXPECT_EQ(CMGetKeyCount(paths[0], nullptr), 1);
}

TEST_F(FactoryPaths, TheNamespaceIsTheRequestsAndTheHostTheManagedSystems) {
    haveNodes({"a"});
    agent.systemName = "another.example.org";
    ref = broker.path("ref", "root/interop", "TALVO_PowerManagementService");
    CMSetHostname(ref, "the.object.managers.own.host");
    EXPECT_EQ(services(), 0);
    EXPECT_EQ(capabilities(), 0);
    ASSERT_EQ(paths.size(), 2);
    for (CMPIObjectPath* path : paths) {
        EXPECT_STREQ(CMGetCharPtr(CMGetNameSpace(path, nullptr)), "root/interop");
        EXPECT_STREQ(CMGetCharPtr(CMGetHostname(path, nullptr)), "another.example.org");
    }
    EXPECT_STREQ(CMGetCharPtr(CMGetKey(paths[0], "SystemName", nullptr).value.string), "another.example.org");
}

TEST_F(FactoryPaths, ComeInTheOrderOfTheirKeysBehindWhatTheVectorHolds) {
    haveNodes({"b", "a", "B"});
    CMPIObjectPath* first = broker.path("first", "", "");
    paths = {first};
    EXPECT_EQ(services(), 0);
    ASSERT_EQ(paths.size(), 4);
    EXPECT_EQ(paths[0], first);
    Lines names;
    for (std::size_t index = 1; index < paths.size(); ++index) {
        names.emplace_back(CMGetCharPtr(CMGetKey(paths[index], "Name", nullptr).value.string));
    }
    EXPECT_EQ(names, (Lines{"PowerStateManagement_B", "PowerStateManagement_a", "PowerStateManagement_b"}));
}

TEST_F(FactoryPaths, NoRecordIsReported) {
    EXPECT_EQ(services(), 1);
    EXPECT_EQ(capabilities(), 1);
    EXPECT_CALLS(failedDiscovery(), enteringServices,
                 own("6000", "getAllPMCMPIObjPaths",
                     "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: ***No ObjPaths found***"),
                 failedDiscovery(), enteringCapabilities,
                 own("6000", "getAllPMCapCMPIObjPaths",
                     "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: ***No ObjPaths found***"));
    EXPECT_TRUE(paths.empty());
}

TEST_F(FactoryPaths, AnUnknownKeyPropertyIsTheSameAsNoRecord) {
    haveNodes({"a"});
    EXPECT_EQ(services("ElementName"), 1);
    EXPECT_EQ(capabilities("name"), 1);
}

TEST_F(FactoryPaths, TheEmptyKeyPropertyIsTheName) {
    haveNodes({"a"});
    EXPECT_EQ(services(""), 0);
    EXPECT_EQ(paths.size(), 1);
}

struct NoPath {
    const char* what;
    Fault fault;
    const char* outcome;
};

void PrintTo(const NoPath& noPath, std::ostream* out) {
    *out << noPath.what;
}

class FactoryPathsFailing : public FactoryPaths, public testing::WithParamInterface<NoPath> {};

TEST_P(FactoryPathsFailing, TheServicesEndWithAMessageAndKeepThePathsBefore) {
    haveNodes({"a", "b", "c"});
    broker.faults.at("newObjectPath", 2, GetParam().fault);
    EXPECT_EQ(services(), 2);
    EXPECT_CALLS(discovery(), enteringServices, serviceClass.path(1, "a"),
                 std::string("broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementService\") -> ") +
                     GetParam().outcome,
                 own("6000", "getAllPMCMPIObjPaths",
                     "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: Create "
                     "CMPIObjectPath                                  failed for Power Management Service."));
    EXPECT_EQ(paths.size(), 1);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
}

TEST_P(FactoryPathsFailing, TheCapabilitiesEndWithAMessageAndKeepThePathsBefore) {
    haveNodes({"a", "b", "c"});
    broker.faults.at("newObjectPath", 2, GetParam().fault);
    EXPECT_EQ(capabilities(), 2);
    EXPECT_CALLS(discovery(), enteringCapabilities, capabilitiesClass.path(1, "a"),
                 std::string("broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementCapabilities\") -> ") +
                     GetParam().outcome,
                 own("6000", "getAllPMCapCMPIObjPaths",
                     "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: Create "
                     "CMPIObjectPath                                  failed for "
                     "PowerManagement                                  Capabilities Class."));
    EXPECT_EQ(paths.size(), 1);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
}

INSTANTIATE_TEST_SUITE_P(Factory, FactoryPathsFailing,
                         testing::Values(NoPath{"null", nullObject(CMPI_RC_ERR_ACCESS_DENIED), "null"},
                                         NoPath{"without handle", objectWithoutHandle(CMPI_RC_ERR_ACCESS_DENIED),
                                                "path#2 without handle"}));

TEST_F(FactoryPaths, TheStatusesOfNamespaceHostAndKeysAreIgnored) {
    haveNodes({"a"});
    for (const char* slot : {"setNameSpace", "setHostname", "addKey"}) {
        broker.faults.always(slot, reports(CMPI_RC_ERR_FAILED));
    }
    EXPECT_EQ(services(), 0);
    EXPECT_EQ(capabilities(), 0);
    EXPECT_EQ(paths.size(), 2);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
}

TEST_F(FactoryPaths, TheStatusIsHandedToTheNamespaceAndTheCreation) {
    haveNodes({"a"});
    broker.faults.always("newObjectPath", leavesStatus());
    broker.faults.always("getNameSpace", reports(CMPI_RC_ERR_INVALID_NAMESPACE));
    EXPECT_EQ(services(), 0);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_NAMESPACE);
    status.rc = CMPI_RC_OK;
    EXPECT_EQ(capabilities(), 0);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_NAMESPACE);
    broker.faults.always("newObjectPath", reports(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_EQ(services(), 0);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
}

TEST_F(FactoryPaths, NothingIsWrittenToTheStatusByTheFactory) {
    status = {CMPI_RC_ERR_NOT_SUPPORTED, broker.string("message", "from before")};
    EXPECT_EQ(services(), 1);
    EXPECT_EQ(capabilities(), 1);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_NE(status.msg, nullptr);
}

TEST_F(FactoryPaths, QueriesDoNotChangeTheRecords) {
    haveNodes({"a"});
    Factory factory("Name");
    for (int time = 1; time <= 2; ++time) {
        EXPECT_EQ(factory.getAllPMCMPIObjPaths(&broker, ref, paths, &status), 0);
    }
    EXPECT_EQ(paths.size(), 2);
    EXPECT_EQ(factory.getNumberOfInstances(), 1);
}

} // namespace
} // namespace OrvTest

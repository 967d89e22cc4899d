/**
 * The instance operations of the two element classes, through the built library. One suite tests what both classes
 * share.
 */
#include "Expected.h"
#include "ProviderLibrary.h"
#include "RequestFixture.h"

#include <algorithm>
#include <set>
#include <stdexcept>

namespace OrvTest {
namespace {

constexpr const char* noPaths = "***Can't get ObjectPaths.                     Exiting EnumerateInstanceNames***";
constexpr const char* noInstances = "***Could not get instances,                      exiting EnumerateInstance***";
constexpr const char* noKeys = "At least one key should be passed";

class ElementOperations : public RequestFixture {
protected:
    explicit ElementOperations(const ElementClass& elementClass) : element(elementClass) {}

    CMPIStatus enumInstanceNames() { return mi->ft->enumerateInstanceNames(mi, context, result, ref); }
    CMPIStatus enumInstances(const char** list = nullptr) {
        return mi->ft->enumerateInstances(mi, context, result, ref, list);
    }
    CMPIStatus getInstance(const char** list = nullptr) { return mi->ft->getInstance(mi, context, result, ref, list); }

    /** Asks for one element by its node's path. */
    void askFor(const std::string& node) {
        ref = broker.path("ref", "root/cimv2", element.className, {{element.key, element.keyOf(node)}});
    }

    /** Asks with keys, but not with the one that the provider looks up. */
    void askWithoutKey() { ref = broker.path("ref", "root/cimv2", element.className, {{"Other", "key"}}); }

    /** The instance whose path is the requested one, by its place in the enumeration, the first being 1. */
    void requestedIs(const std::vector<int>& numbers) {
        agent.pathsEqual = [this, numbers](const CMPIObjectPath* left, const CMPIObjectPath* right, bool) {
            return left == ref && std::any_of(numbers.begin(), numbers.end(), [&](int number) {
                       return transcript.nameOf(right) == "instance#" + std::to_string(number) + ".path";
                   });
        };
    }

    std::string message(const std::string& operation, const std::string& text) const {
        return element.source.message(6000, element.operation(operation), text);
    }
    Lines entry(const std::string& operation) const { return element.source.entry(element.operation(operation)); }
    Lines exit(const std::string& operation) const { return element.source.exit(element.operation(operation)); }

    /** The comparison of a scanned instance with the requested path. */
    static Lines compared(int number, bool equal) {
        const std::string instance = "instance#" + std::to_string(number);
        return {instance + ".getObjectPath() -> " + instance + ".path",
                "isObjPathsEqual(ref, " + instance + ".path, false) -> " + (equal ? "true" : "false")};
    }

    std::string keyRead(const std::string& outcome) const { return "ref.getKey(" + element.key + ") -> " + outcome; }

    /** A lookup in the factory: its own lines around `made`, or its failure where there is nothing. */
    Lines lookup(const std::string& node, const Lines& made, const std::string& list = "0") const {
        const bool isService = element.key == "Name";
        const std::string parameters = " broker=&broker " + std::string(isService ? "objectPath" : "ref") +
                                       "=&ref key=&ref." + element.key + " properties=" + list +
                                       " instances=<address> " + (isService ? "status" : "rc") + "=<address>";
        const Lines opening = lines(
            factorySource.entering(element.getOneInstance, parameters),
            isService ? Lines{factorySource.variable(element.getOneInstance, "name", element.keyOf(node))} : Lines());
        return made.empty() ? lines(opening, factorySource.message(6000, element.getOneInstance,
                                                                   "_powerStateManagementMap Empty"))
                            : lines(opening, made, factorySource.exiting(element.getOneInstance, parameters));
    }

    const ElementClass& element;
    ProviderLibrary library;
    CMPIInstanceMI* mi = library.instanceMI(element.provider(), broker);
    CMPIContext* context = broker.context("context");
    CMPIResult* result = broker.result("result");
    const RecordingBroker::Returned& returned = broker.returned(result);
    const char* properties[2] = {"ElementName", nullptr};
    NamedAddress propertiesName{properties, "properties"};
};

class BothElements : public ElementOperations, public testing::WithParamInterface<const ElementClass*> {
protected:
    BothElements() : ElementOperations(*GetParam()) {}
};

INSTANTIATE_TEST_SUITE_P(Elements, BothElements, testing::Values(&serviceClass, &capabilitiesClass),
                         [](const auto& tested) { return tested.param->prefix; });

class ServiceElement : public ElementOperations {
protected:
    ServiceElement() : ElementOperations(serviceClass) {}
};

class CapabilitiesElement : public ElementOperations {
protected:
    CapabilitiesElement() : ElementOperations(capabilitiesClass) {}
};

void expectOk(const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(status.msg, nullptr);
}

/* EnumInstanceNames */

TEST_P(BothElements, NamesComeInTheOrderOfTheirKeys) {
    haveNodes({"rack/b", "rack/a"});
    expectOk(enumInstanceNames());
    EXPECT_CALLS(entry("EnumInstanceNames"), discovery(), element.allPaths({"rack/a", "rack/b"}),
                 "result.returnObjectPath(path#1)", "result.returnObjectPath(path#2)", "result.returnDone()",
                 exit("EnumInstanceNames"));
}

TEST_P(BothElements, WithoutRecordsNamesFailAndLeaveTheResultOpen) {
    expectOk(enumInstanceNames());
    EXPECT_CALLS(entry("EnumInstanceNames"), failedDiscovery(),
                 factorySource.entering(element.getAllPaths, element.pathsParameters()),
                 factorySource.message(6000, element.getAllPaths, "***No ObjPaths found***"),
                 message("EnumInstanceNames", noPaths));
}

TEST_P(BothElements, WithoutAPathNamesFailWithTheBrokersStatus) {
    for (const Fault::Object object : {Fault::Object::null, Fault::Object::withoutHandle}) {
        agent.reset();
        transcript.clear();
        haveNodes({"a", "b"});
        Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
        fault.object = object;
        broker.faults.at("newObjectPath", 2, fault);
        const CMPIStatus status = enumInstanceNames();
        EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
        EXPECT_EQ(status.msg, fault.message);
        EXPECT_CALLS(entry("EnumInstanceNames"), discovery(),
                     factorySource.entering(element.getAllPaths, element.pathsParameters()), element.path(1, "a"),
                     "broker.newObjectPath(\"root/cimv2\", \"" + element.className + "\") -> " +
                         (object == Fault::Object::null ? "null" : "path#2 without handle"),
                     factorySource.message(6000, element.getAllPaths, element.noPath),
                     message("EnumInstanceNames", noPaths));
    }
}

TEST_P(BothElements, NamesReturnTheLastStatusEvenWhereAllWentWell) {
    haveNodes({"a"});
    broker.faults.always("newObjectPath", reports(CMPI_RC_ERR_ACCESS_DENIED));
    broker.faults.always("returnObjectPath", reports(CMPI_RC_ERR_FAILED));
    broker.faults.always("returnDone", reports(CMPI_RC_ERR_FAILED));
    EXPECT_EQ(enumInstanceNames().rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(returned.paths.size(), 1);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(BothElements, NamesAreCountedInSixteenBits) {
    haveMany(65537);
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), 1);
    agent.nodes.pop_back();
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), 1);
    EXPECT_EQ(returned.closed, 2);
}

/* EnumInstances */

TEST_P(BothElements, InstancesComeInTheOrderOfTheirKeys) {
    haveNodes({"rack/b", "rack/a"});
    expectOk(enumInstances());
    EXPECT_CALLS(entry("EnumInstances"), discovery(), element.allInstances({"rack/a", "rack/b"}),
                 "result.returnInstance(instance#1)", "result.returnInstance(instance#2)", "result.returnDone()",
                 exit("EnumInstances"));
}

TEST_P(BothElements, InstancesHaveThePropertiesThatAreAskedFor) {
    haveNodes({"a"});
    expectOk(enumInstances(properties));
    const Lines closing =
        element.instancesExit
            ? Lines{factorySource.exiting(element.getAllInstances, element.instancesParameters("&properties"))}
            : Lines();
    EXPECT_CALLS(entry("EnumInstances"), discovery(),
                 factorySource.entering(element.getAllInstances, element.instancesParameters("&properties")),
                 element.instanceWithElementName(1, "a"), closing, "result.returnInstance(instance#1)",
                 "result.returnDone()", exit("EnumInstances"));
}

TEST_F(ServiceElement, WithoutRecordsInstancesFailAndLeaveTheResultOpen) {
    expectOk(enumInstances());
    EXPECT_CALLS(entry("EnumInstances"), failedDiscovery(),
                 factorySource.entering("getAllPMCMPIInstances", element.instancesParameters("0")),
                 factorySource.message(6000, "getAllPMCMPIInstances", "***No instance found***"),
                 message("EnumInstances", noInstances));
}

TEST_F(CapabilitiesElement, WithoutRecordsThereAreNoInstancesAndTheResultIsClosed) {
    expectOk(enumInstances());
    EXPECT_CALLS(entry("EnumInstances"), failedDiscovery(), element.allInstances({}), "result.returnDone()",
                 exit("EnumInstances"));
}

TEST_P(BothElements, InstancesThatHoldNothingAreReturnedAsTheyAre) {
    haveNodes({"a", "b", "c"});
    broker.faults.at("newInstance", 1, nullObject());
    broker.faults.at("newInstance", 2, objectWithoutHandle());
    expectOk(enumInstances());
    ASSERT_EQ(returned.instances.size(), 3);
    EXPECT_EQ(returned.instances[0], nullptr);
    EXPECT_EQ(returned.instances[1]->hdl, nullptr);
    EXPECT_NE(returned.instances[2]->hdl, nullptr);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(BothElements, AnInstanceWithoutPathIsReturnedAsNull) {
    haveNodes({"a"});
    broker.faults.at("newObjectPath", 1, nullObject(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_EQ(enumInstances().rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(returned.instances, (std::vector<const CMPIInstance*>{nullptr}));
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(BothElements, InstancesAreCountedInSixteenBits) {
    haveMany(65537);
    expectOk(enumInstances(properties));
    EXPECT_EQ(returned.instances.size(), 1);
    EXPECT_EQ(returned.closed, 1);
}

TEST_F(ServiceElement, InstancesReturnTheLastStatus) {
    haveNodes({"a"});
    broker.faults.always("newObjectPath", reports(CMPI_RC_ERR_ACCESS_DENIED));
    broker.faults.always("returnInstance", reports(CMPI_RC_ERR_FAILED));
    EXPECT_EQ(enumInstances().rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(returned.closed, 1);
}

TEST_F(CapabilitiesElement, InstancesReturnTheStatusOfTheLastArray) {
    haveNodes({"a"});
    broker.faults.at("newArray", 2, nullObject(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_EQ(enumInstances().rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(returned.instances.size(), 1);
    EXPECT_EQ(returned.closed, 1);
}

/* GetInstance */

TEST_P(BothElements, WithoutKeysTheResultIsEmptyAndClosed) {
    haveNodes({"a"});
    ref = broker.path("ref", "root/cimv2", element.className);
    expectOk(getInstance());
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 0", message("GetInstance", noKeys), "result.returnDone()",
                 exit("GetInstance"));
}

TEST_P(BothElements, WithoutKeysTheStatusIsThatOfTheCount) {
    ref = broker.path("ref", "root/cimv2", element.className);
    broker.faults.always("getKeyCount", reports(CMPI_RC_ERR_INVALID_HANDLE));
    EXPECT_EQ(getInstance().rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(BothElements, AnInstanceIsFoundByItsKey) {
    haveNodes({"rack/a", "rack/b"});
    askFor("rack/b");
    expectOk(getInstance());
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead('"' + element.keyOf("rack/b") + '"'),
                 discovery(), lookup("rack/b", element.instance(1, "rack/b")), "result.returnInstance(instance#1)",
                 "result.returnDone()", exit("GetInstance"));
}

TEST_P(BothElements, TheInstanceFoundHasThePropertiesThatAreAskedFor) {
    haveNodes({"a"});
    askFor("a");
    expectOk(getInstance(properties));
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead('"' + element.keyOf("a") + '"'), discovery(),
                 lookup("a", element.instanceWithElementName(1, "a"), "&properties"),
                 "result.returnInstance(instance#1)", "result.returnDone()", exit("GetInstance"));
}

TEST_P(BothElements, AnInstanceThatCannotBeMadeIsReturnedAsNull) {
    haveNodes({"a"});
    askFor("a");
    broker.faults.always("newInstance", nullObject());
    expectOk(getInstance());
    EXPECT_EQ(returned.instances, (std::vector<const CMPIInstance*>{nullptr}));
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(BothElements, AnUnknownKeyFailsAndLeavesTheResultOpen) {
    haveNodes({"a"});
    askFor("b");
    expectOk(getInstance());
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead('"' + element.keyOf("b") + '"'), discovery(),
                 lookup("b", {}), message("GetInstance", element.noInstance));
}

TEST_P(BothElements, AnyKeyIsUnknownOnAMachineWithoutNodes) {
    askFor("a");
    expectOk(getInstance());
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead('"' + element.keyOf("a") + '"'),
                 failedDiscovery(), lookup("a", {}), message("GetInstance", element.noInstance));
}

TEST_P(BothElements, AnUnknownKeyLeavesTheStatusOfReadingTheKey) {
    haveNodes({"a"});
    askFor("b");
    const Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
    broker.faults.always("getKey", fault);
    const CMPIStatus status = getInstance();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(status.msg, fault.message);
}

TEST_P(BothElements, WithoutItsKeyTheFirstInstanceWithTheRequestedPathIsReturned) {
    haveNodes({"a", "b", "c"});
    askWithoutKey();
    requestedIs({2, 3});
    expectOk(getInstance());
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead("not found"), discovery(),
                 element.allInstances({"a", "b", "c"}), compared(1, false), compared(2, true),
                 "result.returnInstance(instance#2)", "result.returnDone()", exit("GetInstance"));
}

TEST_P(BothElements, WithoutItsKeyAndAMatchTheResultIsEmptyAndClosed) {
    haveNodes({"a"});
    askWithoutKey();
    broker.faults.always("getObjectPath", reports(CMPI_RC_ERR_INVALID_CLASS));
    EXPECT_EQ(getInstance().rc, CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead("not found"), discovery(),
                 element.allInstances({"a"}), compared(1, false), "result.returnDone()", exit("GetInstance"));
}

TEST_P(BothElements, TheStatusOfAKeyThatIsMissingDoesNotStay) {
    haveNodes({"a"});
    askWithoutKey();
    expectOk(getInstance());
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(BothElements, AKeyThatHoldsNothingIsNoKey) {
    CMPIString* empty = broker.string("empty", "");
    empty->hdl = nullptr;
    const std::pair<CMPIData, std::string> cases[] = {{stringValue(nullptr), "null"}, {stringValue(empty), "empty"}};
    for (const auto& [key, shown] : cases) {
        agent.reset();
        transcript.clear();
        haveNodes({"a"});
        askFor("a");
        broker.setKey(ref, element.key, key);
        requestedIs({1});
        expectOk(getInstance());
        EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead(shown), discovery(),
                     element.allInstances({"a"}), compared(1, true), "result.returnInstance(instance#1)",
                     "result.returnDone()", exit("GetInstance"));
    }
}

TEST_P(BothElements, InstancesThatHoldNothingAreSkippedInTheScan) {
    haveNodes({"a", "b", "c"});
    askWithoutKey();
    broker.faults.at("newInstance", 1, nullObject());
    broker.faults.at("newInstance", 2, objectWithoutHandle());
    requestedIs({1, 2});
    expectOk(getInstance());
    const Lines calls = transcript.calls();
    const auto scan = std::find(calls.begin(), calls.end(), compared(2, true).front());
    EXPECT_TRUE(sameLines(
        lines(compared(2, true), "result.returnInstance(instance#2)", "result.returnDone()", exit("GetInstance")),
        Lines(scan, calls.end())));
    EXPECT_EQ(std::count_if(calls.begin(), calls.end(),
                            [](const std::string& line) { return line.find("isObjPathsEqual") == 0; }),
              1);
}

TEST_P(BothElements, TheScanHasThePropertiesThatAreAskedFor) {
    haveNodes({"a"});
    askWithoutKey();
    requestedIs({1});
    expectOk(getInstance(properties));
    EXPECT_THAT(transcript.calls(), testing::IsSupersetOf(element.instanceWithElementName(1, "a")));
    EXPECT_EQ(returned.instances.size(), 1);
}

TEST_F(ServiceElement, WithoutRecordsTheScanFailsAndLeavesTheResultOpen) {
    askWithoutKey();
    const Fault fault = reports(CMPI_RC_ERR_NO_SUCH_PROPERTY, broker.string("reason", "no such key"));
    broker.faults.always("getKey", fault);
    const CMPIStatus status = getInstance();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
    EXPECT_EQ(status.msg, fault.message);
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead("not found"), failedDiscovery(),
                 factorySource.entering("getAllPMCMPIInstances", element.instancesParameters("0")),
                 factorySource.message(6000, "getAllPMCMPIInstances", "***No instance found***"),
                 message("GetInstance", "getAllPMCMPIInstances Failed"));
}

TEST_F(CapabilitiesElement, WithoutRecordsTheScanIsEmptyAndTheResultClosed) {
    askWithoutKey();
    EXPECT_EQ(getInstance().rc, CMPI_RC_ERR_NOT_FOUND);
    EXPECT_CALLS(entry("GetInstance"), "ref.getKeyCount() -> 1", keyRead("not found"), failedDiscovery(),
                 element.allInstances({}), "result.returnDone()", exit("GetInstance"));
}

TEST_P(BothElements, TheScanCountsInSixteenBits) {
    haveMany(65537);
    askWithoutKey();
    int compared = 0;
    agent.pathsEqual = [&](const CMPIObjectPath*, const CMPIObjectPath*, bool) { return ++compared == 2; };
    expectOk(getInstance(properties));
    EXPECT_EQ(compared, 1);
    EXPECT_TRUE(returned.instances.empty());
    EXPECT_EQ(returned.closed, 1);
}

/* What every operation has in common */

TEST_P(BothElements, EveryOperationReadsTheTreeAfresh) {
    haveNodes({"a"});
    expectOk(enumInstanceNames());
    agent.nodes.clear();
    haveNodes({"b", "c"});
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), 3);
    askFor("a");
    expectOk(getInstance());
    EXPECT_TRUE(returned.instances.empty());
}

TEST_P(BothElements, BrokerObjectsAreNotReleased) {
    haveNodes({"a"});
    askFor("a");
    enumInstanceNames();
    enumInstances();
    getInstance();
    EXPECT_THAT(transcript.everything(), testing::Each(testing::Not(testing::HasSubstr("release"))));
}

TEST_P(BothElements, ExceptionsOfTheBrokerPassWithoutExitMark) {
    haveNodes({"a", "b"});
    askFor("a");
    for (const char* slot : {"getNameSpace", "newObjectPath", "setHostname", "newInstance", "setProperty",
                             "setPropertyFilter", "returnInstance", "getKey", "getKeyCount"}) {
        transcript.clear();
        broker.faults.clear();
        broker.faults.at(slot, 1, throws(std::out_of_range(slot)));
        EXPECT_THROW(getInstance(), std::out_of_range) << slot;
        EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("markProviderExit")))) << slot;
        EXPECT_EQ(agent.messageBuffers, 0) << slot;
    }
    broker.faults.clear();
    broker.faults.at("returnObjectPath", 2, throws(42));
    EXPECT_THROW(enumInstanceNames(), int);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(BothElements, ExceptionsOfTheAgentPassWithoutExitMark) {
    haveNodes({"a", "b"});
    for (const char* call : {"getSystemName", "logLevelMessage", "traceLevelMessage", "OrvMessageBuffer"}) {
        transcript.clear();
        agent.faults.clear();
        agent.faults.at(call, 2, throws(std::runtime_error(call)));
        EXPECT_THROW(enumInstances(), std::runtime_error) << call;
        EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("markProviderExit")))) << call;
        EXPECT_EQ(agent.messageBuffers, 0) << call;
    }
    EXPECT_EQ(returned.closed, 0);
}

} // namespace
} // namespace OrvTest

/**
 * EnumInstanceNames, EnumInstances and GetInstance of the three associations, whose differences are data.
 */
#include "Associations.h"

#include <algorithm>
#include <stdexcept>

namespace OrvTest {
namespace {

constexpr const char* noKeys = "At least one key should be passed";

class AnyPairs : public AssociationFixture {
protected:
    using AssociationFixture::AssociationFixture;

    bool hasSystems() const { return tested.first.element == nullptr || tested.second.element == nullptr; }

    /** Machines of several sizes; without computer systems in the association, `systemCount` does not matter. */
    void have(int records, int systemCount) {
        haveRecords(records);
        haveSystems(systemCount);
    }

    Lines namesOpened() const {
        return lines(entry("EnumInstanceNames"), agent.nodes.empty() ? failedDiscovery() : discovery());
    }
    Lines namesClosed() const {
        const std::string done = "result.returnDone()";
        return tested.namesCloseBeforeExit ? lines(done, exit("EnumInstanceNames"))
                                           : lines(exit("EnumInstanceNames"), done);
    }

    /** The operation's own beginning, with `more` before it builds the instances. */
    Lines opened(const std::string& operation, const Lines& more = {}) const {
        const Lines found = agent.nodes.empty() ? failedDiscovery() : discovery();
        return lines(entry(operation), found, more, builderEntry(), found);
    }
    Lines closed(const std::string& operation) const { return lines("result.returnDone()", exit(operation)); }

    Lines built(const std::string& filter = "null") const { return lines(pairs(false, filter), builderExit()); }

    static Lines returnedInstances(std::size_t count) {
        Lines lines;
        for (std::size_t i = 1; i <= count; ++i) {
            lines.push_back("result.returnInstance(" + numbered("instance", static_cast<int>(i)) + ')');
        }
        return lines;
    }

    std::size_t pairCount() const { return nodes.size() * (hasSystems() ? systems.size() : nodes.size()); }

    /** Asks with both keys, for what one of the instances stands for; the first is 1. */
    void askForInstances(const std::vector<int>& numbers) {
        askFor({{tested.first.property, broker.path("first", "root/cimv2", tested.first.className)},
                {tested.second.property, broker.path("second", "root/cimv2", tested.second.className)}});
        agent.pathsEqual = [this, numbers](const CMPIObjectPath* left, const CMPIObjectPath* right, bool) {
            return left == ref && std::any_of(numbers.begin(), numbers.end(), [&](int number) {
                       return transcript.nameOf(right) == numbered("instance", number) + ".path";
                   });
        };
    }

    static Lines compared(int number, bool equal) {
        const std::string instance = numbered("instance", number);
        return {instance + ".getObjectPath() -> " + instance + ".path",
                "isObjPathsEqual(ref, " + instance + ".path, true) -> " + (equal ? "true" : "false")};
    }

    void forget() {
        broker.faults.clear();
        transcript.clear();
    }
};

class Pairs : public AnyPairs, public testing::WithParamInterface<const Association*> {
protected:
    Pairs() : AnyPairs(*GetParam()) {}
};

INSTANTIATE_TEST_SUITE_P(Associations, Pairs, testing::ValuesIn(associations),
                         [](const auto& tested) { return tested.param->prefix; });

/** Those of computer systems, which come through the object manager. */
class SystemPairs : public Pairs {};

INSTANTIATE_TEST_SUITE_P(Associations, SystemPairs, testing::Values(&associatedService, &hostedService),
                         [](const auto& tested) { return tested.param->prefix; });

class CapabilitiesPairs : public AnyPairs {
protected:
    CapabilitiesPairs() : AnyPairs(elementCapabilities) {}
};

/* The pairs */

TEST_P(Pairs, NamesAreTheCrossProduct) {
    have(2, 3);
    expectOk(enumInstanceNames());
    EXPECT_CALLS(namesOpened(), pairs(true), namesClosed());
    EXPECT_EQ(returned.paths.size(), pairCount());
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, InstancesAreTheCrossProduct) {
    have(2, 3);
    expectOk(enumInstances());
    EXPECT_CALLS(opened("EnumInstances"), built(), returnedInstances(pairCount()), closed("EnumInstances"));
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, OneOfEachIsOnePair) {
    have(1, 1);
    expectOk(enumInstanceNames());
    EXPECT_CALLS(namesOpened(), pairs(true), namesClosed());
    transcript.clear();
    expectOk(enumInstances());
    EXPECT_CALLS(opened("EnumInstances"), built(), returnedInstances(1), closed("EnumInstances"));
    EXPECT_EQ(returned.paths.size(), 1);
    EXPECT_EQ(returned.instances.size(), 1);
}

TEST_P(Pairs, WithoutComputerSystemsThereAreNoPairsOfThem) {
    have(2, 0);
    expectOk(enumInstanceNames());
    EXPECT_CALLS(namesOpened(), pairs(true), namesClosed());
    transcript.clear();
    expectOk(enumInstances());
    EXPECT_CALLS(opened("EnumInstances"), built(), returnedInstances(pairCount()), closed("EnumInstances"));
    EXPECT_EQ(returned.paths.size(), hasSystems() ? 0 : 4);
}

TEST_P(Pairs, NodesWithEqualPathsAreOneService) {
    haveSystems(1);
    agent.nodes = {{"a", 8U, {}}, {"b", 8U, {}}, {"a", 1U, {}}};
    nodes = {"a", "b"};
    expectOk(enumInstanceNames());
    EXPECT_CALLS(namesOpened(), pairs(true), namesClosed());
    transcript.clear();
    expectOk(enumInstances());
    EXPECT_CALLS(opened("EnumInstances"), built(), returnedInstances(pairCount()), closed("EnumInstances"));
}

TEST_P(Pairs, WithoutServicesThereIsAFailure) {
    haveSystems(1);
    const Lines walk = tested.first.element != nullptr
                           ? Lines()
                           : Lines{newPath(1, "TALVO_ComputerSystem"),
                                   "broker.enumerateInstanceNames(context, path#1) -> enumeration#1",
                                   "enumeration#1.getNext() -> system1"};
    const Lines failed = lines(walk, factorySource.entering("getAllPMCMPIObjPaths", serviceClass.pathsParameters()),
                               factorySource.message(6000, "getAllPMCMPIObjPaths", "***No ObjPaths found***"));
    expectOk(enumInstanceNames());
    EXPECT_CALLS(namesOpened(), failed, message("EnumInstanceNames", tested.names.noServices));
    EXPECT_EQ(returned.closed, 0);
    transcript.clear();
    expectOk(enumInstances());
    EXPECT_CALLS(opened("EnumInstances"), failed, builderMessage(tested.instances.noServices), closed("EnumInstances"));
    transcript.clear();
    askForInstances({1});
    expectOk(getInstance());
    EXPECT_CALLS(opened("GetInstance", {"ref.getKeyCount() -> 2"}), failed, builderMessage(tested.instances.noServices),
                 closed("GetInstance"));
    EXPECT_TRUE(returned.paths.empty());
    EXPECT_TRUE(returned.instances.empty());
    EXPECT_EQ(returned.closed, 2);
}

TEST_P(Pairs, InstancesHaveThePropertiesThatAreAskedFor) {
    have(2, 2);
    expectOk(enumInstances(properties));
    EXPECT_CALLS(opened("EnumInstances"), built("{ElementName}"), returnedInstances(4), closed("EnumInstances"));
}

TEST_P(Pairs, StayInTheNamespaceOfTheRequest) {
    have(2, 2);
    ref = broker.path("ref", "root/interop", className());
    expectOk(enumInstanceNames());
    expectOk(enumInstances());
    EXPECT_THAT(transcript.calls(), testing::Contains(testing::HasSubstr("\"root/interop\"")));
    EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("\"root/cimv2\""))));
}

/* Failures on the way */

/** Every path that the walk makes, made to fail. */
struct Refusal {
    int path;
    std::string line;
    /** The factory's message, where it is the factory's path. */
    Lines factoryMessage;
    std::string namesText;
    std::string instancesText;
};

std::vector<Refusal> refusalsIn(const Lines& walk, const Association& association) {
    std::vector<Refusal> refusals;
    for (const std::string& line : walk) {
        const int path = static_cast<int>(refusals.size()) + 1;
        const auto is = [&](const std::string& className) { return line == newPath(path, className); };
        const std::string noCapabilities = "***Can't get ObjectPaths for PowerManagementCapabilities.                 "
                                           "Exiting EnumerateInstanceNames***";
        const std::string noSystem = "Create CMPIObjectPath failed for ComputerSystemClass.";
        if (is("TALVO_ComputerSystem")) {
            refusals.push_back({path, line, {}, noSystem, noSystem});
        } else if (is("TALVO_PowerManagementService")) {
            const std::string made = factorySource.message(6000, serviceClass.getAllPaths, serviceClass.noPath);
            refusals.push_back({path, line, {made}, association.names.noServices, association.instances.noServices});
        } else if (is("TALVO_PowerManagementCapabilities")) {
            const std::string made =
                factorySource.message(6000, capabilitiesClass.getAllPaths, capabilitiesClass.noPath);
            refusals.push_back({path, line, {made}, noCapabilities, noCapabilities});
        } else if (is(association.className)) {
            refusals.push_back({path, line, {}, association.names.noPath, association.instances.noPath});
        }
    }
    return refusals;
}

std::string refused(const Refusal& refusal, Fault::Object object) {
    return object == Fault::Object::null ? refusal.line.substr(0, refusal.line.find("path#")) + "null"
                                         : refusal.line + " without handle";
}

TEST_P(Pairs, AnyPathThatCannotBeMadeEndsTheNames) {
    have(2, 2);
    const std::vector<Refusal> refusals = refusalsIn(pairs(true), tested);
    EXPECT_GE(refusals.size(), 8);
    for (const Refusal& refusal : refusals) {
        const bool hasOwnStatus = &tested == &elementCapabilities && refusal.namesText == tested.names.noPath;
        for (const Fault::Object object : {Fault::Object::null, Fault::Object::withoutHandle}) {
            SCOPED_TRACE(refused(refusal, object));
            forget();
            Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
            fault.object = object;
            broker.faults.at("newObjectPath", static_cast<unsigned int>(refusal.path), fault);
            const CMPIStatus status = enumInstanceNames();
            Lines expected = lines(namesOpened(), before(pairs(true), refusal.line), refused(refusal, object),
                                   refusal.factoryMessage, message("EnumInstanceNames", refusal.namesText));
            if (hasOwnStatus) {
                const std::string text =
                    "Create CMPIObjectPath failed for                     PowerManagementElementCapabilities";
                expected =
                    lines(expected, "broker.newString(\"" + text + "\") -> string#1, no status",
                          "broker.trace(1, \"PowerManagementElementCapabilitiesProvider\", \"" + text + ".\", null)");
                EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
                EXPECT_EQ(transcript.nameOf(status.msg), "string#1");
            } else {
                EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
                EXPECT_EQ(status.msg, fault.message);
            }
            EXPECT_TRUE(sameLines(expected, calls()));
        }
    }
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(Pairs, AnyPathThatCannotBeMadeLeavesNoInstancesAndNoError) {
    have(2, 2);
    for (const Refusal& refusal : refusalsIn(pairs(false), tested)) {
        for (const Fault::Object object : {Fault::Object::null, Fault::Object::withoutHandle}) {
            SCOPED_TRACE(refused(refusal, object));
            forget();
            Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
            fault.object = object;
            broker.faults.at("newObjectPath", static_cast<unsigned int>(refusal.path), fault);
            expectOk(enumInstances());
            EXPECT_CALLS(opened("EnumInstances"), before(pairs(false), refusal.line), refused(refusal, object),
                         refusal.factoryMessage, builderMessage(refusal.instancesText), closed("EnumInstances"));
        }
    }
    EXPECT_TRUE(returned.instances.empty());
}

TEST_P(SystemPairs, AnUpCallThatFailsEndsTheWalk) {
    have(2, 2);
    const std::string text = "CBEnumInstanceNames Failed for the target Class";
    for (int occurrence = 1; occurrence <= (tested.first.element == nullptr ? 1 : 2); ++occurrence) {
        const std::pair<Fault::Object, std::string> outcomes[] = {
            {Fault::Object::usual, ""}, {Fault::Object::null, "null"}, {Fault::Object::withoutHandle, ""}};
        for (const auto& [object, shown] : outcomes) {
            SCOPED_TRACE(testing::Message() << "up-call " << occurrence << ' ' << shown);
            const Lines walk = pairs(true);
            const std::string enumeration = numbered("enumeration", occurrence);
            const auto line = std::find_if(walk.begin(), walk.end(), [&](const std::string& each) {
                return each.find("broker.enumerateInstanceNames") == 0 && each.find(enumeration) != std::string::npos;
            });
            std::string outcome = *line;
            if (object == Fault::Object::null) {
                outcome.replace(outcome.find(enumeration), enumeration.size(), "null");
            } else if (object == Fault::Object::withoutHandle) {
                outcome += " without handle";
            }
            Fault fault = reports(CMPI_RC_ERR_INVALID_CLASS, broker.string("reason", "no such class"));
            fault.object = object;
            forget();
            broker.faults.at("enumerateInstanceNames", static_cast<unsigned int>(occurrence), fault);
            const CMPIStatus status = enumInstanceNames();
            EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_CLASS);
            EXPECT_EQ(status.msg, fault.message);
            EXPECT_CALLS(namesOpened(), before(pairs(true), *line), outcome, message("EnumInstanceNames", text));
            forget();
            broker.faults.at("enumerateInstanceNames", static_cast<unsigned int>(occurrence), fault);
            expectOk(enumInstances());
            EXPECT_CALLS(opened("EnumInstances"), before(pairs(false), *line), outcome, builderMessage(text),
                         closed("EnumInstances"));
        }
    }
    EXPECT_TRUE(returned.instances.empty());
}

TEST_P(SystemPairs, AnUpCallThatReturnsNothingButSucceedsYieldsNoPairs) {
    have(2, 2);
    broker.faults.always("enumerateInstanceNames", nullObject(CMPI_RC_OK));
    expectOk(enumInstanceNames());
    expectOk(enumInstances());
    EXPECT_TRUE(returned.paths.empty());
    EXPECT_TRUE(returned.instances.empty());
    EXPECT_EQ(returned.closed, 2);
}

TEST_P(SystemPairs, AnEnumerationThatEndsEarlyYieldsWhatItHad) {
    have(1, 3);
    broker.faults.at("getNext", 2, nullObject());
    enumInstanceNames();
    EXPECT_EQ(returned.paths.size(), 3);
    EXPECT_THAT(returned.paths, testing::Each(testing::NotNull()));
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, AServicePathThatHoldsNothingEndsTheWalk) {
    have(2, 2);
    // The last of four keys is added to the second service's path: after that, the path loses what it held.
    const std::string path = tested.first.element == nullptr ? "path#3" : "path#2";
    const auto lose = [&] {
        forget();
        broker.faults.at("addKey", 8, {.action = [this, path] { broker.pathCalled(path)->hdl = nullptr; }});
    };
    // Its namespace would be set for the second time.
    const auto walked = [&](bool asNames) { return before(pairs(asNames), namespaceSet(path), 2); };
    lose();
    expectOk(enumInstanceNames());
    EXPECT_CALLS(namesOpened(), walked(true), message("EnumInstanceNames", tested.names.nullService));
    EXPECT_EQ(returned.closed, 0);
    lose();
    expectOk(enumInstances());
    EXPECT_CALLS(opened("EnumInstances"), walked(false), builderMessage(tested.instances.nullService),
                 closed("EnumInstances"));
    EXPECT_TRUE(returned.instances.empty());
}

TEST_P(Pairs, InstancesThatHoldNothingAreReturnedAsTheyAre) {
    have(2, 2);
    broker.faults.at("newInstance", 1, nullObject());
    broker.faults.at("newInstance", 2, objectWithoutHandle());
    expectOk(enumInstances());
    ASSERT_EQ(returned.instances.size(), 4);
    EXPECT_EQ(returned.instances[0], nullptr);
    EXPECT_EQ(returned.instances[1]->hdl, nullptr);
    EXPECT_NE(returned.instances[2]->hdl, nullptr);
    EXPECT_NE(returned.instances[3]->hdl, nullptr);
    EXPECT_EQ(returned.closed, 1);
    EXPECT_THAT(calls(), testing::Contains(testing::HasSubstr("setPropertyFilter(")).Times(2));
}

/* GetInstance */

TEST_P(Pairs, WithoutKeysTheResultIsEmptyAndClosed) {
    have(1, 1);
    expectOk(getInstance());
    EXPECT_CALLS(entry("GetInstance"), discovery(), "ref.getKeyCount() -> 0", message("GetInstance", noKeys),
                 closed("GetInstance"));
}

TEST_P(Pairs, WithoutKeysTheStatusIsThatOfTheCount) {
    const Fault fault = reports(CMPI_RC_ERR_INVALID_HANDLE, broker.string("reason", "no path"));
    broker.faults.always("getKeyCount", fault);
    const CMPIStatus status = getInstance();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_EQ(status.msg, fault.message);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, TheFirstInstanceWithTheRequestedPathIsReturned) {
    have(2, 2);
    askForInstances({3, 4});
    expectOk(getInstance());
    EXPECT_CALLS(opened("GetInstance", {"ref.getKeyCount() -> 2"}), built(), compared(1, false), compared(2, false),
                 compared(3, true), "result.returnInstance(instance#3)", closed("GetInstance"));
}

TEST_P(Pairs, TheInstanceFoundHasThePropertiesThatAreAskedFor) {
    have(1, 1);
    askForInstances({1});
    expectOk(getInstance(properties));
    EXPECT_CALLS(opened("GetInstance", {"ref.getKeyCount() -> 2"}), built("{ElementName}"), compared(1, true),
                 "result.returnInstance(instance#1)", closed("GetInstance"));
}

TEST_P(Pairs, AnAssociationThatDoesNotExistIsNoError) {
    have(2, 1);
    askForInstances({});
    const int count = static_cast<int>(pairCount());
    expectOk(getInstance());
    Lines comparisons;
    for (int number = 1; number <= count; ++number) {
        comparisons = lines(comparisons, compared(number, false));
    }
    EXPECT_CALLS(opened("GetInstance", {"ref.getKeyCount() -> 2"}), built(), comparisons, closed("GetInstance"));
    EXPECT_TRUE(returned.instances.empty());
}

TEST_P(SystemPairs, WhereThereAreNoPairsNothingIsFound) {
    have(2, 0);
    askForInstances({1});
    expectOk(getInstance());
    EXPECT_CALLS(opened("GetInstance", {"ref.getKeyCount() -> 2"}), built(), closed("GetInstance"));
}

TEST_P(Pairs, InstancesThatHoldNothingAreNotCompared) {
    have(2, 2);
    broker.faults.at("newInstance", 1, nullObject());
    broker.faults.at("newInstance", 2, objectWithoutHandle());
    askForInstances({1, 2, 3});
    expectOk(getInstance());
    EXPECT_THAT(calls(), testing::Contains(testing::StartsWith("isObjPathsEqual(")).Times(1));
    // The first has no number: what was made without handle is number 1.
    EXPECT_THAT(calls(), testing::Contains("result.returnInstance(instance#2)"));
    EXPECT_EQ(returned.instances.size(), 1);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, WhatCannotBeBuiltIsNotFound) {
    have(2, 2);
    askForInstances({1});
    broker.faults.at("newObjectPath", 1, nullObject());
    expectOk(getInstance());
    EXPECT_THAT(calls(), testing::Not(testing::Contains(testing::StartsWith("isObjPathsEqual("))));
    EXPECT_TRUE(returned.instances.empty());
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, TheStatusIsThatOfTheLastPathCompared) {
    have(2, 2);
    askForInstances({2});
    broker.faults.at("getObjectPath", 2, reports(CMPI_RC_ERR_INVALID_CLASS));
    EXPECT_EQ(getInstance().rc, CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(returned.instances.size(), 1);
    EXPECT_EQ(returned.closed, 1);
    forget();
    askForInstances({2});
    broker.faults.at("getObjectPath", 1, reports(CMPI_RC_ERR_INVALID_CLASS));
    expectOk(getInstance());
}

/* Status and counts */

TEST_P(Pairs, NamesReturnTheStatusOfTheLastCall) {
    have(2, 2);
    const Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
    for (const char* slot : {"newObjectPath", "getNameSpace", "hasNext", "getNext"}) {
        broker.faults.always(slot, fault);
    }
    const CMPIStatus status = enumInstanceNames();
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(status.msg, fault.message);
    EXPECT_EQ(returned.paths.size(), 4);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, InstancesAreAlwaysFine) {
    have(2, 2);
    for (const char* slot : {"newObjectPath", "newInstance", "getNameSpace", "hasNext", "getNext", "setProperty",
                             "setPropertyFilter", "returnInstance", "returnDone"}) {
        broker.faults.always(slot, reports(CMPI_RC_ERR_ACCESS_DENIED));
    }
    expectOk(enumInstances());
    EXPECT_EQ(returned.instances.size(), 4);
    EXPECT_EQ(returned.closed, 1);
}

TEST_P(Pairs, AreCountedInSixteenBits) {
    haveMany(65537);
    haveSystems(1);
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), 1);
    agent.nodes.pop_back();
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), 1);
    EXPECT_EQ(returned.closed, 2);
}

TEST_P(SystemPairs, InstancesAreCountedInSixteenBitsButComputerSystemsAreNot) {
    haveRecords(1);
    transcript.pause();
    haveSystems(65539);
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), 65539);
    expectOk(enumInstances(properties));
    EXPECT_EQ(returned.instances.size(), 3);
}

TEST_F(CapabilitiesPairs, InstancesAreCountedInSixteenBits) {
    haveMany(257);
    expectOk(enumInstances(properties));
    EXPECT_EQ(returned.instances.size(), 257 * 257 - 65536);
    std::size_t comparisons = 0;
    askForInstances({});
    agent.pathsEqual = [&](const CMPIObjectPath*, const CMPIObjectPath*, bool) {
        ++comparisons;
        return false;
    };
    expectOk(getInstance(properties));
    EXPECT_EQ(comparisons, 257 * 257 - 65536);
}

/* What every operation has in common */

TEST_P(Pairs, EveryOperationReadsTheTreeAfresh) {
    have(1, 1);
    expectOk(enumInstanceNames());
    haveRecords(2);
    expectOk(enumInstanceNames());
    EXPECT_EQ(returned.paths.size(), hasSystems() ? 3 : 5);
}

TEST_P(Pairs, BrokerObjectsAreNotReleased) {
    have(2, 2);
    askForInstances({1});
    enumInstanceNames();
    enumInstances();
    getInstance();
    EXPECT_THAT(transcript.everything(), testing::Each(testing::Not(testing::HasSubstr("release"))));
}

TEST_P(Pairs, ExceptionsPassWithoutExitMark) {
    have(2, 2);
    askForInstances({4});
    for (const char* slot : {"getKeyCount", "getNameSpace", "newObjectPath", "setNameSpace", "setHostname",
                             "newInstance", "setPropertyFilter", "setProperty", "getObjectPath", "returnInstance"}) {
        forget();
        broker.faults.at(slot, 1, throws(std::out_of_range(slot)));
        EXPECT_THROW(getInstance(), std::out_of_range) << slot;
        EXPECT_THAT(
            transcript.calls(),
            testing::Not(testing::Contains(testing::HasSubstr(tested.operation("GetInstance") + "() in ")).Times(2)))
            << slot;
        EXPECT_EQ(agent.messageBuffers, 0) << slot;
    }
    forget();
    broker.faults.at("returnObjectPath", 2, throws(42));
    EXPECT_THROW(enumInstanceNames(), int);
    EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("markProviderExit"))));
    EXPECT_EQ(returned.closed, 0);
}

} // namespace
} // namespace OrvTest

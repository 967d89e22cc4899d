/**
 * Associators, AssociatorNames, References and ReferenceNames of the three associations, from either end. The
 * associations' differences are data.
 */
#include "Associations.h"

#include <algorithm>
#include <cctype>
#include <stdexcept>

namespace OrvTest {
namespace {

const std::string operations[] = {"AssociatorNames", "Associators", "ReferenceNames", "References"};

/** An association and the end that lies far from the source. */
struct Direction {
    const Association* association;
    bool toFirst;
};

class Traversal : public AssociationFixture, public testing::WithParamInterface<Direction> {
protected:
    Traversal() : AssociationFixture(*GetParam().association) { comeFrom(near); }

    /** The number of objects at the far end; services and capabilities are called "a" and "b". */
    void haveFarObjects(int count) {
        if (far.element == nullptr) {
            haveRecords();
            haveSystems(count);
        } else if (count > 0) {
            haveRecords(count);
        }
    }

    bool isReference(const std::string& operation) const { return operation.find("Reference") == 0; }
    bool returnsNames(const std::string& operation) const { return operation.find("Names") != std::string::npos; }

    /** The operation's beginning, up to where it looks for the objects at the far end. */
    Lines opened(const std::string& operation, const char* resultClass = nullptr) const {
        return lines(opening(operation, far, resultClass),
                     isReference(operation) ? Lines{newPath(2, className())} : Lines());
    }

    /** The capabilities have a factory of their own. */
    Lines ownFactory() const {
        if (far.element != &capabilitiesClass) {
            return {};
        }
        return agent.nodes.empty() ? failedDiscovery() : discovery();
    }

    /** What comes before each object from the object manager. */
    Lines nextIs(const std::string& object) const {
        return far.element == nullptr ? Lines{"enumeration#1.getNext() -> " + object} : Lines();
    }

    /** The paths of all objects at the far end are got; `made` paths were made before. */
    Lines pathsGot(int made) const {
        return far.element == nullptr
                   ? Lines{"broker.enumerateInstanceNames(context, path#1) -> enumeration#1"}
                   : lines(ownFactory(), far.element->allPaths(nodes, {.ref = "path#1", .paths = made}));
    }

    /** The paths that `pathsGot` got. */
    Lines farPaths(int made) const {
        if (far.element == nullptr) {
            return systems;
        }
        Lines paths;
        for (std::size_t i = 0; i < nodes.size(); ++i) {
            paths.push_back(numbered("path", ++made));
        }
        return paths;
    }

    Lines associatorNamesReturned() const {
        Lines walk = pathsGot(1);
        for (const std::string& path : farPaths(1)) {
            walk = lines(walk, nextIs(path), far.namesPlaced ? Lines{namespaceSet(path), hostSet(path)} : Lines(),
                         "result.returnObjectPath(" + path + ')');
        }
        return walk;
    }

    Lines associatorsReturned() const {
        Lines walk;
        if (far.element == nullptr) {
            walk = {"broker.enumerateInstances(context, path#1, null) -> enumeration#1"};
            for (const std::string& system : systems) {
                const std::string instance = system + ".instance";
                walk = lines(walk, nextIs(instance), "result.returnInstance(" + instance + ')');
            }
            return walk;
        }
        walk = lines(ownFactory(), far.element->allInstances(nodes, {.ref = "path#1", .paths = 1}));
        for (std::size_t i = 1; i <= nodes.size(); ++i) {
            walk.push_back("result.returnInstance(" + numbered("instance", static_cast<int>(i)) + ')');
        }
        return walk;
    }

    Lines referenceNamesReturned() const {
        Lines walk = pathsGot(2);
        int number = 0;
        for (const std::string& path : farPaths(2)) {
            const std::string instance = numbered("instance", ++number);
            walk = lines(walk, nextIs(path), "broker.newInstance(path#2) -> " + instance,
                         far.element == nullptr ? Lines() : Lines{namespaceSet(path), hostSet(path)},
                         endsSet(instance, far, path), instance + ".getObjectPath() -> " + instance + ".path",
                         namespaceSet(instance + ".path"), "result.returnObjectPath(" + instance + ".path)");
        }
        return walk;
    }

    /** The ends of a reference are set, and the power states of the records in turn or of the first. */
    Lines referenceFilled(const std::string& instance, const std::string& farPath) const {
        if (!tested.hasPowerStates) {
            return endsSet(instance, far, farPath);
        }
        const Lines first = lines(endsSet(instance, far, farPath), statesSet(instance, 2));
        return far.element != nullptr || nodes.size() == 1
                   ? first
                   : lines(first, endsSet(instance, far, farPath), statesSet(instance, 7));
    }

    Lines referencesReturned(bool hasList = false) const {
        Lines walk;
        int number = 0;
        if (far.element == nullptr) {
            walk = pathsGot(2);
            for (const std::string& path : farPaths(2)) {
                const std::string instance = numbered("instance", ++number);
                walk = lines(walk, nextIs(path), "broker.newInstance(path#2) -> " + instance,
                             referenceFilled(instance, path), "result.returnInstance(" + instance + ')');
            }
            return walk;
        }
        const Place place = {.ref = "path#1", .paths = 2};
        walk =
            lines(ownFactory(), hasList || tested.referencesWantPaths ? far.element->allInstancesForPaths(nodes, place)
                                                                      : far.element->allInstances(nodes, place));
        for (std::size_t i = 0; i < nodes.size(); ++i) {
            const std::string path = numbered("instance", ++number) + ".path";
            const std::string instance = numbered("instance", number + static_cast<int>(nodes.size()));
            walk = lines(walk, numbered("instance", number) + ".getObjectPath() -> " + path, namespaceSet(path),
                         hostSet(path), "broker.newInstance(path#2) -> " + instance, referenceFilled(instance, path),
                         "result.returnInstance(" + instance + ')');
        }
        return walk;
    }

    Lines returnedBy(const std::string& operation) const {
        if (operation == "AssociatorNames") {
            return associatorNamesReturned();
        }
        if (operation == "Associators") {
            return associatorsReturned();
        }
        return operation == "ReferenceNames" ? referenceNamesReturned() : referencesReturned();
    }

    void expectWhole(const std::string& operation) {
        const CMPIStatus status = traverse(operation);
        SCOPED_TRACE(operation);
        expectOk(status);
        EXPECT_TRUE(sameLines(lines(opened(operation), returnedBy(operation), exit(operation)), calls()));
    }

    /** The call that asks for what lies at the far end, as it fails. */
    std::string askedInVain(const std::string& operation, const std::string& outcome) const {
        return (operation == "Associators" ? "broker.enumerateInstances(context, path#1, null) -> "
                                           : "broker.enumerateInstanceNames(context, path#1) -> ") +
               outcome;
    }

    void forget() {
        broker.faults.clear();
        agent.faults.clear();
        transcript.clear();
    }

    std::size_t returnedCount() const { return returned.paths.size() + returned.instances.size(); }

    const End& far = GetParam().toFirst ? tested.first : tested.second;
    const End& near = otherEnd(far);
};

std::string nameOf(const testing::TestParamInfo<Direction>& info) {
    const Association& association = *info.param.association;
    return association.prefix + "To" + (info.param.toFirst ? association.first : association.second).property;
}

INSTANTIATE_TEST_SUITE_P(Associations, Traversal,
                         testing::Values(Direction{&associatedService, true}, Direction{&associatedService, false},
                                         Direction{&elementCapabilities, true}, Direction{&elementCapabilities, false},
                                         Direction{&hostedService, true}, Direction{&hostedService, false}),
                         nameOf);

/** Services and capabilities are this library's own. */
class TraversalToOwnObjects : public Traversal {};

INSTANTIATE_TEST_SUITE_P(Associations, TraversalToOwnObjects,
                         testing::Values(Direction{&associatedService, true}, Direction{&elementCapabilities, true},
                                         Direction{&elementCapabilities, false}, Direction{&hostedService, false}),
                         nameOf);

/** Computer systems come through the object manager. */
class TraversalToComputerSystems : public Traversal {};

INSTANTIATE_TEST_SUITE_P(Associations, TraversalToComputerSystems,
                         testing::Values(Direction{&associatedService, false}, Direction{&hostedService, true}),
                         nameOf);

/* What is returned */

TEST_P(Traversal, ReturnsTheOneObjectAtTheFarEnd) {
    haveFarObjects(1);
    for (const std::string& operation : operations) {
        transcript.clear();
        expectWhole(operation);
    }
    EXPECT_EQ(returnedCount(), 4);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(Traversal, ReturnsSeveralObjectsInTheirOrder) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        transcript.clear();
        expectWhole(operation);
    }
    EXPECT_EQ(returnedCount(), 8);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(TraversalToOwnObjects, NodesWithEqualPathsAreOneObject) {
    agent.nodes = {{"a", 8U, {}}, {"a", 1U, {}}};
    nodes = {"a"};
    for (const std::string& operation : operations) {
        transcript.clear();
        expectWhole(operation);
    }
}

TEST_P(TraversalToComputerSystems, TheNumberOfNodesDoesNotChangeWhatComesThroughTheObjectManager) {
    haveRecords(1);
    haveSystems(3);
    for (const std::string& operation : operations) {
        transcript.clear();
        expectWhole(operation);
    }
    EXPECT_EQ(returned.paths.size(), 6);
    EXPECT_EQ(returned.instances.size(), 6);
}

TEST_P(Traversal, ThePropertyListGoesToTheInstancesOfThisLibrary) {
    haveFarObjects(1);
    expectOk(traverse("Associators", properties));
    if (far.element == nullptr) {
        EXPECT_TRUE(sameLines(lines(opened("Associators"), associatorsReturned(), exit("Associators")), calls()));
        return;
    }
    const std::string parameters = far.element->instancesParameters("&properties", "path#1");
    EXPECT_THAT(calls(), testing::Contains(factorySource.entering(far.element->getAllInstances, parameters)));
    EXPECT_THAT(calls(), testing::Contains("instance#1.setPropertyFilter({ElementName}, " +
                                           std::string(far.element == &capabilitiesClass
                                                           ? "{InstanceID})"
                                                           : "{CreationClassName, Name, SystemCreationClassName, "
                                                             "SystemName})")));
}

TEST_P(Traversal, ReferencesDoNotFilterButWantPathsOnlyWhereThereIsAPropertyList) {
    haveFarObjects(2);
    expectOk(references(properties));
    EXPECT_TRUE(sameLines(lines(opened("References"), referencesReturned(true), exit("References")), calls()));
}

TEST_P(Traversal, StaysInTheNamespaceOfTheSource) {
    haveFarObjects(2);
    ref = broker.path("ref", "root/interop", near.className, {{"Name", "source"}});
    for (const std::string& operation : operations) {
        transcript.clear();
        expectOk(traverse(operation));
        EXPECT_THAT(transcript.calls(), testing::Contains(testing::HasSubstr("\"root/interop\""))) << operation;
        EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("\"root/cimv2\"")))) << operation;
    }
}

TEST_P(Traversal, RolesDoNotMatter) {
    haveFarObjects(2);
    const std::string wanted = className();
    const auto both = [&](const std::string& operation, const auto& with) {
        transcript.clear();
        traverse(operation);
        const Lines without = transcript.calls();
        transcript.clear();
        expectOk(with());
        EXPECT_TRUE(sameLines(without, transcript.calls())) << operation;
    };
    both("AssociatorNames", [&] {
        return association->ft->associatorNames(association, context, result, ref, wanted.c_str(), nullptr, "NoRole",
                                                "NoResultRole");
    });
    both("Associators", [&] {
        return association->ft->associators(association, context, result, ref, wanted.c_str(), nullptr, "NoRole",
                                            "NoResultRole", nullptr);
    });
    both("ReferenceNames",
         [&] { return association->ft->referenceNames(association, context, result, ref, "NoClass", "NoRole"); });
    both("References",
         [&] { return association->ft->references(association, context, result, ref, "NoClass", "NoRole", nullptr); });
}

/* Which association is asked for */

TEST_P(Traversal, WithoutAnAssociationClassThisOneIsMeant) {
    haveFarObjects(2);
    transcript.clear();
    expectOk(associatorNames(nullptr));
    EXPECT_TRUE(
        sameLines(lines(opened("AssociatorNames"), associatorNamesReturned(), exit("AssociatorNames")), calls()));
    transcript.clear();
    expectOk(associators(nullptr));
    EXPECT_TRUE(sameLines(lines(opened("Associators"), associatorsReturned(), exit("Associators")), calls()));
}

TEST_P(Traversal, AForeignOrEmptyAssociationClassHasNoTarget) {
    haveFarObjects(2);
    std::string upper = className();
    std::transform(upper.begin(), upper.end(), upper.begin(), [](unsigned char c) { return std::toupper(c); });
    for (const std::string& foreign : {std::string("CIM_Dependency"), upper, near.className, std::string()}) {
        transcript.clear();
        expectOk(associatorNames(foreign.c_str()));
        EXPECT_TRUE(sameLines(lines(entry("AssociatorNames"), discovery(), targetFound(foreign, nullptr, ""),
                                    message("AssociatorNames", "Object Path is NULL in AssociatorNames.")),
                              calls()));
        transcript.clear();
        expectOk(associators(foreign.c_str()));
        EXPECT_TRUE(sameLines(lines(entry("Associators"), discovery(), targetFound(foreign, nullptr, ""),
                                    message("Associators", tested.noTarget.associators)),
                              calls()));
    }
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(Traversal, AnObjectThatIsNotAtEitherEndHasNoTarget) {
    haveFarObjects(2);
    std::string lower = near.className;
    std::transform(lower.begin(), lower.end(), lower.begin(), [](unsigned char c) { return std::tolower(c); });
    const std::string unrelated[] = {className(), "CIM_ManagedElement", "CIM_" + near.className.substr(6), lower, ""};
    for (const std::string& source : unrelated) {
        ref = broker.path("ref", "root/cimv2", source);
        for (const std::string& operation : operations) {
            transcript.clear();
            expectOk(traverse(operation));
            SCOPED_TRACE(operation + " from " + source);
            EXPECT_TRUE(sameLines(lines(entry(operation), discovery(), targetFound(className(), nullptr, ""),
                                        isReference(operation) ? Lines{newPath(1, className())} : Lines(),
                                        message(operation, tested.noTarget.of(operation))),
                                  calls()));
        }
    }
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(Traversal, ATargetThatIsNotAtTheFarEndYieldsNothing) {
    haveFarObjects(2);
    // From a service, some other association leads to a class that this one does not link.
    comeFrom(near.element == &serviceClass ? near : far);
    const bool isElement = &tested == &elementCapabilities;
    const std::string other = (isElement ? hostedService : elementCapabilities).className;
    const std::string target = isElement ? "TALVO_ComputerSystem" : "TALVO_PowerManagementCapabilities";
    transcript.clear();
    expectOk(associatorNames(other.c_str()));
    EXPECT_TRUE(sameLines(
        lines(entry("AssociatorNames"), discovery(), targetFound(other, nullptr, target), exit("AssociatorNames")),
        calls()));
    transcript.clear();
    expectOk(associators(other.c_str()));
    EXPECT_TRUE(sameLines(
        lines(entry("Associators"), discovery(), targetFound(other, nullptr, target), exit("Associators")), calls()));
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(Traversal, AnEmptySourceHasNoTarget) {
    haveFarObjects(1);
    for (const std::string& operation : operations) {
        forget();
        broker.faults.at("getClassName", 1, nullObject(CMPI_RC_OK));
        expectOk(traverse(operation));
        EXPECT_EQ(calls().back(), message(operation, tested.noTarget.of(operation)));
    }
    EXPECT_EQ(returnedCount(), 0);
}

TEST_P(Traversal, ATargetThatCannotBeMadeIsReported) {
    haveFarObjects(1);
    for (const Fault& fault : {nullObject(CMPI_RC_ERR_ACCESS_DENIED), objectWithoutHandle(CMPI_RC_ERR_ACCESS_DENIED)}) {
        for (const std::string& operation : operations) {
            forget();
            broker.faults.at("newObjectPath", 1, fault);
            const CMPIStatus status = traverse(operation);
            EXPECT_EQ(calls().back(), message(operation, tested.noTarget.of(operation)));
            // The path of the association, where it is made, comes after the failure.
            EXPECT_EQ(status.rc, isReference(operation) ? CMPI_RC_OK : CMPI_RC_ERR_ACCESS_DENIED) << operation;
        }
    }
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

/* Where there is nothing at the far end, or it cannot be got */

TEST_P(Traversal, WithoutObjectsAtTheFarEnd) {
    haveFarObjects(0);
    for (const std::string& operation : operations) {
        SCOPED_TRACE(operation);
        transcript.clear();
        expectOk(traverse(operation));
        if (far.element == nullptr) {
            EXPECT_TRUE(
                sameLines(lines(opened(operation), askedInVain(operation, "enumeration#1"), exit(operation)), calls()));
            continue;
        }
        const ElementClass& element = *far.element;
        if (returnsNames(operation)) {
            EXPECT_TRUE(sameLines(lines(opened(operation), ownFactory(),
                                        factorySource.entering(element.getAllPaths, element.pathsParameters("path#1")),
                                        factorySource.message(6000, element.getAllPaths, "***No ObjPaths found***"),
                                        message(operation, far.failures.of(operation))),
                                  calls()));
            continue;
        }
        const bool wantPaths = operation == "References" && tested.referencesWantPaths;
        const Lines nothing =
            wantPaths ? element.allInstancesForPaths({}, {"path#1"}) : element.allInstances({}, {"path#1"});
        if (&element == &capabilitiesClass) {
            EXPECT_TRUE(sameLines(lines(opened(operation), ownFactory(), nothing, exit(operation)), calls()));
        } else {
            EXPECT_TRUE(sameLines(lines(opened(operation), nothing,
                                        factorySource.message(6000, element.getAllInstances, "***No instance found***"),
                                        message(operation, far.failures.of(operation))),
                                  calls()));
        }
    }
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(TraversalToComputerSystems, AnUpCallThatFailsIsReported) {
    haveFarObjects(2);
    const std::pair<Fault::Object, std::string> outcomes[] = {
        {Fault::Object::usual, "enumeration#1"},
        {Fault::Object::null, "null"},
        {Fault::Object::withoutHandle, "enumeration#1 without handle"}};
    for (const auto& [object, outcome] : outcomes) {
        for (const std::string& operation : operations) {
            SCOPED_TRACE(operation + ", " + outcome);
            forget();
            Fault fault = reports(CMPI_RC_ERR_INVALID_CLASS, broker.string("reason", "no such class"));
            fault.object = object;
            broker.faults.always("enumerateInstanceNames", fault);
            broker.faults.always("enumerateInstances", fault);
            const CMPIStatus status = traverse(operation);
            EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_CLASS);
            EXPECT_EQ(status.msg, fault.message);
            EXPECT_TRUE(sameLines(lines(opened(operation), askedInVain(operation, outcome),
                                        message(operation, "CBEnumInstanceNames Failed for the target Class")),
                                  calls()));
        }
    }
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(TraversalToComputerSystems, AnUpCallThatReturnsNothingButSucceedsYieldsNothing) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        SCOPED_TRACE(operation);
        forget();
        broker.faults.always("enumerateInstanceNames", nullObject(CMPI_RC_OK));
        broker.faults.always("enumerateInstances", nullObject(CMPI_RC_OK));
        expectOk(traverse(operation));
        EXPECT_TRUE(sameLines(lines(opened(operation), askedInVain(operation, "null"), exit(operation)), calls()));
    }
    EXPECT_EQ(returnedCount(), 0);
}

TEST_P(TraversalToComputerSystems, AnEnumerationThatEndsEarlyYieldsWhatItHad) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        SCOPED_TRACE(operation);
        forget();
        broker.faults.at("getNext", 2, nullObject());
        // It goes on to say that there are more: the third time, there are.
        const std::size_t count = returnedCount();
        traverse(operation);
        EXPECT_EQ(returnedCount(), count + 2);
        EXPECT_EQ(calls().back(), exit(operation).back());
    }
}

TEST_P(TraversalToOwnObjects, APathThatCannotBeMadeAtTheFarEndIsReported) {
    haveFarObjects(2);
    for (const Fault::Object object : {Fault::Object::null, Fault::Object::withoutHandle}) {
        for (const std::string& operation : {operations[0], operations[2]}) {
            SCOPED_TRACE(operation);
            forget();
            Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
            fault.object = object;
            const int made = isReference(operation) ? 3 : 2;
            broker.faults.at("newObjectPath", static_cast<unsigned int>(made + 1), fault);
            const CMPIStatus status = traverse(operation);
            EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
            EXPECT_EQ(status.msg, fault.message);
            const std::string failing = newPath(made + 1, far.element->className);
            const std::string outcome = object == Fault::Object::null
                                            ? failing.substr(0, failing.find("path#")) + "null"
                                            : failing + " without handle";
            EXPECT_TRUE(sameLines(lines(opened(operation), before(returnedBy(operation), failing), outcome,
                                        factorySource.message(6000, far.element->getAllPaths, far.element->noPath),
                                        message(operation, far.failures.of(operation))),
                                  calls()));
        }
    }
    EXPECT_EQ(returnedCount(), 0);
    EXPECT_EQ(returned.closed, 0);
}

TEST_P(TraversalToOwnObjects, AssociatorsThatHoldNothingAreReturnedWhereTheyAreThisLibrarys) {
    haveFarObjects(2);
    broker.faults.at("newInstance", 1, nullObject());
    expectOk(traverse("Associators"));
    ASSERT_EQ(returned.instances.size(), 2);
    EXPECT_EQ(returned.instances[0], nullptr);
    EXPECT_NE(returned.instances[1], nullptr);
}

/* Objects that the broker refuses: the others are returned nevertheless */

TEST_P(Traversal, AReferenceThatCannotBeMadeIsLeftOut) {
    haveFarObjects(2);
    for (const Fault& fault : {nullObject(), objectWithoutHandle()}) {
        for (const std::string operation : {"ReferenceNames", "References"}) {
            SCOPED_TRACE(operation);
            forget();
            const bool makesFarInstances = operation == "References" && far.element != nullptr;
            broker.faults.at("newInstance", makesFarInstances ? 3 : 1, fault);
            const std::size_t count = returnedCount();
            expectOk(traverse(operation));
            EXPECT_EQ(returnedCount(), count + 1);
            EXPECT_EQ(calls().back(), exit(operation).back());
        }
    }
}

TEST_P(Traversal, WithoutThePathOfTheAssociationThereIsNoReference) {
    haveFarObjects(2);
    for (const std::string operation : {"ReferenceNames", "References"}) {
        SCOPED_TRACE(operation);
        forget();
        broker.faults.at("newObjectPath", 2, nullObject());
        traverse(operation);
        EXPECT_THAT(calls(), testing::Contains("broker.newInstance(null) -> null").Times(2));
        EXPECT_EQ(calls().back(), exit(operation).back());
    }
    EXPECT_EQ(returnedCount(), 0);
}

TEST_P(Traversal, AReferenceWithoutPathHasNoName) {
    haveFarObjects(2);
    broker.faults.at("getObjectPath", 1, nullObject(CMPI_RC_OK));
    expectOk(traverse("ReferenceNames"));
    EXPECT_EQ(returned.paths.size(), 1);
    EXPECT_NE(returned.paths[0], nullptr);
}

/* Status and counts */

TEST_P(Traversal, ReturnsTheStatusOfTheLastCall) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        SCOPED_TRACE(operation);
        forget();
        const Fault fault = reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "no"));
        for (const char* slot :
             {"newObjectPath", "newInstance", "newArray", "getObjectPath", "getNameSpace", "hasNext", "getNext"}) {
            broker.faults.always(slot, fault);
        }
        const CMPIStatus status = traverse(operation);
        EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
        EXPECT_EQ(status.msg, fault.message);
        EXPECT_EQ(calls().back(), exit(operation).back());
    }
}

TEST_P(Traversal, LaterCallsReplaceTheStatus) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        SCOPED_TRACE(operation);
        forget();
        broker.faults.at("getClassName", 1, reports(CMPI_RC_ERR_ACCESS_DENIED));
        for (const char* slot : {"setNameSpace", "setHostname", "addKey", "setProperty", "setPropertyFilter",
                                 "returnObjectPath", "returnInstance"}) {
            broker.faults.always(slot, reports(CMPI_RC_ERR_FAILED));
        }
        expectOk(traverse(operation));
        EXPECT_EQ(calls().back(), exit(operation).back());
    }
}

TEST_P(TraversalToOwnObjects, OwnObjectsAreCountedInSixteenBits) {
    haveMany(65537);
    // The two operations of each kind, one from either end.
    const Lines some =
        GetParam().toFirst ? Lines{"AssociatorNames", "References"} : Lines{"ReferenceNames", "Associators"};
    for (const std::string& operation : some) {
        const std::size_t count = returnedCount();
        expectOk(traverse(operation, properties));
        EXPECT_EQ(returnedCount(), count + 1) << operation;
    }
}

TEST_P(TraversalToComputerSystems, TheEndOfTheEnumerationIsTheLastCallThatWritesTheStatus) {
    haveFarObjects(2);
    broker.faults.always("hasNext", reports(CMPI_RC_ERR_ACCESS_DENIED));
    for (const char* operation : {"AssociatorNames", "Associators"}) {
        EXPECT_EQ(traverse(operation).rc, CMPI_RC_ERR_ACCESS_DENIED) << operation;
    }
}

TEST_P(TraversalToComputerSystems, ObjectsOfTheObjectManagerAreAllReturned) {
    haveRecords(1);
    transcript.pause();
    haveSystems(65537);
    expectOk(traverse("AssociatorNames"));
    EXPECT_EQ(returned.paths.size(), 65537);
}

/* What every operation has in common */

TEST_P(Traversal, EveryOperationReadsTheTreeAfresh) {
    haveRecords(1);
    haveSystems(1);
    for (const std::string& operation : operations) {
        transcript.clear();
        traverse(operation);
        EXPECT_THAT(calls(), testing::Contains("Instrumentation()").Times(far.element == &capabilitiesClass ? 2 : 1));
    }
}

TEST_P(Traversal, NothingIsReleasedOrClosed) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        traverse(operation);
    }
    EXPECT_THAT(transcript.everything(), testing::Each(testing::Not(testing::HasSubstr("release"))));
    EXPECT_THAT(transcript.everything(), testing::Each(testing::Not(testing::HasSubstr("returnDone"))));
}

TEST_P(Traversal, ExceptionsPassWithoutExitMark) {
    haveFarObjects(2);
    for (const std::string& operation : operations) {
        for (const char* slot : {"getClassName", "getNameSpace", "newObjectPath", "setNameSpace", "setHostname"}) {
            forget();
            broker.faults.at(slot, 1, throws(std::out_of_range(slot)));
            EXPECT_THROW(traverse(operation), std::out_of_range) << operation << ' ' << slot;
            EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("markProviderExit"))));
            EXPECT_EQ(agent.messageBuffers, 0) << operation << ' ' << slot;
        }
        forget();
        broker.faults.at(returnsNames(operation) ? "returnObjectPath" : "returnInstance", 2, throws(42));
        EXPECT_THROW(traverse(operation), int) << operation;
        forget();
        agent.faults.at("logLevelMessage", 3, throws(std::runtime_error("the log is gone")));
        EXPECT_THROW(traverse(operation), std::runtime_error) << operation;
    }
}

} // namespace
} // namespace OrvTest

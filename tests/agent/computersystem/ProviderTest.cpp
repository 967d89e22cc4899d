#include "computersystem/IdentifyingFacts.h"

#include "Agent.h"
#include "RecordingBroker.h"
#include "TestSupport.h"
#include "Transcript.h"

#include "cmpimacs.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <pthread.h>
#include <stdexcept>

extern "C" CMPIInstanceMI* ComputerSystemProvider_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

namespace {

using Norv::ComputerSystemProvider::IdentifyingFact;
using Norv::ComputerSystemProvider::identifyingFacts;
using OrvTest::Agent;
using OrvTest::Lines;
using OrvTest::RecordingBroker;
using OrvTest::Transcript;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::EndsWith;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;

constexpr const char* systemClass = "TALVO_ComputerSystem";
constexpr const char* systemName = "managed.example.org";

class Provider : public testing::Test {
public:
    Provider() {
        Agent::instance().reset();
        startOver();
    }
    ~Provider() override { Agent::instance().reset(); }

    /** Begins a new request with the same broker. */
    void startOver() {
        Transcript::instance().clear();
        broker.faults.clear();
        result = broker.result("result");
        reference = broker.path("reference", "root/interop", systemClass);
        systemPath = broker.path("system", "root/interop", systemClass,
                                 {{"CreationClassName", systemClass}, {"Name", systemName}});
    }

    CMPIStatus enumInstanceNames() { return mi->ft->enumerateInstanceNames(mi, context, result, reference); }
    CMPIStatus enumInstances() { return mi->ft->enumerateInstances(mi, context, result, reference, nullptr); }
    CMPIStatus getInstance() { return mi->ft->getInstance(mi, context, result, systemPath, nullptr); }

    const RecordingBroker::Returned& returned() const { return broker.returned(result); }

    static std::string messageOf(const CMPIStatus& status) {
        return status.msg == nullptr ? "" : CMGetCharPtr(status.msg);
    }

    /** Expects that the operation left its result open and reported the reason. */
    void expectFailure(const CMPIStatus& status, CMPIrc code, const std::string& message) {
        EXPECT_EQ(returned().closed, 0U);
        expectReport(status, code, message);
    }

    /** Expects that the operation reported the reason once to its caller and once to the log. */
    void expectReport(const CMPIStatus& status, CMPIrc code, const std::string& message) {
        EXPECT_EQ(status.rc, code);
        EXPECT_THAT(messageOf(status), HasSubstr(message));
        EXPECT_THAT(records(),
                    ElementsAre(MatchesRegex("log 6000 Corvane\\.ComputerSystemProvider "
                                             "ComputerSystem_(EnumInstanceNames|EnumInstances|GetInstance) "
                                             "agent/computersystem/ComputerSystemProvider\\.cpp:[0-9]+: .*")));
        if (status.msg != nullptr) {
            EXPECT_THAT(records(), ElementsAre(HasSubstr(": " + messageOf(status))));
        }
    }

    static Lines records() {
        Lines records;
        for (const std::string& line : Transcript::instance().calls()) {
            if (line.starts_with("log ") || line.starts_with("trace ") || line.starts_with("log+trace ")) {
                records.push_back(line);
            }
        }
        return records;
    }

    RecordingBroker broker;
    CMPIContext* context = broker.context("context");
    CMPIResult* result = nullptr;
    CMPIObjectPath* reference = nullptr;
    CMPIObjectPath* systemPath = nullptr;
    CMPIInstanceMI* mi = ComputerSystemProvider_Create_InstanceMI(&broker, nullptr, nullptr);
};

/* What it answers */

/** Making the path of the one system. */
const Lines pathMade = {
    "broker.newObjectPath(\"root/interop\", \"TALVO_ComputerSystem\") -> path#1",
    "path#1.setHostname(\"managed.example.org\")",
    "path#1.addKey(CreationClassName, CMPI_chars, \"TALVO_ComputerSystem\")",
    "path#1.addKey(Name, CMPI_chars, \"managed.example.org\")",
};

/** Setting one text of each of the machine's facts, if it has any; `set` is the number of such properties before. */
Lines textsSet(const std::string& property, std::size_t set, std::string IdentifyingFact::*text) {
    const std::vector<IdentifyingFact> facts = identifyingFacts();
    const std::string array = "array#" + std::to_string(2 + set);
    Lines lines;
    if (!facts.empty()) {
        lines.push_back("broker.newArray(" + std::to_string(facts.size()) + ", CMPI_string) -> " + array);
        for (std::size_t i = 0; i < facts.size(); ++i) {
            const std::string value = '"' + facts[i].*text + '"';
            lines.push_back("broker.newString(" + value + ") -> string#" + std::to_string(set * facts.size() + i + 1));
            lines.push_back(array + ".setElementAt(" + std::to_string(i) + ", CMPI_string, " + value + ')');
        }
        lines.push_back("instance#1.setProperty(" + property + ", CMPI_stringA, " + array + ')');
    }
    return lines;
}

Lines operator+(Lines left, const Lines& right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

/** Making the instance of the one system, and returning it. */
Lines instanceReturned(const std::string& properties) {
    return pathMade +
           Lines{
               "broker.newInstance(path#1) -> instance#1",
               "instance#1.setPropertyFilter(" + properties + ", {CreationClassName, Name})",
               "instance#1.setProperty(CreationClassName, CMPI_chars, \"TALVO_ComputerSystem\")",
               "instance#1.setProperty(Name, CMPI_chars, \"managed.example.org\")",
               "instance#1.setProperty(ElementName, CMPI_chars, \"managed.example.org\")",
               "instance#1.setProperty(NameFormat, CMPI_chars, \"IP\")",
               "instance#1.setProperty(EnabledState, CMPI_uint16, 2)",
               "instance#1.setProperty(RequestedState, CMPI_uint16, 12)",
               "broker.newArray(1, CMPI_uint16) -> array#1",
               "array#1.setElementAt(0, CMPI_uint16, 0)",
               "instance#1.setProperty(Dedicated, CMPI_uint16A, array#1)",
           } +
           textsSet("OtherIdentifyingInfo", 0, &IdentifyingFact::value) +
           textsSet("IdentifyingDescriptions", 1, &IdentifyingFact::description) +
           Lines{"result.returnInstance(instance#1)", "result.returnDone()"};
}

TEST_F(Provider, NamesTheOneSystemInTheNamespaceOfTheRequest) {
    EXPECT_EQ(enumInstanceNames().rc, CMPI_RC_OK);
    EXPECT_THAT(Transcript::instance().calls(),
                ElementsAreArray(pathMade + Lines{"result.returnObjectPath(path#1)", "result.returnDone()"}));
}

TEST_F(Provider, EnumeratesTheOneSystem) {
    EXPECT_EQ(enumInstances().rc, CMPI_RC_OK);
    EXPECT_THAT(Transcript::instance().calls(), ElementsAreArray(instanceReturned("null")));
}

TEST_F(Provider, GetsTheOneSystem) {
    EXPECT_EQ(getInstance().rc, CMPI_RC_OK);
    EXPECT_THAT(Transcript::instance().calls(),
                ElementsAreArray(Lines{"system.getClassName() -> system.class",
                                       "system.getKey(CreationClassName) -> \"TALVO_ComputerSystem\"",
                                       "system.getKey(Name) -> \"managed.example.org\"", "system.getKeyCount() -> 2"} +
                                 instanceReturned("null")));
}

TEST_F(Provider, GetsTheSystemWhateverTheLetterCaseOfItsClass) {
    CMSetClassName(systemPath, "talvo_computersystem");
    EXPECT_EQ(getInstance().rc, CMPI_RC_OK);
    EXPECT_EQ(returned().closed, 1U);
}

TEST_F(Provider, HandsPropertyListsToTheBroker) {
    const char* properties[] = {"ElementName", "Dedicated", nullptr};
    EXPECT_EQ(mi->ft->enumerateInstances(mi, context, result, reference, properties).rc, CMPI_RC_OK);
    EXPECT_EQ(mi->ft->getInstance(mi, context, result, systemPath, properties).rc, CMPI_RC_OK);

    ASSERT_EQ(returned().instances.size(), 2U);
    for (const CMPIInstance* instance : returned().instances) {
        Lines names;
        for (CMPICount i = 0; i < CMGetPropertyCount(instance, nullptr); ++i) {
            CMPIString* name = nullptr;
            CMGetPropertyAt(instance, i, &name, nullptr);
            names.emplace_back(CMGetCharPtr(name));
        }
        EXPECT_THAT(names, ElementsAre("CreationClassName", "Name", "ElementName", "Dedicated"));
    }
}

/* What it refuses */

/** A path of GetInstance, and the code and the beginning of the message that refuse it. */
struct RefusedPath {
    const char* name;
    const char* className;
    std::vector<std::pair<std::string, std::string>> keys;
    CMPIrc code;
    const char* message;
};

void PrintTo(const RefusedPath& path, std::ostream* stream) {
    *stream << path.name;
}

class RefusedPaths : public Provider, public testing::WithParamInterface<RefusedPath> {};

TEST_P(RefusedPaths, AreRefusedWithAReason) {
    systemPath = broker.path("other", "root/interop", GetParam().className, GetParam().keys);
    expectFailure(getInstance(), GetParam().code, GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    All, RefusedPaths,
    testing::Values(
        RefusedPath{"OtherSystem",
                    systemClass,
                    {{"CreationClassName", systemClass}, {"Name", "other"}},
                    CMPI_RC_ERR_NOT_FOUND,
                    "No instance with the Name \"other\". The only one is "
                    "TALVO_ComputerSystem.CreationClassName=\"TALVO_ComputerSystem\",Name=\"managed.example.org\"."},
        RefusedPath{"NameInOtherLetterCase",
                    systemClass,
                    {{"CreationClassName", systemClass}, {"Name", "Managed.Example.Org"}},
                    CMPI_RC_ERR_NOT_FOUND,
                    "No instance with the Name \"Managed.Example.Org\"."},
        RefusedPath{"OtherCreationClass",
                    systemClass,
                    {{"CreationClassName", "CIM_ComputerSystem"}, {"Name", systemName}},
                    CMPI_RC_ERR_NOT_FOUND,
                    "No instance with the CreationClassName \"CIM_ComputerSystem\"."},
        RefusedPath{"OtherClass",
                    "TALVO_PowerManagementCapabilities",
                    {{"InstanceID", "1"}},
                    CMPI_RC_ERR_NOT_FOUND,
                    "No instance with the class \"TALVO_PowerManagementCapabilities\"."},
        RefusedPath{"NoKeys",
                    systemClass,
                    {},
                    CMPI_RC_ERR_INVALID_PARAMETER,
                    "The path of a TALVO_ComputerSystem must have the string key CreationClassName."},
        RefusedPath{"NoName",
                    systemClass,
                    {{"CreationClassName", systemClass}},
                    CMPI_RC_ERR_INVALID_PARAMETER,
                    "The path of a TALVO_ComputerSystem must have the string key Name."},
        RefusedPath{"NoCreationClassName",
                    systemClass,
                    {{"Name", systemName}},
                    CMPI_RC_ERR_INVALID_PARAMETER,
                    "The path of a TALVO_ComputerSystem must have the string key CreationClassName."},
        RefusedPath{"KeyTooMany",
                    systemClass,
                    {{"CreationClassName", systemClass}, {"Name", systemName}, {"Extra", ""}},
                    CMPI_RC_ERR_INVALID_PARAMETER,
                    "The path of a TALVO_ComputerSystem must have the keys CreationClassName and Name only, and this "
                    "one has 3 keys."}),
    [](const auto& test) { return test.param.name; });

TEST_F(Provider, RefusesKeysThatAreNoText) {
    CMPIData notFound = OrvTest::stringValue(nullptr);
    notFound.state = CMPI_notFound;
    for (const CMPIData& data : {OrvTest::uint16Value(1), OrvTest::nullValue(CMPI_string), notFound}) {
        startOver();
        broker.setKey(systemPath, "Name", data);
        broker.faults.at("getKey", 2, OrvTest::reports(CMPI_RC_OK));
        expectFailure(getInstance(), CMPI_RC_ERR_INVALID_PARAMETER, "must have the string key Name.");
    }
}

TEST_F(Provider, TakesAKeyForMissingHoweverTheBrokerSaysSo) {
    for (const CMPIrc code : {CMPI_RC_OK, CMPI_RC_ERR_NOT_FOUND, CMPI_RC_ERR_NO_SUCH_PROPERTY}) {
        startOver();
        broker.faults.at("getKey", 2, OrvTest::nullObject(code));
        expectFailure(getInstance(), CMPI_RC_ERR_INVALID_PARAMETER, "must have the string key Name.");
    }
}

TEST_F(Provider, SupportsNoChangesAndNoQueries) {
    const CMPIInstance* instance = broker.instance("instance", systemPath);
    EXPECT_EQ(mi->ft->createInstance(mi, context, result, systemPath, instance).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mi->ft->modifyInstance(mi, context, result, systemPath, instance, nullptr).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mi->ft->deleteInstance(mi, context, result, systemPath).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mi->ft->execQuery(mi, context, result, reference, "query", "WQL").rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_THAT(Transcript::instance().calls(), IsEmpty());
}

/* What goes wrong */

/** An operation, and the slots of the broker that it calls beside those that every operation calls. */
struct Operation {
    const char* name;
    CMPIStatus (Provider::*run)();
    std::vector<std::string> objectSlots;
    std::vector<std::string> otherSlots;
};

void PrintTo(const Operation& operation, std::ostream* stream) {
    *stream << operation.name;
}

class Operations : public Provider, public testing::WithParamInterface<Operation> {
public:
    CMPIStatus run() { return (this->*GetParam().run)(); }

    /** The slots that give objects. */
    static Lines objectSlots() { return Lines{"getNameSpace", "newObjectPath"} + GetParam().objectSlots; }

    static Lines allSlots() {
        return objectSlots() + Lines{"getCharPtr", "setHostname", "addKey", "returnDone"} + GetParam().otherSlots;
    }

    /**
     * Makes each call of a slot fail, each in a request of its own, and has `expect` check the outcome. The slot must
     * be called at least once.
     */
    void failEachCall(const std::string& slot, const OrvTest::Fault& fault,
                      const std::function<void(const CMPIStatus&)>& expect) {
        for (unsigned int occurrence = 1; !HasFailure(); ++occurrence) {
            SCOPED_TRACE("call " + std::to_string(occurrence) + " of " + slot);
            startOver();
            broker.faults.at(slot, occurrence, fault);
            const CMPIStatus status = run();
            broker.faults.clear();
            if (status.rc == CMPI_RC_OK) {
                EXPECT_GT(occurrence, 1U) << "is never called";
                EXPECT_EQ(returned().closed, 1U);
                return;
            }
            expect(status);
            EXPECT_LE(returned().closed, slot == "returnDone" ? 1U : 0U);
        }
    }
};

TEST_P(Operations, PassOnTheCodeAndTheReasonOfEveryCallThatFails) {
    CMPIString* const reason = broker.string("reason", "the broker's reason");
    for (const std::string& slot : allSlots()) {
        failEachCall(slot, OrvTest::reports(CMPI_RC_ERR_ACCESS_DENIED, reason), [&](const CMPIStatus& status) {
            expectReport(status, CMPI_RC_ERR_ACCESS_DENIED, slot);
            EXPECT_THAT(messageOf(status), HasSubstr(" failed with code 2: the broker's reason"));
        });
    }
}

TEST_P(Operations, PassOnTheCodeOfACallThatFailsWithoutReason) {
    for (const std::string& slot : allSlots()) {
        failEachCall(slot, OrvTest::nullObject(CMPI_RC_ERR_ACCESS_DENIED), [&](const CMPIStatus& status) {
            expectReport(status, CMPI_RC_ERR_ACCESS_DENIED, slot);
            EXPECT_THAT(messageOf(status), EndsWith(" failed with code 2"));
        });
    }
}

TEST_P(Operations, FailWhereACallGivesNothingAndReportsNothing) {
    for (const std::string& slot : objectSlots() + Lines{"getCharPtr"}) {
        failEachCall(slot, OrvTest::nullObject(CMPI_RC_OK), [&](const CMPIStatus& status) {
            expectReport(status, CMPI_RC_ERR_FAILED, slot);
            EXPECT_THAT(messageOf(status), EndsWith(" and reported no failure"));
        });
    }
}

TEST_P(Operations, FailWhereAnObjectHoldsNothing) {
    for (const std::string& slot : objectSlots()) {
        failEachCall(slot, OrvTest::objectWithoutHandle(CMPI_RC_OK),
                     [&](const CMPIStatus& status) { expectReport(status, CMPI_RC_ERR_FAILED, slot); });
    }
}

TEST_P(Operations, LetNoExceptionOut) {
    for (const std::string& slot : allSlots()) {
        failEachCall(slot, OrvTest::throws(std::runtime_error("thrown by the broker")), [&](const CMPIStatus& status) {
            expectReport(status, CMPI_RC_ERR_FAILED, "thrown by the broker");
        });
        failEachCall(slot, OrvTest::throws(7), [&](const CMPIStatus& status) {
            expectReport(status, CMPI_RC_ERR_FAILED, "an exception of unknown type was thrown");
        });
    }
}

TEST_P(Operations, FailWhereTheSystemNameCannotBeHad) {
    Agent::instance().faults.at("getSystemName", 1, OrvTest::throws(std::runtime_error("no name")));
    expectFailure(run(), CMPI_RC_ERR_FAILED, "no name");
}

TEST_P(Operations, StillReportTheirCodeWhereTheMessageCannotBeMade) {
    for (const OrvTest::Fault& fault :
         {OrvTest::nullObject(), OrvTest::throws(std::runtime_error("no memory")), OrvTest::throws(7)}) {
        startOver();
        broker.faults.at("newString", 1, fault);
        broker.faults.at("newObjectPath", 1, OrvTest::nullObject(CMPI_RC_ERR_ACCESS_DENIED));
        const CMPIStatus status = run();
        EXPECT_EQ(status.msg, nullptr);
        expectFailure(status, CMPI_RC_ERR_ACCESS_DENIED, "");
    }
}

TEST_P(Operations, SurviveALogThatThrows) {
    Agent::instance().faults.at("logLevelMessage", 1, OrvTest::throws(std::runtime_error("no log")));
    broker.faults.at("newObjectPath", 1, OrvTest::nullObject(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_EQ(run().rc, CMPI_RC_ERR_ACCESS_DENIED);
}

/** If a host cancels its thread inside a call, the thread must end, but not the host. */
TEST_P(Operations, LetACancelledThreadGo) {
    broker.faults.at("newObjectPath", 1, {.action = [] {
                         pthread_cancel(pthread_self());
                         pthread_testcancel();
                     }});
    pthread_t thread{};
    const auto runOperation = [](void* operations) -> void* {
        static_cast<Operations*>(operations)->run();
        return nullptr;
    };
    ASSERT_EQ(pthread_create(&thread, nullptr, runOperation, this), 0);
    void* outcome = nullptr;
    ASSERT_EQ(pthread_join(thread, &outcome), 0);
    EXPECT_EQ(outcome, PTHREAD_CANCELED);
    EXPECT_THAT(records(), IsEmpty());
}

const Lines instanceObjectSlots = {"newInstance", "newArray", "newString"};
const Lines instanceOtherSlots = {"setPropertyFilter", "setProperty", "setElementAt", "returnInstance"};

INSTANTIATE_TEST_SUITE_P(
    All, Operations,
    testing::Values(Operation{"EnumInstanceNames", &Provider::enumInstanceNames, {}, {"returnObjectPath"}},
                    Operation{"EnumInstances", &Provider::enumInstances, instanceObjectSlots, instanceOtherSlots},
                    Operation{"GetInstance", &Provider::getInstance, instanceObjectSlots + Lines{"getClassName"},
                              instanceOtherSlots + Lines{"getKey", "getKeyCount"}}),
    [](const auto& test) { return test.param.name; });

/* How an object manager finds it */

TEST_F(Provider, IntroducesItselfAsAnInstanceProvider) {
    EXPECT_STREQ(mi->ft->miName, "instanceComputerSystemProvider");
    EXPECT_EQ(mi->ft->ftVersion, CMPIVersion200);
    EXPECT_EQ(mi->ft->miVersion, CMPIVersion200);
}

TEST_F(Provider, CleansUpWithoutDoingAnything) {
    for (const CMPIBoolean terminating : {0, 1}) {
        EXPECT_EQ(mi->ft->cleanup(mi, context, terminating).rc, CMPI_RC_OK);
    }
    EXPECT_THAT(Transcript::instance().calls(), IsEmpty());
}

TEST(ProviderLibrary, ExportsItsFactoryOnly) {
    EXPECT_THAT(AgentTest::exportedSymbols(ORV_COMPUTERSYSTEM_LIBRARY),
                ElementsAre("ComputerSystemProvider_Create_InstanceMI"));
}

} // namespace

#include "PowerStateManagementObjFactory.h"

#include "Expected.h"
#include "RequestFixture.h"

#include "cmpimacs.h"

namespace OrvTest {
namespace {

using Factory = Norv::PowerStateManagementServiceProvider::PowerStateManagementObjFactory;
using Norv::PowerStateManagementServiceProvider::PowerStateManagement;

class FactoryInstances : public RequestFixture {
protected:
    FactoryInstances() {
        record.setName("PowerStateManagement_a");
        record.setElementName("the element's name");
        record.setInstanceID("a");
        record.setCapabilitiesElementName("the capabilities' name");
        agent.texts = {{L"MSGID_POWER_MANAGEMENT_CAPTION", L"A caption"},
                       {L"MSGID_POWER_MANAGEMENT_DESCRIPTION", L"A description"}};
    }

    /** A factory that has read the tree already. */
    static Factory quiet(const std::string& key) {
        Factory factory(key);
        Transcript::instance().clear();
        return factory;
    }

    CMPIInstance* service(const char** list, bool isObjPath = false) {
        return quiet("Name").makePMInstance(&broker, ref, record, list, isObjPath, &status);
    }

    CMPIInstance* capabilities(const char** list, bool isObjPath = false) {
        return quiet("InstanceID").makePMCapInstance(&broker, ref, record, list, isObjPath, &status);
    }

    static std::string own(const std::string& level, const std::string& function, const std::string& text) {
        return "log+trace " + level + " Corvane.PowerMgmtObjFactory " + function +
               " src/PowerStateManagementObjFactory.cpp: " + text;
    }

    /** The ENTERING and EXITING line of a function with these parameters, around other lines. */
    static Lines framed(const std::string& function, const std::string& parameters, const Lines& content) {
        const std::string rest =
            function + "() in src/PowerStateManagementObjFactory.cpp [Line: <line>],Parameters List: " + parameters;
        return lines(own("3000", function, "ENTERING: " + rest), content, own("3000", function, "EXITING: " + rest));
    }

    static Lines madeService(const std::string& isObjPath, const Lines& content) {
        return framed("makePMInstance", " broker=&broker ref=&ref pm=<address> isObjPath=" + isObjPath + " rc=&status",
                      content);
    }

    static Lines madeCapabilities(const std::string& list, const std::string& isObjPath, const Lines& content) {
        return framed("makePMCapInstance",
                      " broker=&broker ref=&ref pm=<address> properties=" + list + " isObjPath=" + isObjPath +
                          " rc=&status",
                      content);
    }

    PowerStateManagement record;
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    std::vector<CMPIInstance*> instances;
    const char* nothing[1] = {nullptr};
    const char* elementName[2] = {"ElementName", nullptr};
    NamedAddress statusName{&status, "status"};
    NamedAddress instancesName{&instances, "instances"};
    NamedAddress elementNameName{elementName, "properties"};

    const Lines servicePath = {"broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementService\") -> path#1",
                               "path#1.setNameSpace(\"root/cimv2\")", "path#1.setHostname(\"managed.example.org\")",
                               "broker.newInstance(path#1) -> instance#1, no status"};
    const Lines serviceKeys = {
        "instance#1.setProperty(CreationClassName, CMPI_chars, \"TALVO_PowerManagementService\")",
        "instance#1.setProperty(Name, CMPI_chars, \"PowerStateManagement_a\")",
        "instance#1.setProperty(SystemCreationClassName, CMPI_chars, \"TALVO_ComputerSystem\")",
        "instance#1.setProperty(SystemName, CMPI_chars, \"managed.example.org\")"};
    const Lines caption = {"getLanguageId() -> 7", "getResourceLibrary(2, 7)",
                           "ResourceString(library 2 in language 7, MSGID_POWER_MANAGEMENT_CAPTION)",
                           "make_string(A caption)", "instance#1.setProperty(Caption, CMPI_chars, \"A caption\")"};
    const Lines description = {"getLanguageId() -> 7", "getResourceLibrary(2, 7)",
                               "ResourceString(library 2 in language 7, MSGID_POWER_MANAGEMENT_DESCRIPTION)",
                               "make_string(A description)",
                               "instance#1.setProperty(Description, CMPI_chars, \"A description\")"};
    const std::string serviceElementName = "instance#1.setProperty(ElementName, CMPI_chars, \"the element's name\")";
    const std::string serviceKeyNames = "{CreationClassName, Name, SystemCreationClassName, SystemName}";

    const Lines capabilitiesPath = {
        "broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementCapabilities\") -> path#1",
        "path#1.setNameSpace(\"root/cimv2\")", "path#1.setHostname(\"managed.example.org\")",
        "broker.newInstance(path#1) -> instance#1, no status"};
    const std::string capabilitiesKey = "instance#1.setProperty(InstanceID, CMPI_chars, \"a\")";
    const Lines changeCapabilities = {
        "broker.newArray(3, CMPI_uint16) -> array#1", "array#1.setElementAt(0, CMPI_uint16, 3)",
        "array#1.setElementAt(1, CMPI_uint16, 4)", "array#1.setElementAt(2, CMPI_uint16, 8)",
        "instance#1.setProperty(PowerChangeCapabilities, CMPI_uint16A, array#1)"};
    const std::string capabilitiesElementName =
        "instance#1.setProperty(ElementName, CMPI_chars, \"the capabilities' name\")";

    /** The third property's lines; its array has a number of its own. */
    static Lines statesSupported(const std::string& array) {
        return {"broker.newArray(3, CMPI_uint16) -> " + array, array + ".setElementAt(0, CMPI_uint16, 2)",
                array + ".setElementAt(1, CMPI_uint16, 5)", array + ".setElementAt(2, CMPI_uint16, 8)",
                "instance#1.setProperty(PowerStatesSupported, CMPI_uint16A, " + array + ")"};
    }
};

/* One instance */

TEST_F(FactoryInstances, AServiceHasSevenPropertiesWithoutAList) {
    ASSERT_NE(service(nullptr), nullptr);
    EXPECT_CALLS(madeService("0", lines(servicePath, "instance#1.setPropertyFilter(null, " + serviceKeyNames + ')',
                                        serviceKeys, caption, description, serviceElementName)));
}

TEST_F(FactoryInstances, ACapabilitiesObjectHasFourPropertiesWithoutAList) {
    ASSERT_NE(capabilities(nullptr), nullptr);
    EXPECT_CALLS(
        madeCapabilities("0", "0",
                         lines(capabilitiesPath, "instance#1.setPropertyFilter(null, {InstanceID})", capabilitiesKey,
                               changeCapabilities, capabilitiesElementName, statesSupported("array#2"))));
}

TEST_F(FactoryInstances, AListSelectsBesideTheKeysAndIsTheFilter) {
    service(elementName);
    EXPECT_CALLS(
        madeService("0", lines(servicePath, "instance#1.setPropertyFilter({ElementName}, " + serviceKeyNames + ')',
                               serviceKeys, serviceElementName)));
    capabilities(elementName);
    EXPECT_CALLS(madeCapabilities("&properties", "0",
                                  lines(capabilitiesPath, "instance#1.setPropertyFilter({ElementName}, {InstanceID})",
                                        capabilitiesKey, capabilitiesElementName)));
}

TEST_F(FactoryInstances, TheListsOrderAndRepetitionsMakeNoDifference) {
    const char* list[] = {"Description", "Caption", "Caption", "Name", "NoSuchProperty", nullptr};
    service(list);
    EXPECT_CALLS(
        madeService("0", lines(servicePath,
                               "instance#1.setPropertyFilter({Description, Caption, Caption, Name, NoSuchProperty}, " +
                                   serviceKeyNames + ')',
                               serviceKeys, caption, description)));
    const char* states[] = {"PowerStatesSupported", nullptr};
    const NamedAddress statesName(states, "states");
    capabilities(states);
    EXPECT_CALLS(
        madeCapabilities("&states", "0",
                         lines(capabilitiesPath, "instance#1.setPropertyFilter({PowerStatesSupported}, {InstanceID})",
                               capabilitiesKey, statesSupported("array#1"))));
}

TEST_F(FactoryInstances, TheListIsComparedWithRegardToCase) {
    const char* list[] = {"elementname", "CAPTION", "powerStatesSupported", nullptr};
    const NamedAddress listName(list, "list");
    service(list);
    EXPECT_CALLS(madeService("0", lines(servicePath,
                                        "instance#1.setPropertyFilter({elementname, CAPTION, powerStatesSupported}, " +
                                            serviceKeyNames + ')',
                                        serviceKeys)));
    capabilities(list);
    EXPECT_CALLS(madeCapabilities(
        "&list", "0",
        lines(capabilitiesPath,
              "instance#1.setPropertyFilter({elementname, CAPTION, powerStatesSupported}, {InstanceID})",
              capabilitiesKey)));
}

TEST_F(FactoryInstances, TheListIsReadUpToTheEndOfASixteenBitIndex) {
    std::vector<const char*> list(65'537, "Name");
    list.push_back(nullptr);
    list[65'536] = "ElementName";
    service(list.data());
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(serviceElementName)));
    std::swap(list[65'535], list[65'536]);
    service(list.data());
    EXPECT_THAT(transcript.calls(), testing::Contains(serviceElementName));
}

TEST_F(FactoryInstances, TheCodesOfAListAreCountedInSixteenBits) {
    for (int call = 0; call < 21'845; ++call) {
        record.getPowerStatesSupported();
    }
    const char* states[] = {"PowerStatesSupported", nullptr};
    capabilities(states);
    EXPECT_THAT(transcript.calls(), testing::IsSupersetOf({std::string("broker.newArray(2, CMPI_uint16) -> array#1"),
                                                           std::string("array#1.setElementAt(1, CMPI_uint16, 5)")}));
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(testing::StartsWith("array#1.setElementAt(2"))));
}

TEST_F(FactoryInstances, AnEmptyListSelectsTheKeysOnly) {
    const NamedAddress nothingName(nothing, "nothing");
    service(nothing);
    EXPECT_CALLS(
        madeService("0", lines(servicePath, "instance#1.setPropertyFilter({}, " + serviceKeyNames + ')', serviceKeys)));
    capabilities(nothing);
    EXPECT_CALLS(madeCapabilities(
        "&nothing", "0", lines(capabilitiesPath, "instance#1.setPropertyFilter({}, {InstanceID})", capabilitiesKey)));
}

TEST_F(FactoryInstances, ForAnObjectPathThereAreTheKeysAndNoFilter) {
    service(nullptr, true);
    EXPECT_CALLS(madeService("1", lines(servicePath, serviceKeys)));
    capabilities(nullptr, true);
    EXPECT_CALLS(madeCapabilities("0", "1", lines(capabilitiesPath, capabilitiesKey)));
}

TEST_F(FactoryInstances, ForAnObjectPathAListStillSelectsButIsNoFilter) {
    service(elementName, true);
    EXPECT_CALLS(madeService("1", lines(servicePath, serviceKeys, serviceElementName)));
    capabilities(elementName, true);
    EXPECT_CALLS(
        madeCapabilities("&properties", "1", lines(capabilitiesPath, capabilitiesKey, capabilitiesElementName)));
}

TEST_F(FactoryInstances, NoInstanceShowsAPowerState) {
    record.setPowerState(1);
    for (CMPIInstance* instance : {service(nullptr), capabilities(nullptr)}) {
        EXPECT_EQ(CMGetProperty(instance, "PowerState", nullptr).state & CMPI_notFound, CMPI_notFound);
        EXPECT_EQ(CMGetProperty(instance, "RequestedPowerState", nullptr).state & CMPI_notFound, CMPI_notFound);
    }
}

TEST_F(FactoryInstances, TheTextsAreThoseOfTheLanguageInForce) {
    const char* list[] = {"Caption", nullptr};
    agent.language = 81;
    service(list);
    const Lines calls = transcript.calls();
    EXPECT_THAT(calls, testing::Contains("getResourceLibrary(2, 81)"));
    EXPECT_THAT(calls, testing::Contains("ResourceString(library 2 in language 81, MSGID_POWER_MANAGEMENT_CAPTION)"));
}

TEST_F(FactoryInstances, TheStatusesOfPropertiesAndFilterAreIgnored) {
    for (const char* slot : {"setNameSpace", "setHostname", "setProperty", "setPropertyFilter", "setElementAt"}) {
        broker.faults.always(slot, reports(CMPI_RC_ERR_FAILED));
    }
    EXPECT_NE(service(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_NE(capabilities(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
}

TEST_F(FactoryInstances, TheStatusIsThatOfThePathAndOfTheArrays) {
    broker.faults.always("newObjectPath", reports(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_NE(service(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_NE(capabilities(elementName), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_NE(capabilities(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    broker.faults.always("newArray", reports(CMPI_RC_ERR_FAILED));
    EXPECT_NE(capabilities(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
}

struct Missing {
    const char* what;
    Fault fault;
};

void PrintTo(const Missing& missing, std::ostream* out) {
    *out << missing.what;
}

class FactoryInstancesFailing : public FactoryInstances, public testing::WithParamInterface<Missing> {
protected:
    /** What a creation that fails as the parameter says shows as its result. */
    static std::string outcome(const std::string& kind) {
        return GetParam().fault.object == Fault::Object::null ? "null" : kind + "#1 without handle";
    }
};

TEST_P(FactoryInstancesFailing, WithoutPathThereIsNoInstanceAndNoMessage) {
    broker.faults.always("newObjectPath", GetParam().fault);
    EXPECT_EQ(service(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_CALLS(madeService(
        "0", {"broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementService\") -> " + outcome("path")}));
    EXPECT_EQ(capabilities(nullptr), nullptr);
    EXPECT_CALLS(madeCapabilities(
        "0", "0",
        {"broker.newObjectPath(\"root/cimv2\", \"TALVO_PowerManagementCapabilities\") -> " + outcome("path")}));
}

TEST_P(FactoryInstancesFailing, AnInstanceThatHoldsNothingIsReturnedAsItIs) {
    broker.faults.always("newInstance", GetParam().fault);
    const bool isNull = GetParam().fault.object == Fault::Object::null;
    const std::string created = "broker.newInstance(path#1) -> " + outcome("instance") + ", no status";
    EXPECT_EQ(service(nullptr) == nullptr, isNull);
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_CALLS(madeService("0", lines(Lines(servicePath.begin(), servicePath.end() - 1), created)));
    EXPECT_EQ(capabilities(nullptr) == nullptr, isNull);
    EXPECT_CALLS(
        madeCapabilities("0", "0", lines(Lines(capabilitiesPath.begin(), capabilitiesPath.end() - 1), created)));
}

INSTANTIATE_TEST_SUITE_P(Factory, FactoryInstancesFailing,
                         testing::Values(Missing{"null", nullObject(CMPI_RC_ERR_ACCESS_DENIED)},
                                         Missing{"without handle", objectWithoutHandle(CMPI_RC_ERR_ACCESS_DENIED)}));

TEST_F(FactoryInstances, WithoutItsArrayChangeCapabilitiesIsLeftOut) {
    broker.faults.at("newArray", 1, nullObject());
    ASSERT_NE(capabilities(nullptr), nullptr);
    EXPECT_CALLS(madeCapabilities(
        "0", "0",
        lines(capabilitiesPath, "instance#1.setPropertyFilter(null, {InstanceID})", capabilitiesKey,
              "broker.newArray(3, CMPI_uint16) -> null",
              own("6000", "makePMCapInstance",
                  "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: Create Array for "
                  "Property                                             PowerChangeCapabilities failed."),
              capabilitiesElementName, statesSupported("array#1"))));
    EXPECT_EQ(status.rc, CMPI_RC_OK);
}

TEST_F(FactoryInstances, WithoutItsArrayStatesSupportedIsLeftOut) {
    broker.faults.at("newArray", 2, nullObject());
    ASSERT_NE(capabilities(nullptr), nullptr);
    EXPECT_CALLS(madeCapabilities(
        "0", "0",
        lines(capabilitiesPath, "instance#1.setPropertyFilter(null, {InstanceID})", capabilitiesKey, changeCapabilities,
              capabilitiesElementName, "broker.newArray(3, CMPI_uint16) -> null",
              own("6000", "makePMCapInstance",
                  "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: Create Array for "
                  "Property                                             PowerStatesSupported failed."))));
    EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
}

TEST_F(FactoryInstances, AnArrayWithoutHandleCountsAsAnArray) {
    const char* list[] = {"PowerStatesSupported", nullptr};
    const NamedAddress listName(list, "list");
    broker.faults.at("newArray", 1, objectWithoutHandle());
    capabilities(list);
    EXPECT_THAT(transcript.calls(),
                testing::Contains("instance#1.setProperty(PowerStatesSupported, CMPI_uint16A, array#1)"));
}

/* One by its key */

class FactoryOneInstance : public FactoryInstances {
protected:
    FactoryOneInstance() { haveNodes({"a", "b"}); }

    Lines one(const ElementClass& element, const Lines& content) const {
        return framed(element.getOneInstance, parameters(element), content);
    }

    static std::string parameters(const ElementClass& element) {
        return element.key == "Name"
                   ? " broker=&broker objectPath=&ref key=&key properties=0 instances=&instances status=&status"
                   : " broker=&broker ref=&ref key=&key properties=0 instances=&instances rc=&status";
    }

    unsigned short get(const ElementClass& element, const std::string& text, const char** list = nullptr) {
        CMPIString* key = broker.string("key", text);
        Factory factory = quiet(element.key);
        return element.key == "Name" ? factory.getOnePMCMPIInstance(&broker, ref, key, list, instances, &status)
                                     : factory.getOnePMCapCMPIInstance(&broker, ref, key, list, instances, &status);
    }
};

TEST_F(FactoryOneInstance, AServiceIsFoundByItsName) {
    agent.texts.clear();
    EXPECT_EQ(get(serviceClass, "PowerStateManagement_b"), 0);
    Lines made = serviceClass.instance(1, "b");
    for (std::string& line : made) {
        const std::size_t at = line.find("rc=<address>");
        line = at == std::string::npos ? line : line.replace(at, std::string::npos, "rc=&status");
    }
    EXPECT_CALLS(one(serviceClass, lines(own("4000", "getOnePMCMPIInstance",
                                             "VARIABLE: 'name' has Value 'PowerStateManagement_b' at line <line> in "
                                             "src/PowerStateManagementObjFactory.cpp"),
                                         made)));
    EXPECT_EQ(instances.size(), 1);
}

TEST_F(FactoryOneInstance, ACapabilitiesObjectIsFoundByItsInstanceIDAndShowsNoVariable) {
    EXPECT_EQ(get(capabilitiesClass, "b"), 0);
    Lines made = capabilitiesClass.instance(1, "b");
    for (std::string& line : made) {
        const std::size_t at = line.find("rc=<address>");
        line = at == std::string::npos ? line : line.replace(at, std::string::npos, "rc=&status");
    }
    EXPECT_CALLS(one(capabilitiesClass, made));
    EXPECT_EQ(instances.size(), 1);
}

TEST_F(FactoryOneInstance, TheListIsHandedOn) {
    EXPECT_EQ(get(serviceClass, "PowerStateManagement_b", elementName), 0);
    EXPECT_EQ(get(capabilitiesClass, "b", elementName), 0);
    ASSERT_EQ(instances.size(), 2);
    for (CMPIInstance* instance : instances) {
        EXPECT_EQ(CMGetProperty(instance, "Caption", nullptr).state & CMPI_notFound, CMPI_notFound);
        EXPECT_EQ(CMGetProperty(instance, "PowerStatesSupported", nullptr).state & CMPI_notFound, CMPI_notFound);
        EXPECT_EQ(CMGetProperty(instance, "ElementName", nullptr).type, CMPI_string);
    }
}

TEST_F(FactoryOneInstance, AnUnknownKeyIsReportedAsAnEmptyMap) {
    EXPECT_EQ(get(serviceClass, "powerstatemanagement_b"), 1);
    const std::string message =
        "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: _powerStateManagementMap Empty";
    EXPECT_CALLS(factorySource.entering("getOnePMCMPIInstance", parameters(serviceClass)),
                 factorySource.variable("getOnePMCMPIInstance", "name", "powerstatemanagement_b"),
                 own("6000", "getOnePMCMPIInstance", message));
    EXPECT_EQ(get(capabilitiesClass, "PowerStateManagement_b"), 1);
    EXPECT_CALLS(factorySource.entering("getOnePMCapCMPIInstance", parameters(capabilitiesClass)),
                 own("6000", "getOnePMCapCMPIInstance", message));
    EXPECT_TRUE(instances.empty());
}

TEST_F(FactoryOneInstance, AnInstanceThatCannotBeMadeIsAppendedAsNull) {
    broker.faults.always("newInstance", nullObject());
    EXPECT_EQ(get(serviceClass, "PowerStateManagement_b"), 0);
    EXPECT_EQ(get(capabilitiesClass, "b"), 0);
    EXPECT_EQ(instances, (std::vector<CMPIInstance*>{nullptr, nullptr}));
}

/* All of them */

class FactoryAllInstances : public FactoryInstances {
protected:
    unsigned short services(const char** list = nullptr, bool isObjPath = false) {
        return quiet("Name").getAllPMCMPIInstances(&broker, ref, list, isObjPath, instances, &status);
    }

    unsigned short allCapabilities(const char** list = nullptr, bool isObjPath = false) {
        return quiet("InstanceID").getAllPMCapCMPIInstances(&broker, ref, list, isObjPath, instances, &status);
    }

    static std::string parameters(const std::string& list, const std::string& isObjPath) {
        return " broker=&broker ref=&ref properties=" + list + " isObjPath=" + isObjPath +
               " instances=&instances rc=&status";
    }

    Lines textsOf(const char* property) {
        Lines texts;
        for (CMPIInstance* instance : instances) {
            texts.emplace_back(CMGetCharPtr(CMGetProperty(instance, property, nullptr).value.string));
        }
        return texts;
    }
};

TEST_F(FactoryAllInstances, ServicesComeInTheOrderOfTheirNamesAndWithoutExitingLine) {
    haveNodes({"b", "a"});
    EXPECT_EQ(services(nullptr, true), 0);
    const Lines calls = transcript.calls();
    EXPECT_EQ(calls.front(), factorySource.entering("getAllPMCMPIInstances", parameters("0", "1")));
    EXPECT_THAT(calls.back(), testing::HasSubstr("EXITING: makePMInstance()"));
    EXPECT_EQ(textsOf("Name"), (Lines{"PowerStateManagement_a", "PowerStateManagement_b"}));
}

TEST_F(FactoryAllInstances, CapabilitiesComeInTheOrderOfTheirIDsAndWithExitingLine) {
    haveNodes({"b", "a"});
    EXPECT_EQ(allCapabilities(nullptr, true), 0);
    const Lines calls = transcript.calls();
    EXPECT_EQ(calls.front(), factorySource.entering("getAllPMCapCMPIInstances", parameters("0", "1")));
    EXPECT_EQ(calls.back(), factorySource.exiting("getAllPMCapCMPIInstances", parameters("0", "1")));
    EXPECT_EQ(textsOf("InstanceID"), (Lines{"a", "b"}));
}

TEST_F(FactoryAllInstances, TheyStandBehindWhatTheVectorHolds) {
    haveNodes({"a"});
    instances = {nullptr};
    EXPECT_EQ(services(), 0);
    EXPECT_EQ(allCapabilities(), 0);
    ASSERT_EQ(instances.size(), 3);
    EXPECT_EQ(instances[0], nullptr);
}

TEST_F(FactoryAllInstances, NoServiceIsReported) {
    EXPECT_EQ(services(), 1);
    EXPECT_CALLS(factorySource.entering("getAllPMCMPIInstances", parameters("0", "0")),
                 own("6000", "getAllPMCMPIInstances",
                     "MESSAGE [File: src/PowerStateManagementObjFactory.cpp, Line: <line>]: "
                     "***No instance found***"));
    EXPECT_TRUE(instances.empty());
}

TEST_F(FactoryAllInstances, NoCapabilitiesObjectIsNoFailure) {
    EXPECT_EQ(allCapabilities(), 0);
    EXPECT_CALLS(framed("getAllPMCapCMPIInstances", parameters("0", "0"), {}));
    EXPECT_TRUE(instances.empty());
}

TEST_F(FactoryAllInstances, TheListIsHandedOn) {
    haveNodes({"a"});
    EXPECT_EQ(services(elementName), 0);
    EXPECT_THAT(transcript.calls(),
                testing::Contains("instance#1.setPropertyFilter({ElementName}, " + serviceKeyNames + ')'));
    EXPECT_EQ(transcript.calls().front(),
              factorySource.entering("getAllPMCMPIInstances", parameters("&properties", "0")));
    EXPECT_EQ(allCapabilities(elementName), 0);
    EXPECT_THAT(transcript.calls(), testing::Contains("instance#1.setPropertyFilter({ElementName}, {InstanceID})"));
    EXPECT_EQ(transcript.calls().front(),
              factorySource.entering("getAllPMCapCMPIInstances", parameters("&properties", "0")));
}

TEST_F(FactoryAllInstances, InstancesThatCannotBeMadeAreAppendedAsNull) {
    haveNodes({"a", "b"});
    broker.faults.at("newInstance", 1, nullObject());
    broker.faults.at("newObjectPath", 4, nullObject());
    EXPECT_EQ(services(), 0);
    EXPECT_EQ(allCapabilities(), 0);
    ASSERT_EQ(instances.size(), 4);
    EXPECT_EQ(instances[0], nullptr);
    EXPECT_NE(instances[1], nullptr);
    EXPECT_NE(instances[2], nullptr);
    EXPECT_EQ(instances[3], nullptr);
}

TEST_F(FactoryAllInstances, TheListsNeverGrow) {
    haveNodes({"a"});
    Factory factory("InstanceID");
    CMPIString* key = broker.string("key", "a");
    for (int time = 1; time <= 2; ++time) {
        EXPECT_EQ(factory.getAllPMCapCMPIInstances(&broker, ref, nullptr, false, instances, &status), 0);
        EXPECT_EQ(factory.getOnePMCapCMPIInstance(&broker, ref, key, nullptr, instances, &status), 0);
    }
    ASSERT_EQ(instances.size(), 4);
    for (CMPIInstance* instance : instances) {
        for (const char* property : {"PowerChangeCapabilities", "PowerStatesSupported"}) {
            EXPECT_EQ(CMGetArrayCount(CMGetProperty(instance, property, nullptr).value.array, nullptr), 3);
        }
    }
    EXPECT_EQ(factory.getPowerStateManagementMap()["a"].getPowerStatesSupported().size(), 3);
}

} // namespace
} // namespace OrvTest

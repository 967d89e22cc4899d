/**
 * Which class lies at the far end of an association.
 */
#include "PowerStateManagementObjFactory.h"

#include "Expected.h"
#include "RequestFixture.h"

#include "cmpimacs.h"

#include <stdexcept>

namespace OrvTest {
namespace {

using Factory = Norv::PowerStateManagementServiceProvider::PowerStateManagementObjFactory;

constexpr const char* system = "TALVO_ComputerSystem";
constexpr const char* service = "TALVO_PowerManagementService";
constexpr const char* capabilities = "TALVO_PowerManagementCapabilities";
constexpr const char* associated = "TALVO_AssociatedPowerManagementService";
constexpr const char* hosted = "TALVO_PowerManagementHostedService";
constexpr const char* element = "TALVO_PowerManagementElementCapabilities";

class AssociationTarget : public RequestFixture {
protected:
    AssociationTarget() { transcript.clear(); }

    const char* name(const char* association, const char* resultClass = nullptr) {
        return factory.get_assoc_targetClass_Name(&broker, ref, association, resultClass, &status);
    }
    CMPIObjectPath* path(const char* association, const char* resultClass = nullptr) {
        return factory.get_assoc_targetClass_ObjectPath(&broker, ref, association, resultClass, &status);
    }
    void comeFrom(const std::string& sourceClass) { ref = broker.path("ref", "root/cimv2", sourceClass); }

    Factory factory{"Name"};
    CMPIStatus status = {CMPI_RC_OK, nullptr};
};

/** One question and its answer. */
struct Case {
    std::string source;
    std::string association;
    std::string target;
};

void PrintTo(const Case& tested, std::ostream* out) {
    *out << tested.association << " from " << tested.source;
}

class AssociationTargets : public AssociationTarget, public testing::WithParamInterface<Case> {
protected:
    AssociationTargets() { comeFrom(GetParam().source); }
};

INSTANTIATE_TEST_SUITE_P(Known, AssociationTargets,
                         testing::Values(Case{service, associated, system}, Case{system, associated, service},
                                         Case{service, hosted, system}, Case{system, hosted, service},
                                         Case{service, element, capabilities}, Case{capabilities, element, service}));

INSTANTIATE_TEST_SUITE_P(Unrelated, AssociationTargets,
                         testing::Values(Case{capabilities, associated, ""}, Case{capabilities, hosted, ""},
                                         Case{system, element, ""}, Case{associated, associated, ""},
                                         Case{"CIM_ComputerSystem", hosted, ""}, Case{"", "", ""},
                                         Case{service, "CIM_HostedService", ""}, Case{service, system, ""},
                                         Case{service, "", ""}));

INSTANTIATE_TEST_SUITE_P(InOtherLetterCase, AssociationTargets,
                         testing::Values(Case{"talvo_computersystem", associated, ""},
                                         Case{"TALVO_COMPUTERSYSTEM", hosted, ""},
                                         Case{"TALVO_powerManagementService", element, ""},
                                         Case{system, "talvo_associatedpowermanagementservice", ""},
                                         Case{system, "TALVO_POWERMANAGEMENTHOSTEDSERVICE", ""},
                                         Case{capabilities, "Talvo_PowerManagementElementCapabilities", ""}));

INSTANTIATE_TEST_SUITE_P(WithMoreOrLessText, AssociationTargets,
                         testing::Values(Case{"TALVO_ComputerSystem2", associated, ""},
                                         Case{"TALVO_Computer", associated, ""},
                                         Case{service, "TALVO_PowerManagementHostedService ", ""}));

TEST_P(AssociationTargets, AreNamed) {
    const auto& [source, association, target] = GetParam();
    EXPECT_EQ(name(association.c_str(), service), target);
    EXPECT_CALLS(targetNamed(association, service, target));
}

TEST_P(AssociationTargets, HaveAPathWithoutKeys) {
    const auto& [source, association, target] = GetParam();
    CMPIObjectPath* found = path(association.c_str(), service);
    EXPECT_CALLS(targetFound(association, service, target));
    EXPECT_EQ(transcript.nameOf(found), target.empty() ? "null" : "path#1");
    if (found != nullptr) {
        EXPECT_EQ(CMGetKeyCount(found, nullptr), 0);
    }
}

TEST_P(AssociationTargets, AreTheSameForAnyResultClass) {
    const auto& [source, association, target] = GetParam();
    for (const char* resultClass : {"CIM_ComputerSystem", "TALVO_PowerManagementCapabilities", "no class", ""}) {
        EXPECT_EQ(name(association.c_str(), resultClass), target) << resultClass;
    }
}

TEST_P(AssociationTargets, AreTheSameWithoutAResultClass) {
    const auto& [source, association, target] = GetParam();
    path(association.c_str());
    EXPECT_CALLS(targetFound(association, nullptr, target));
}

TEST_P(AssociationTargets, DoNotDependOnTheRecords) {
    const auto& [source, association, target] = GetParam();
    haveNodes({"a", "b"});
    for (const char* key : {"Name", "InstanceID", "neither"}) {
        EXPECT_EQ(Factory(key).get_assoc_targetClass_Name(&broker, ref, association.c_str(), nullptr, &status), target);
    }
}

TEST_F(AssociationTarget, WithoutAnAssociationThereIsNone) {
    EXPECT_STREQ(name(nullptr, service), "");
    EXPECT_STREQ(name(nullptr), "");
    EXPECT_EQ(path(nullptr, service), nullptr);
    EXPECT_THAT(
        transcript.calls(),
        testing::Contains(factorySource.message(4000, "get_assoc_targetClass_Name", "Target Class is empty")).Times(3));
}

TEST_F(AssociationTarget, ASourceWhoseClassCannotBeReadHasNone) {
    const std::pair<const char*, Fault> unreadable[] = {
        {"getClassName", nullObject()}, {"getClassName", objectWithoutHandle()}, {"getCharPtr", nullObject()}};
    for (const auto& [slot, fault] : unreadable) {
        comeFrom(service);
        broker.faults.clear();
        broker.faults.always(slot, fault);
        EXPECT_STREQ(name(hosted), "") << slot;
        EXPECT_EQ(path(hosted), nullptr) << slot;
    }
}

TEST_F(AssociationTarget, LeavesTheStatusOfReadingTheClass) {
    const Fault fault = reports(CMPI_RC_ERR_INVALID_CLASS, broker.string("reason", "no such class"));
    broker.faults.always("getClassName", fault);
    comeFrom("CIM_ComputerSystem");
    EXPECT_EQ(path(hosted), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(status.msg, fault.message);
}

TEST_F(AssociationTarget, ReportsNothingThroughTheStatusItself) {
    status = {CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "from before")};
    const CMPIString* message = status.msg;
    broker.faults.always("getClassName", leavesStatus());
    EXPECT_STREQ(name("no association"), "");
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(status.msg, message);
}

TEST_F(AssociationTarget, LeavesTheStatusOfMakingThePath) {
    broker.faults.always("newObjectPath", reports(CMPI_RC_ERR_ACCESS_DENIED));
    EXPECT_NE(path(hosted), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
}

TEST_F(AssociationTarget, ThePathIsInTheSourcesNamespaceOnTheManagedSystem) {
    ref = broker.path("ref", "root/interop", service, {{"Name", "a"}});
    CMSetHostname(ref, "elsewhere.example.org");
    CMPIObjectPath* found = path(hosted);
    ASSERT_NE(found, nullptr);
    EXPECT_STREQ(CMGetCharsPtr(CMGetNameSpace(found, nullptr), nullptr), "root/interop");
    EXPECT_STREQ(CMGetCharsPtr(CMGetHostname(found, nullptr), nullptr), "managed.example.org");
    EXPECT_STREQ(CMGetCharsPtr(CMGetClassName(found, nullptr), nullptr), system);
}

TEST_F(AssociationTarget, NeverAsksTheObjectManagerForTheClassHierarchy) {
    path(hosted);
    EXPECT_THAT(transcript.calls(), testing::Each(testing::Not(testing::HasSubstr("classPathIsA"))));
}

TEST_F(AssociationTarget, APathThatCannotBeMadeIsNoTarget) {
    for (const Fault& fault : {nullObject(CMPI_RC_ERR_ACCESS_DENIED), objectWithoutHandle(CMPI_RC_ERR_ACCESS_DENIED)}) {
        broker.faults.always("newObjectPath", fault);
        const CMPIObjectPath* found = path(hosted);
        EXPECT_TRUE(CMIsNullObject(found));
        EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    }
}

TEST_F(AssociationTarget, ExceptionsPass) {
    for (const char* slot : {"getClassName", "getNameSpace", "newObjectPath", "setNameSpace", "setHostname"}) {
        broker.faults.clear();
        broker.faults.at(slot, 1, throws(std::out_of_range(slot)));
        EXPECT_THROW(path(hosted), std::out_of_range) << slot;
        EXPECT_EQ(agent.messageBuffers, 0) << slot;
    }
}

} // namespace
} // namespace OrvTest

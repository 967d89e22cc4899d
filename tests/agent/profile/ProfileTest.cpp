#include "Agent.h"
#include "RecordingBroker.h"
#include "TestSupport.h"
#include "Transcript.h"

#include "cmpimacs.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>

extern "C" {
CMPIInstanceMI* RegisteredProfileProvider_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPIInstanceMI* ElementConformsToProfileProvider_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPIAssociationMI* ElementConformsToProfileProvider_Create_AssociationMI(const CMPIBroker*, const CMPIContext*,
                                                                         CMPIStatus*);
}

namespace {

using OrvTest::Agent;
using OrvTest::RecordingBroker;
using OrvTest::Transcript;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;
using testing::UnorderedElementsAre;

constexpr const char* profileClass = "TALVO_RegisteredProfile";
constexpr const char* conformanceClass = "TALVO_ElementConformsToProfile";
constexpr const char* serviceClass = "TALVO_PowerManagementService";
constexpr const char* powerProfile = "TALVO:DSP1027-1.0.2";

class Profile : public testing::Test {
protected:
    Profile() {
        Agent::instance().reset();
        Transcript::instance().clear();
        broker.instanceNames[profileClass] = {profile};
        broker.instanceNames[serviceClass] = {service};
    }
    ~Profile() override { Agent::instance().reset(); }

    CMPIStatus enumerateConformances(const char* nameSpace) {
        const CMPIObjectPath* const reference = broker.path("reference", nameSpace, conformanceClass);
        result = broker.result("result");
        return conformances->ft->enumerateInstanceNames(conformances, context, result, reference);
    }

    CMPIStatus referenceNames(const CMPIObjectPath* source) {
        result = broker.result("result");
        return links->ft->referenceNames(links, context, result, source, conformanceClass, nullptr);
    }

    const RecordingBroker::Returned& returned() const { return broker.returned(result); }

    static std::string text(const CMPIInstance* instance, const char* property) {
        return CMGetCharPtr(CMGetProperty(instance, property, nullptr).value.string);
    }

    /** The namespaces that the references of a path name. */
    static std::pair<std::string, std::string> nameSpacesOf(const CMPIObjectPath* link) {
        const auto nameSpace = [&](const char* role) {
            return CMGetCharPtr(CMGetNameSpace(CMGetKey(link, role, nullptr).value.ref, nullptr));
        };
        return {nameSpace("ConformantStandard"), nameSpace("ManagedElement")};
    }

    RecordingBroker broker;
    CMPIContext* context = broker.context("context");
    CMPIResult* result = nullptr;
    CMPIObjectPath* profile = broker.path("profile", "root/interop", profileClass, {{"InstanceID", powerProfile}});
    CMPIObjectPath* service = broker.path("service", "root/cimv2", serviceClass, {{"Name", "s"}});
    CMPIInstanceMI* profiles = RegisteredProfileProvider_Create_InstanceMI(&broker, nullptr, nullptr);
    CMPIInstanceMI* conformances = ElementConformsToProfileProvider_Create_InstanceMI(&broker, nullptr, nullptr);
    CMPIAssociationMI* links = ElementConformsToProfileProvider_Create_AssociationMI(&broker, nullptr, nullptr);
};

TEST_F(Profile, IsAdvertisedAsItsDocumentSays) {
    result = broker.result("result");
    const CMPIObjectPath* const reference = broker.path("reference", "root/interop", profileClass);
    EXPECT_EQ(profiles->ft->enumerateInstances(profiles, context, result, reference, nullptr).rc, CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(2));
    const CMPIInstance* const power = returned().instances.front();
    EXPECT_EQ(text(power, "InstanceID"), powerProfile);
    EXPECT_EQ(text(power, "RegisteredName"), "Power State Management");
    EXPECT_EQ(text(power, "RegisteredVersion"), "1.0.2");
    EXPECT_EQ(CMGetProperty(power, "RegisteredOrganization", nullptr).value.uint16, 2);
    EXPECT_EQ(returned().closed, 1U);
}

TEST_F(Profile, GivesThePropertiesThatAreWanted) {
    result = broker.result("result");
    const char* properties[] = {"RegisteredName", nullptr};
    EXPECT_EQ(profiles->ft->getInstance(profiles, context, result, profile, properties).rc, CMPI_RC_OK);
    ASSERT_THAT(returned().instances, SizeIs(1));
    EXPECT_EQ(CMGetPropertyCount(returned().instances.front(), nullptr), 2U);
}

TEST_F(Profile, IsWhatTheServiceConformsTo) {
    EXPECT_EQ(enumerateConformances("root/cimv2").rc, CMPI_RC_OK);
    ASSERT_THAT(returned().paths, SizeIs(1));
    EXPECT_THAT(nameSpacesOf(returned().paths.front()), testing::Pair("root/interop", "root/cimv2"));
    EXPECT_THAT(Transcript::instance().calls(),
                testing::Contains("broker.newObjectPath(\"root/interop\", \"TALVO_RegisteredProfile\") -> path#1"));
}

TEST_F(Profile, IsFoundFromEitherEnd) {
    for (const CMPIObjectPath* source : {profile, service}) {
        EXPECT_EQ(referenceNames(source).rc, CMPI_RC_OK);
        EXPECT_THAT(returned().paths, SizeIs(1));
        EXPECT_EQ(returned().closed, 1U);
    }
}

TEST_F(Profile, IsNotLookedForFromWhatCannotConform) {
    EXPECT_EQ(referenceNames(broker.path("system", "root/cimv2", "TALVO_ComputerSystem", {{"Name", "s"}})).rc,
              CMPI_RC_OK);
    EXPECT_THAT(returned().paths, IsEmpty());
    EXPECT_THAT(Transcript::instance().calls(), testing::Not(testing::Contains(HasSubstr("enumerateInstanceNames"))));
}

TEST_F(Profile, IsNotFoundFromAServiceThatIsNotThere) {
    for (const auto& other : {broker.path("other", "root/cimv2", serviceClass, {{"Name", "S"}}),
                              broker.path("elsewhere", "root/interop", serviceClass, {{"Name", "s"}}),
                              broker.path("without", "root/cimv2", serviceClass)}) {
        EXPECT_EQ(referenceNames(other).rc, CMPI_RC_OK);
        EXPECT_THAT(returned().paths, IsEmpty());
    }
}

TEST_F(Profile, HasNoCentralInstancesWhereNobodyServesThem) {
    for (const CMPIrc code : {CMPI_RC_ERR_INVALID_NAMESPACE, CMPI_RC_ERR_INVALID_CLASS, CMPI_RC_ERR_NOT_SUPPORTED}) {
        broker.faults.clear();
        for (const unsigned int occurrence : {2U, 3U}) {
            broker.faults.at("enumerateInstanceNames", occurrence, OrvTest::reports(code));
        }
        EXPECT_EQ(enumerateConformances("root/interop").rc, CMPI_RC_OK);
        EXPECT_THAT(returned().paths, IsEmpty());
    }
}

TEST_F(Profile, PassesOnAndLogsWhyTheObjectManagerFailed) {
    broker.faults.at("enumerateInstanceNames", 1,
                     OrvTest::reports(CMPI_RC_ERR_ACCESS_DENIED, broker.string("reason", "not for you")));
    const CMPIStatus status = enumerateConformances("root/interop");
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_THAT(CMGetCharPtr(status.msg), HasSubstr("failed with code 2: not for you"));
    EXPECT_EQ(returned().closed, 0U);
    EXPECT_THAT(Transcript::instance().calls(),
                testing::Contains(testing::StartsWith("log 6000 Corvane.ProfileProvider ")));
}

TEST_F(Profile, LetsNoExceptionOut) {
    for (const char* slot : {"newObjectPath", "enumerateInstanceNames", "addKey", "returnObjectPath", "returnDone"}) {
        broker.faults.clear();
        broker.faults.at(slot, 1, OrvTest::throws(std::runtime_error("thrown by the broker")));
        EXPECT_EQ(enumerateConformances("root/cimv2").rc, CMPI_RC_ERR_FAILED) << slot;
    }
}

TEST(ProfileLibrary, ExportsItsFactoriesOnly) {
    EXPECT_THAT(AgentTest::exportedSymbols(ORV_PROFILE_LIBRARY),
                UnorderedElementsAre(
                    "RegisteredProfileProvider_Create_InstanceMI", "ElementConformsToProfileProvider_Create_InstanceMI",
                    "ElementConformsToProfileProvider_Create_AssociationMI",
                    "ReferencedProfileProvider_Create_InstanceMI", "ReferencedProfileProvider_Create_AssociationMI"));
}

} // namespace

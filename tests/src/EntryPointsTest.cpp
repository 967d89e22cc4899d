/**
 * The exported factories, the function tables behind them, and the operations that are refused.
 */
#include "Expected.h"
#include "ProviderLibrary.h"
#include "RequestFixture.h"

#include <fstream>
#include <iterator>
#include <set>

namespace OrvTest {
namespace {

class EntryPoints : public RequestFixture {
protected:
    ProviderLibrary library;
    CMPIContext* context = broker.context("context");
    CMPIResult* result = broker.result("result");
};

template <typename MI>
void expectTable(const MI& mi, const std::string& name) {
    EXPECT_EQ(mi.hdl, nullptr);
    ASSERT_NE(mi.ft, nullptr);
    EXPECT_EQ(mi.ft->ftVersion, 200);
    EXPECT_EQ(mi.ft->miVersion, 200);
    EXPECT_EQ(mi.ft->miName, name);
    EXPECT_NE(mi.ft->cleanup, nullptr);
}

void expectRefused(const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(status.msg, nullptr);
}

void expectOk(const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_EQ(status.msg, nullptr);
}

/** The classes without "TALVO_", each with a provider and a source file of its own. */
const char* const classes[] = {"PowerManagementService", "PowerManagementCapabilities",
                               "AssociatedPowerManagementService", "PowerManagementElementCapabilities",
                               "PowerManagementHostedService"};

/** One instance provider by the name of its class without "TALVO_". */
class InstanceEntryPoints : public EntryPoints, public testing::WithParamInterface<const char*> {
protected:
    InstanceEntryPoints() {
        broker.instanceNames["TALVO_ComputerSystem"] = {broker.path("system", "root/cimv2", "TALVO_ComputerSystem")};
    }

    const std::string provider = std::string(GetParam()) + "Provider";
    CMPIInstanceMI* mi = library.instanceMI(provider, broker);
};

INSTANTIATE_TEST_SUITE_P(Providers, InstanceEntryPoints, testing::ValuesIn(classes),
                         [](const auto& tested) { return tested.param; });

TEST_P(InstanceEntryPoints, HaveATableOfTheirOwn) {
    ASSERT_NO_FATAL_FAILURE(expectTable(*mi, "instance" + provider));
    EXPECT_NE(mi->ft->enumerateInstanceNames, nullptr);
    EXPECT_NE(mi->ft->enumerateInstances, nullptr);
    EXPECT_NE(mi->ft->getInstance, nullptr);
}

TEST_P(InstanceEntryPoints, GiveTheSameRecordEveryTime) {
    const RecordingBroker other("other");
    EXPECT_EQ(library.instanceMI(provider, other), mi);
    EXPECT_EQ(library.instanceMI(provider, broker), mi);
}

TEST_P(InstanceEntryPoints, TheFactoryDoesNothingElse) {
    CMPIStatus status = {CMPI_RC_ERR_ACCESS_DENIED, broker.string("message", "from before")};
    const CMPIString* message = status.msg;
    library.instanceMI(provider, broker, &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(status.msg, message);
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_P(InstanceEntryPoints, OperationsUseTheBrokerOfTheLastCall) {
    RecordingBroker other("other");
    library.instanceMI(provider, other);
    haveNodes({"a"});
    expectOk(mi->ft->enumerateInstanceNames(mi, context, result, ref));
    EXPECT_THAT(transcript.calls(), testing::Contains(testing::StartsWith("other.newObjectPath(")));
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(testing::StartsWith("broker."))));
}

TEST_P(InstanceEntryPoints, OtherProvidersDoNotChangeTheBroker) {
    RecordingBroker other("other");
    for (const char* prefix : classes) {
        if (std::string(prefix) != GetParam()) {
            library.instanceMI(std::string(prefix) + "Provider", other);
        }
    }
    haveNodes({"a"});
    expectOk(mi->ft->enumerateInstanceNames(mi, context, result, ref));
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(testing::StartsWith("other."))));
}

TEST_P(InstanceEntryPoints, CreatingModifyingAndDeletingIsRefused) {
    const CMPIInstance* instance = broker.instance("instance", ref);
    expectRefused(mi->ft->createInstance(mi, context, result, ref, instance));
    expectRefused(mi->ft->modifyInstance(mi, context, result, ref, instance, nullptr));
    expectRefused(mi->ft->deleteInstance(mi, context, result, ref));
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_P(InstanceEntryPoints, QueriesAreRefusedInAnyLanguage) {
    for (const char* language : {"WQL", "DMTF:CQL", ""}) {
        expectRefused(mi->ft->execQuery(mi, context, result, ref, language, "SELECT * FROM TALVO_ComputerSystem"));
    }
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_P(InstanceEntryPoints, RefusalsDoNotTouchTheirArguments) {
    expectRefused(mi->ft->createInstance(nullptr, nullptr, nullptr, nullptr, nullptr));
    expectRefused(mi->ft->modifyInstance(nullptr, nullptr, nullptr, nullptr, nullptr, nullptr));
    expectRefused(mi->ft->deleteInstance(nullptr, nullptr, nullptr, nullptr));
    expectRefused(mi->ft->execQuery(nullptr, nullptr, nullptr, nullptr, nullptr, nullptr));
}

TEST_P(InstanceEntryPoints, CleanupIsAlwaysFine) {
    for (const CMPIBoolean terminating : {0, 1}) {
        expectOk(mi->ft->cleanup(mi, context, terminating));
        expectOk(mi->ft->cleanup(nullptr, nullptr, terminating));
    }
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_P(InstanceEntryPoints, AnOperationStillWorksAfterCleanup) {
    haveNodes({"a"});
    mi->ft->cleanup(mi, context, 1);
    expectOk(mi->ft->enumerateInstanceNames(mi, context, result, ref));
    EXPECT_EQ(broker.returned(result).paths.size(), 1);
}

/** One association provider by the name of its class without "TALVO_". */
class AssociationEntryPoints : public EntryPoints, public testing::WithParamInterface<const char*> {
protected:
    const std::string provider = std::string(GetParam()) + "Provider";
    CMPIAssociationMI* mi = library.associationMI(provider, broker);
};

INSTANTIATE_TEST_SUITE_P(Providers, AssociationEntryPoints,
                         testing::Values("AssociatedPowerManagementService", "PowerManagementElementCapabilities",
                                         "PowerManagementHostedService"),
                         [](const auto& tested) { return tested.param; });

TEST_P(AssociationEntryPoints, HaveATableOfTheirOwn) {
    ASSERT_NO_FATAL_FAILURE(expectTable(*mi, "association" + provider));
    EXPECT_NE(mi->ft->associators, nullptr);
    EXPECT_NE(mi->ft->associatorNames, nullptr);
    EXPECT_NE(mi->ft->references, nullptr);
    EXPECT_NE(mi->ft->referenceNames, nullptr);
}

TEST_P(AssociationEntryPoints, EachOperationStandsInItsSlot) {
    const auto entered = [this](const char* operation) {
        const std::string mark = "ENTERING: " + std::string(GetParam()) + '_' + operation + "() in ";
        const Lines calls = transcript.calls();
        transcript.clear();
        return calls.size() > 1 && calls[1].find(mark) != std::string::npos;
    };
    mi->ft->associators(mi, context, result, ref, "", nullptr, nullptr, nullptr, nullptr);
    EXPECT_TRUE(entered("Associators"));
    mi->ft->associatorNames(mi, context, result, ref, nullptr, nullptr, nullptr, nullptr);
    EXPECT_TRUE(entered("AssociatorNames"));
    mi->ft->references(mi, context, result, ref, nullptr, nullptr, nullptr);
    EXPECT_TRUE(entered("References"));
    mi->ft->referenceNames(mi, context, result, ref, nullptr, nullptr);
    EXPECT_TRUE(entered("ReferenceNames"));
}

TEST_P(AssociationEntryPoints, GiveTheSameRecordEveryTime) {
    const RecordingBroker other("other");
    EXPECT_EQ(library.associationMI(provider, other), mi);
    EXPECT_EQ(library.associationMI(provider, broker), mi);
}

TEST_P(AssociationEntryPoints, TheFactoryDoesNothingElse) {
    CMPIStatus status = {CMPI_RC_ERR_ACCESS_DENIED, broker.string("message", "from before")};
    const CMPIString* message = status.msg;
    library.associationMI(provider, broker, &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_EQ(status.msg, message);
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_P(AssociationEntryPoints, ShareTheirFilesBroker) {
    RecordingBroker other("other");
    library.instanceMI(provider, other);
    haveNodes({"a"});
    expectOk(mi->ft->associatorNames(mi, context, result, ref, nullptr, nullptr, nullptr, nullptr));
    EXPECT_THAT(transcript.calls(), testing::Contains(testing::StartsWith("other.newObjectPath(")));
    CMPIInstanceMI* instances = library.instanceMI(provider, broker);
    library.associationMI(provider, other);
    transcript.clear();
    instances->ft->enumerateInstanceNames(instances, context, result, ref);
    EXPECT_THAT(transcript.calls(), testing::Contains(testing::StartsWith("other.newObjectPath(")));
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(testing::StartsWith("broker."))));
}

TEST_P(AssociationEntryPoints, OtherProvidersDoNotChangeTheBroker) {
    RecordingBroker other("other");
    for (const char* prefix : classes) {
        if (std::string(prefix) != GetParam()) {
            library.instanceMI(std::string(prefix) + "Provider", other);
        }
    }
    haveNodes({"a"});
    expectOk(mi->ft->associatorNames(mi, context, result, ref, nullptr, nullptr, nullptr, nullptr));
    EXPECT_THAT(transcript.calls(), testing::Not(testing::Contains(testing::StartsWith("other."))));
}

TEST_P(AssociationEntryPoints, CleanupIsAlwaysFine) {
    for (const CMPIBoolean terminating : {0, 1}) {
        expectOk(mi->ft->cleanup(mi, context, terminating));
        expectOk(mi->ft->cleanup(nullptr, nullptr, terminating));
    }
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
    haveNodes({"a"});
    expectOk(mi->ft->referenceNames(mi, context, result, ref, nullptr, nullptr));
    EXPECT_EQ(broker.returned(result).closed, 0);
}

TEST_F(EntryPoints, NoRecordAndNoTableIsSharedByTwoFactories) {
    std::set<const void*> records;
    std::set<const void*> tables;
    const auto add = [&](const auto* mi) {
        records.insert(mi);
        tables.insert(mi->ft);
    };
    for (const char* prefix : classes) {
        add(library.instanceMI(std::string(prefix) + "Provider", broker));
    }
    for (const char* prefix :
         {"AssociatedPowerManagementService", "PowerManagementElementCapabilities", "PowerManagementHostedService"}) {
        add(library.associationMI(std::string(prefix) + "Provider", broker));
    }
    add(library.methodMI("PowerManagementServiceProvider", broker));
    EXPECT_EQ(records.size(), 9);
    EXPECT_EQ(tables.size(), 9);
}

TEST_F(EntryPoints, TheMethodProviderHasATableOfItsOwn) {
    CMPIMethodMI* mi = library.methodMI("PowerManagementServiceProvider", broker);
    ASSERT_NO_FATAL_FAILURE(expectTable(*mi, "methodPowerManagementServiceProvider"));
    EXPECT_NE(mi->ft->invokeMethod, nullptr);
    const RecordingBroker other("other");
    EXPECT_EQ(library.methodMI("PowerManagementServiceProvider", other), mi);
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_F(EntryPoints, TheMethodFactoryDoesNotWriteTheStatus) {
    CMPIStatus status = {CMPI_RC_ERR_ACCESS_DENIED, nullptr};
    library.methodMI("PowerManagementServiceProvider", broker, &status);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_ACCESS_DENIED);
}

TEST_F(EntryPoints, TheMethodProvidersCleanupIsAlwaysFine) {
    CMPIMethodMI* mi = library.methodMI("PowerManagementServiceProvider", broker);
    for (const CMPIBoolean terminating : {0, 1}) {
        expectOk(mi->ft->cleanup(mi, context, terminating));
        expectOk(mi->ft->cleanup(nullptr, nullptr, terminating));
    }
    EXPECT_THAT(transcript.everything(), testing::IsEmpty());
}

TEST_F(EntryPoints, BothProvidersOfAFileShareItsBroker) {
    RecordingBroker other("other");
    CMPIInstanceMI* mi = library.instanceMI("PowerManagementServiceProvider", broker);
    library.methodMI("PowerManagementServiceProvider", other);
    haveNodes({"a"});
    expectOk(mi->ft->enumerateInstanceNames(mi, context, result, ref));
    EXPECT_THAT(transcript.calls(), testing::Contains(testing::StartsWith("other.newObjectPath(")));
}

/**
 * The library has texts for two failures that cannot happen: another failure always comes first (a record without an
 * instance ID), or the factory never reports one (instances of capabilities).
 */
TEST_F(EntryPoints, TheLibraryHasTextsForFailuresThatCannotHappen) {
    std::ifstream file(ProviderLibrary::file, std::ios::binary);
    const std::string content{std::istreambuf_iterator<char>(file), {}};
    ASSERT_FALSE(content.empty()) << ProviderLibrary::file;
    for (const char* text :
         {"Failed while setting Name.", "Failed while setting Element Name.",
          "Failed while setting Capabilities Element Name.", "Failed while setting PowerChangeCapabilities.",
          "Failed while setting PowerStatesSupported.", "Failed while setting PowerState.",
          "getAllPMCapCMPIInstances Failed",
          " getAllPMCapCMPIInstances Failed for powerManagementCapabilitiesClass class",
          "getAllPMCapCMPIInstances Failed for powerManagementCapabilitiesClass"}) {
        EXPECT_NE(content.find('\0' + std::string(text) + '\0'), std::string::npos) << text;
    }
}

} // namespace
} // namespace OrvTest

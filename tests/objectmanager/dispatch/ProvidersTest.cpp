#include "dispatch/Providers.h"

#include "TestProviders.h"

#include <cstdlib>
#include <fstream>

namespace ObjectManager {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

class ProvidersTest : public testing::Test {
protected:
    ProvidersTest() {
        broker.setMessageSink(
            [this](const BrokerMessage& message) { messages.push_back(message.source + ": " + message.text); });
    }

    std::vector<std::string> messages;
    Broker broker;
    const std::string file = std::filesystem::canonical(testProviders / "liborvbrokenprovider.so");
};

TEST_F(ProvidersTest, AProviderIsMadeOnce) {
    Providers providers(broker, {testProviders});
    CMPIInstanceMI& first = providers.instanceProvider(testRegistration("Test_Disk"));
    EXPECT_STREQ("instanceTestProvider", first.ft->miName);
    EXPECT_EQ(&first, &providers.instanceProvider(testRegistration("Test_Other")));
    EXPECT_STREQ("methodTestProvider", providers.methodProvider(testRegistration("Test_Disk")).ft->miName);
}

TEST_F(ProvidersTest, CleanupIsCalledAtTheEndAndItsFailureIsLogged) {
    {
        Providers providers(broker, {testProviders});
        providers.instanceProvider(testRegistration("Test_Disk"));
        providers.methodProvider(testRegistration("Test_Disk"));
        EXPECT_THAT(messages, IsEmpty());
    }
    EXPECT_THAT(messages, ElementsAre("instance: terminating",
                                      "TestProvider_Create_MethodMI: cleanup threw an exception: no cleaning today"));
}

TEST_F(ProvidersTest, AllKindsOfAProviderAreMadeBeforeItsFirstOperation) {
    {
        Providers providers(broker, {testProviders});
        providers.instanceProvider(testRegistration("Test_Disk"));
    }
    EXPECT_THAT(messages, Contains("TestProvider_Create_MethodMI: cleanup threw an exception: no cleaning today"));
}

TEST_F(ProvidersTest, CheckReportsTheLibraryAndItsFactories) {
    Providers providers(broker, {"/nonexistent", testProviders});
    const ProviderReport report = providers.check(testRegistration("Test_Disk"));
    EXPECT_TRUE(report.usable());
    EXPECT_EQ("", report.problem);
    EXPECT_EQ(std::filesystem::canonical(testProviders / "liborvtestprovider.so"), report.library);
    ASSERT_EQ(2U, report.factories.size());
    EXPECT_EQ("TestProvider_Create_InstanceMI", report.factories[0].factory);
    EXPECT_EQ("instanceTestProvider", report.factories[0].miName);
    EXPECT_EQ(200, report.factories[0].tableVersion);
    EXPECT_EQ(200, report.factories[0].miVersion);
    EXPECT_EQ("TestProvider_Create_MethodMI", report.factories[1].factory);
}

TEST_F(ProvidersTest, CheckReportsTheProblemOfAFactory) {
    Providers providers(broker, {testProviders});
    const std::vector<std::pair<const char*, std::string>> cases = {
        {"ReturnsNull", "returned no provider, code 0"},
        {"ReportsFailure", "returned no provider, code 2: no licence"},
        {"Throws", "threw an exception: no disk"},
        {"NoTable", "returned a provider without a function table"},
        {"NullSlot", "returned a function table whose slot enumerateInstanceNames is null"},
        {"OldVersion", "returned a function table of version 99, expected 100 to 210"},
        {"Nameless", "returned a function table without a name"},
    };
    for (const auto& [provider, problem] : cases) {
        const std::string expected = std::string(provider) + "_Create_InstanceMI in " + file + ' ' + problem;
        const ProviderReport report = providers.check(brokenRegistration(provider));
        EXPECT_FALSE(report.usable());
        EXPECT_EQ(file, report.library);
        ASSERT_EQ(1U, report.factories.size());
        EXPECT_EQ(expected, report.factories[0].problem);
        EXPECT_THAT(errorOf([&, name = provider] { providers.instanceProvider(brokenRegistration(name)); }),
                    isError(CMPI_RC_ERR_FAILED, expected));
    }
    const ProviderReport oldVersion = providers.check(brokenRegistration("OldVersion"));
    EXPECT_EQ("instanceOldVersion", oldVersion.factories.at(0).miName);
    EXPECT_EQ(99, oldVersion.factories.at(0).tableVersion);
}

TEST_F(ProvidersTest, AMissingFactoryIsNamed) {
    Providers providers(broker, {testProviders});
    EXPECT_EQ(file + " has no factory Missing_Create_InstanceMI",
              providers.check(brokenRegistration("Missing")).factories.at(0).problem);
    Registration association = brokenRegistration("NullSlot");
    association.instance = false;
    association.association = true;
    EXPECT_FALSE(providers.check(association).usable());
}

TEST_F(ProvidersTest, CheckReportsKindsThatAreNotServed) {
    Providers providers(broker, {testProviders});
    Registration indications = testRegistration("Test_Disk");
    indications.indication = true;
    EXPECT_EQ("property and indication providers are not served", providers.check(indications).problem);
}

class LibrariesTest : public ProvidersTest {
protected:
    LibrariesTest() {
        std::string name = testing::TempDir() + "providers.XXXXXX";
        folder = mkdtemp(name.data());
    }
    ~LibrariesTest() override { std::filesystem::remove_all(folder); }

    static Registration at(const std::string& location) {
        Registration registration = testRegistration("Test_Disk");
        registration.location = location;
        return registration;
    }

    std::filesystem::path folder;
};

TEST_F(LibrariesTest, AreLookedForFolderByFolderWithVersionFirst) {
    std::filesystem::create_symlink(testProviders / "liborvtestprovider.so", folder / "libdisks.so.1");
    std::ofstream(folder / "libdisks.so") << "never looked at";
    Providers providers(broker, {folder, testProviders});
    EXPECT_EQ(std::filesystem::canonical(testProviders / "liborvtestprovider.so"),
              providers.check(at("disks")).library);
}

TEST_F(LibrariesTest, ThatAreMissingAreNamedWithTheFoldersThatWereSearched) {
    Providers providers(broker, {"/nonexistent", folder});
    const ProviderReport report = providers.check(at("disks"));
    EXPECT_FALSE(report.usable());
    EXPECT_EQ("", report.library);
    EXPECT_THAT(report.factories, IsEmpty());
    EXPECT_EQ("provider library libdisks.so.1 or libdisks.so not found in /nonexistent, " + folder.string(),
              report.problem);
}

TEST_F(LibrariesTest, ThatDoNotLoadAreReportedInOneLine) {
    std::ofstream(folder / "libdisks.so") << "this is no library";
    Providers providers(broker, {folder});
    const CimError error = errorOf([&] { providers.instanceProvider(at("disks")); });
    EXPECT_EQ(CMPI_RC_ERR_FAILED, error.code);
    EXPECT_THAT(error.what(),
                testing::AllOf(testing::StartsWith("provider library does not load: "),
                               testing::HasSubstr(folder / "libdisks.so"), testing::Not(testing::HasSubstr("\n"))));
}

TEST_F(LibrariesTest, AreTriedAgainOnceTheyExist) {
    Providers providers(broker, {folder});
    EXPECT_FALSE(providers.check(at("disks")).usable());
    std::filesystem::create_symlink(testProviders / "liborvtestprovider.so", folder / "libdisks.so");
    EXPECT_TRUE(providers.check(at("disks")).usable());
}

} // namespace
} // namespace ObjectManager

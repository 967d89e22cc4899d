/*
 * Tests what a client that knows only the object manager's address can find out, with the shipped registrations and
 * providers.
 */
#include "interop/OwnProviders.h"

#include "CimErrors.h"
#include "TestSupport.h"
#include "classes/Catalogue.h"
#include "classes/Literals.h"
#include "dispatch/Dispatcher.h"
#include "registry/RegistrationReader.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <variant>
#include <vector>

#include <unistd.h>

namespace ObjectManager::Interop {
namespace {

using testing::Each;
using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;
using testing::SizeIs;

constexpr const char* interop = "root/interop";
constexpr const char* managerClass = "CIM_ObjectManager";
constexpr const char* nameSpaceClass = "CIM_Namespace";
constexpr const char* mechanismClass = "CIM_CIMXMLCommunicationMechanism";
constexpr const char* profileClass = "TALVO_RegisteredProfile";
constexpr const char* serviceClass = "TALVO_PowerManagementService";

/** A machine with a name, whose state is in a folder of the test's own. */
class Machine {
public:
    Machine() {
        AgentTest::writeFile(_folder / "agent.toml", "[system]\nname = \"machine.example\"\n"
                                                     "[log]\ndestination = \"file\"\nfile = \"" +
                                                         (_folder / "log").string() +
                                                         "\"\n[instrumentation.simulated]\nstate-file = \"" +
                                                         (_folder / "state").string() + "\"\n");
        setenv("ORV_AGENT_CONFIG", (_folder / "agent.toml").c_str(), 1);
    }

private:
    AgentTest::TemporaryFolder _folder;
};

class Discovery : public testing::Test {
protected:
    Discovery() {
        static const Machine machine;
        start();
    }

    /** Starts an object manager with the shipped registrations, except those of the classes in `without`. */
    void start(const std::vector<std::string>& without = {}) {
        std::vector<Registration> registrations = readRegistrations(std::filesystem::path(TEST_SCHEMA));
        std::erase_if(registrations, [&](const Registration& registration) {
            return std::find(without.begin(), without.end(), registration.className) != without.end();
        });
        const Registry registry(registrations);
        dispatcher.reset();
        providers.emplace(Facts{"1.2.3", registry.nameSpaces()});
        dispatcher.emplace(
            registry, Dispatcher::Settings{.folders = {TEST_LIBRARIES}, .classes = &catalogue, .builtIn = &*providers});
    }

    std::vector<Instance> instances(const char* className, const char* nameSpace = interop) {
        return dispatcher->enumerateInstances({}, {{}, nameSpace, className, {}}, std::nullopt);
    }
    std::vector<ObjectPath> names(const char* className, const char* nameSpace = interop) {
        return dispatcher->enumerateInstanceNames({}, {{}, nameSpace, className, {}});
    }

    std::vector<ObjectPath> associated(const ObjectPath& source, const AssociationFilter& filter = {}) {
        std::vector<ObjectPath> paths;
        for (const auto& found : dispatcher->associatorNames({}, source, filter)) {
            paths.insert(paths.end(), found.objects.begin(), found.objects.end());
        }
        return paths;
    }

    ObjectPath profile(const std::string& name, const char* nameSpace = interop) {
        for (const Instance& instance : instances(profileClass, nameSpace)) {
            if (text(instance, "RegisteredName") == name) {
                return instance.path;
            }
        }
        ADD_FAILURE() << "there is no profile " << name;
        return {};
    }

    static const Value& value(const Instance& instance, const char* property) {
        static const Value none;
        const NamedValue* const found = find(instance.properties, property);
        EXPECT_NE(found, nullptr) << property;
        return found == nullptr ? none : found->value;
    }
    static std::string text(const Instance& instance, const char* property) {
        const auto* const content = std::get_if<std::string>(&value(instance, property).content);
        EXPECT_NE(content, nullptr) << property;
        return content == nullptr ? "" : *content;
    }
    static std::vector<std::string> texts(const std::vector<Instance>& instances, const char* property) {
        std::vector<std::string> found;
        for (const Instance& instance : instances) {
            found.push_back(text(instance, property));
        }
        return found;
    }
    static std::string key(const ObjectPath& path, const char* name) { return text({path, path.keys}, name); }

    /** Expects that the class declares each of these values with the value's type. */
    void expectDeclared(const std::string& className, const std::vector<NamedValue>& values) {
        const Class* const declaration = catalogue.find(className);
        ASSERT_NE(declaration, nullptr) << className;
        for (const NamedValue& named : values) {
            const std::string name = className + '.' + named.name;
            const Property* const property = declaration->property(named.name);
            ASSERT_NE(property, nullptr) << name << " is not declared";
            EXPECT_EQ(typeName(named.value.type), typeName(property->type)) << name;
            if (const auto* const path = std::get_if<std::shared_ptr<const ObjectPath>>(&named.value.content)) {
                EXPECT_TRUE(catalogue.isA((*path)->className, property->referenceClass)) << name;
                expectDeclared((*path)->className, (*path)->keys);
            }
        }
    }

    Catalogue catalogue = readCatalogue(TEST_SCHEMA);
    std::optional<OwnProviders> providers;
    std::optional<Dispatcher> dispatcher;
};

/** OpenPegasus refuses values that the class does not declare, or not with their type. */
TEST_F(Discovery, FindsOnlyValuesThatTheirClassesDeclare) {
    providers->answerOn({"https://192.0.2.7:5989", true});
    for (const Registration& registration : readRegistrations(std::filesystem::path(TEST_SCHEMA))) {
        for (const std::string& nameSpace : registration.nameSpaces) {
            const std::vector<Instance> found = instances(registration.className.c_str(), nameSpace.c_str());
            EXPECT_FALSE(found.empty()) << nameSpace << ':' << registration.className;
            for (const Instance& instance : found) {
                expectDeclared(instance.path.className, instance.properties);
                expectDeclared(instance.path.className, instance.path.keys);
                EXPECT_EQ(instance.path.keys.size(), catalogue.find(instance.path.className)->keys().size());
            }
        }
    }
}

/* The object manager */

TEST_F(Discovery, TellsWhoTheObjectManagerIsAndOnWhichMachineItRuns) {
    const std::vector<Instance> managers = instances(managerClass);
    ASSERT_THAT(managers, SizeIs(1));
    const Instance& manager = managers.front();
    EXPECT_EQ(text(manager, "SystemCreationClassName"), "TALVO_ComputerSystem");
    EXPECT_EQ(text(manager, "SystemName"), "machine.example");
    EXPECT_EQ(text(manager, "Name"), "orvcim:machine.example");
    EXPECT_EQ(text(manager, "ElementName"), "orvcim");
    EXPECT_EQ(text(manager, "Description"), "orvcim, the object manager of power management, version 1.2.3");
}

TEST_F(Discovery, NamesTheHostIfNobodyServesTheComputerSystem) {
    start({"TALVO_ComputerSystem"});
    const ObjectPath manager = names(managerClass).at(0);
    EXPECT_EQ(key(manager, "SystemCreationClassName"), "CIM_ComputerSystem");
    std::array<char, 256> host{};
    gethostname(host.data(), host.size() - 1);
    EXPECT_EQ(key(manager, "SystemName"), host.data());
}

TEST_F(Discovery, TellsEachNamespaceThatIsThere) {
    EXPECT_THAT(texts(instances(nameSpaceClass), "Name"), ElementsAre("interop", "root/cimv2", interop));
}

TEST_F(Discovery, AnswersInTheNamespaceThatWasAsked) {
    for (const char* nameSpace : {"interop", interop, "INTEROP"}) {
        for (const char* className : {managerClass, nameSpaceClass, profileClass, "CIM_NamespaceInManager"}) {
            EXPECT_THAT(names(className, nameSpace), Each(Field(&ObjectPath::nameSpace, nameSpace))) << className;
        }
        EXPECT_THAT(associated(names(managerClass, nameSpace).at(0)), Each(Field(&ObjectPath::nameSpace, nameSpace)));
    }
}

TEST_F(Discovery, LeadsFromTheObjectManagerToItsNamespacesAndBack) {
    const ObjectPath manager = names(managerClass).at(0);
    EXPECT_EQ(associated(manager), names(nameSpaceClass));
    for (const ObjectPath& nameSpace : names(nameSpaceClass)) {
        EXPECT_THAT(associated(nameSpace), ElementsAre(manager));
        EXPECT_THAT(associated(nameSpace, {"", "", "Dependent", "Antecedent"}), ElementsAre(manager));
        EXPECT_THAT(associated(nameSpace, {"", "", "Antecedent", ""}), IsEmpty());
        EXPECT_THAT(associated(nameSpace, {"", nameSpaceClass, "", ""}), IsEmpty());
    }
    const auto found = dispatcher->associators({}, manager, {}, std::vector<std::string>{"ClassType"});
    ASSERT_THAT(found, SizeIs(1));
    ASSERT_THAT(found.front().objects, SizeIs(3));
    EXPECT_EQ(value(found.front().objects.front(), "ClassType"), unsignedValue(CMPI_uint16, 2));
}

TEST_F(Discovery, TellsHowItIsReachedOnceItIs) {
    EXPECT_THAT(instances(mechanismClass), IsEmpty());
    EXPECT_THAT(instances("CIM_CommMechanismForManager"), IsEmpty());

    providers->answerOn({"https://192.0.2.7:5989", true});
    const std::vector<Instance> mechanisms = instances(mechanismClass);
    ASSERT_THAT(mechanisms, SizeIs(1));
    EXPECT_EQ(text(mechanisms.front(), "Name"), "https://192.0.2.7:5989");
    const Value basic = arrayValue(CMPI_uint16, {unsignedValue(CMPI_uint16, 3)});
    EXPECT_EQ(value(mechanisms.front(), "AuthenticationMechanismsSupported"), basic);
    const ObjectPath manager = names(managerClass).at(0);
    EXPECT_THAT(associated(manager, {"CIM_CommMechanismForManager", "", "", ""}), ElementsAre(mechanisms.front().path));
    EXPECT_THAT(associated(mechanisms.front().path), ElementsAre(manager));
}

TEST_F(Discovery, TellsIfNobodyHasToLogIn) {
    providers->answerOn({"http://127.0.0.1:5988", false});
    const Value none = arrayValue(CMPI_uint16, {unsignedValue(CMPI_uint16, 2)});
    EXPECT_EQ(value(instances(mechanismClass).at(0), "AuthenticationMechanismsSupported"), none);
}

TEST_F(Discovery, GetsAnInstanceByItsPathOnly) {
    ObjectPath path = names(nameSpaceClass).at(1);
    EXPECT_EQ(text(dispatcher->getInstance({}, path, std::nullopt), "Name"), "root/cimv2");
    find(path.keys, "Name")->value = stringValue("root/other");
    EXPECT_THROW(
        try { dispatcher->getInstance({}, path, std::nullopt); } catch (const CimError& error) {
            EXPECT_EQ(error.code, CMPI_RC_ERR_NOT_FOUND);
            throw;
        },
        CimError);
}

TEST_F(Discovery, IsNotChangedByClients) {
    const ObjectPath path = names(nameSpaceClass).at(0);
    const auto codeOf = [](auto operation) {
        try {
            operation();
        } catch (const CimError& error) {
            return error.code;
        }
        return CMPI_RC_OK;
    };
    EXPECT_EQ(codeOf([&] { dispatcher->deleteInstance({}, path); }), CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(codeOf([&] { dispatcher->createInstance({}, path, {path, {}}); }), CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(codeOf([&] {
                  dispatcher->modifyInstance({}, path, {path, {}}, std::nullopt);
              }),
              CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(Discovery, IsCheckedAsEveryProviderIs) {
    for (const Registration& registration : dispatcher->registry().registrations()) {
        if (registration.location == providers->location()) {
            const ProviderReport report = dispatcher->check(registration);
            EXPECT_TRUE(report.usable()) << registration.className;
            EXPECT_EQ(report.library, std::filesystem::read_symlink("/proc/self/exe"));
            EXPECT_THAT(report.factories, SizeIs(registration.association ? 2 : 1));
        }
    }
}

/* The profiles */

TEST_F(Discovery, AdvertisesTheProfiles) {
    const std::vector<Instance> profiles = instances(profileClass);
    EXPECT_THAT(texts(profiles, "RegisteredName"), ElementsAre("Power State Management", "Profile Registration"));
    EXPECT_THAT(texts(profiles, "RegisteredVersion"), ElementsAre("1.0.2", "1.0.0"));
    for (const Instance& instance : profiles) {
        EXPECT_EQ(value(instance, "RegisteredOrganization"), unsignedValue(CMPI_uint16, 2));
    }
}

TEST_F(Discovery, LeadsFromTheProfileToTheServiceInItsOwnNamespace) {
    for (const char* nameSpace : {interop, "interop"}) {
        const ObjectPath power = profile("Power State Management", nameSpace);
        const AssociationFilter filter{"CIM_ElementConformsToProfile", "", "ConformantStandard", "ManagedElement"};
        EXPECT_EQ(associated(power, filter), names(serviceClass, "root/cimv2"));
        const auto found = dispatcher->associators({}, power, filter, std::nullopt);
        ASSERT_THAT(found, SizeIs(1));
        ASSERT_THAT(found.front().objects, SizeIs(1));
        EXPECT_EQ(text(found.front().objects.front(), "Name"), "PowerStateManagement_system");
        const std::vector<Instance> links = dispatcher->references({}, power, filter, std::nullopt);
        ASSERT_THAT(links, SizeIs(1));
        EXPECT_EQ(value(links.front(), "ConformantStandard"), referenceValue(power));
        EXPECT_EQ(value(links.front(), "ManagedElement"), referenceValue(names(serviceClass, "root/cimv2").at(0)));
    }
}

TEST_F(Discovery, LeadsFromTheServiceToTheProfile) {
    const ObjectPath service = names(serviceClass, "root/cimv2").at(0);
    const ObjectPath power = profile("Power State Management");
    EXPECT_THAT(associated(service, {"", "CIM_RegisteredProfile", "", ""}), ElementsAre(power));
    const std::vector<ObjectPath> links =
        dispatcher->referenceNames({}, service, {"CIM_ElementConformsToProfile", "", "", ""});
    ASSERT_THAT(links, SizeIs(1));
    EXPECT_EQ(links.front().nameSpace, "root/cimv2");
    EXPECT_EQ(links, names("TALVO_ElementConformsToProfile", "root/cimv2"));
    const auto found = dispatcher->associators({}, service, {"", "CIM_RegisteredProfile", "", ""}, std::nullopt);
    ASSERT_THAT(found, SizeIs(1));
    EXPECT_THAT(texts(found.front().objects, "RegisteredName"), ElementsAre("Power State Management"));
}

TEST_F(Discovery, LeadsFromNothingElseToTheProfile) {
    const ObjectPath system = names("TALVO_ComputerSystem", "root/cimv2").at(0);
    EXPECT_THAT(associated(system, {"CIM_ElementConformsToProfile", "", "", ""}), IsEmpty());
    EXPECT_THAT(associated(profile("Profile Registration"), {"CIM_ElementConformsToProfile", "", "", ""}), IsEmpty());
}

TEST_F(Discovery, SaysThatNothingConformsIfNoServiceIsServed) {
    start({serviceClass});
    EXPECT_THAT(instances("TALVO_ElementConformsToProfile"), IsEmpty());
    EXPECT_THAT(associated(profile("Power State Management"), {"CIM_ElementConformsToProfile", "", "", ""}), IsEmpty());
}

TEST_F(Discovery, SaysWhichProfileRefersToWhich) {
    const ObjectPath power = profile("Power State Management");
    const ObjectPath registration = profile("Profile Registration");
    const AssociationFilter referenced{"CIM_ReferencedProfile", "", "", "Antecedent"};
    EXPECT_THAT(associated(power, referenced), ElementsAre(registration));
    EXPECT_THAT(associated(registration, referenced), IsEmpty());
    EXPECT_THAT(associated(registration, {"CIM_ReferencedProfile", "", "", ""}), ElementsAre(power));
}

} // namespace
} // namespace ObjectManager::Interop

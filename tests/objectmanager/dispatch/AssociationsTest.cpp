/* Tests walks over associations, from a host to its disks and its tape. */
#include "TestProviders.h"

#include "classes/Catalogue.h"
#include "classes/MofReader.h"

#include <optional>
#include <ostream>
#include <thread>

namespace ObjectManager {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

constexpr const char* declarations = R"(
class CIM_Device { [Key] string Name; };
class CIM_Disk : CIM_Device {};
class Test_Disk : CIM_Disk { string Vendor; uint32 Size; };
class Test_Tape : CIM_Device {};
class Test_Mirrored : CIM_Device { CIM_Disk REF Mirror; };
class Test_Host { [Key] string Name; };
[Association] class CIM_Has { [Key] Test_Host REF Host; [Key] CIM_Device REF Disk; };
[Association] class Test_HasDisk : CIM_Has { [Override("Disk")] Test_Disk REF Disk; string Since; };
[Association] class Test_BootsFrom : CIM_Has { [Override("Disk")] Test_Disk REF Disk; };
[Association] class Test_Links : CIM_Has {};
[Association] class Test_Between { [Key] Test_Disk REF First; [Key] Test_Disk REF Second; };
[Association] class Test_ShowsFilter : CIM_Has {};
[Association] class Test_Fails : CIM_Has {};
[Association] class Test_GivesNothing : CIM_Has {};
[Association] class Test_AsksAnother : CIM_Has {};
[Association] class Test_AsksNobody : CIM_Has {};
[Association] class Test_AsksForItself : CIM_Has {};
)";

class AssociationsTest : public testing::Test {
protected:
    static ObjectPath path(const std::string& className, const std::string& name) {
        return {"", "root/cimv2", className, {{"Name", stringValue(name)}}};
    }

    static ObjectPath disk(const std::string& name) { return path("Test_Disk", name); }

    static ObjectPath reference(const std::string& className, const std::string& name) {
        return {"",
                "root/cimv2",
                className,
                {{"Host", referenceValue(path("Test_Host", "h"))}, {"Disk", referenceValue(disk(name))}}};
    }

    static std::vector<ObjectPath> pathsOf(const std::vector<Instance>& instances) {
        std::vector<ObjectPath> paths;
        for (const Instance& instance : instances) {
            paths.push_back(instance.path);
        }
        return paths;
    }

    /** One text for each object: the association class and the object's name. */
    static std::vector<std::string> wordsOf(const std::vector<Associated<ObjectPath>>& found) {
        std::vector<std::string> words;
        for (const Associated<ObjectPath>& each : found) {
            for (const ObjectPath& object : each.objects) {
                words.push_back(each.associationClass + ' ' + std::get<std::string>(object.keys.at(0).value.content));
            }
        }
        return words;
    }

    /** A dispatcher with the registrations of these association classes. */
    Dispatcher& serving(const std::vector<std::string>& associations) {
        std::vector<Registration> registrations = {testRegistration("Test_Disk")};
        for (const std::string& className : associations) {
            registrations.push_back(testAssociation(className));
        }
        return dispatcher.emplace(Registry(registrations), Dispatcher::Settings{{testProviders}, &catalogue, &log});
    }

    std::vector<std::string> names(Dispatcher& served, const AssociationFilter& filter = {}) {
        std::vector<std::string> words = wordsOf(served.associatorNames(invocation, host, filter));
        std::vector<Associated<ObjectPath>> instances;
        for (const Associated<Instance>& each : served.associators(invocation, host, filter, std::nullopt)) {
            instances.push_back({each.associationClass, pathsOf(each.objects)});
        }
        EXPECT_EQ(words, wordsOf(instances)) << "names and instances tell of different objects";
        return words;
    }

    const ObjectPath host = path("Test_Host", "h");
    const Invocation invocation;
    Catalogue catalogue{readMof(declarations, "test")};
    LogTap log;
    std::optional<Dispatcher> dispatcher;
};

TEST_F(AssociationsTest, LeadToEveryObjectOncePerAssociationInTheOrderOfRegistration) {
    EXPECT_THAT(names(serving({"Test_HasDisk", "Test_GivesNothing", "Test_BootsFrom"})),
                ElementsAre("Test_HasDisk b", "Test_HasDisk a", "Test_BootsFrom a"));
    EXPECT_THAT(names(serving({"Test_BootsFrom", "Test_HasDisk", "Test_BootsFrom"})),
                ElementsAre("Test_BootsFrom a", "Test_HasDisk b", "Test_HasDisk a"));
}

TEST_F(AssociationsTest, AreFollowedOnlyIfTheyCanReferToTheSource) {
    // If the provider of Test_Between were called, it would throw.
    EXPECT_THAT(names(serving({"Test_Between", "Test_BootsFrom"})), ElementsAre("Test_BootsFrom a"));
    EXPECT_THAT(dispatcher->associatorNames(invocation, path("Test_Tape", "t"), {}), IsEmpty());
}

struct Restriction {
    AssociationFilter filter;
    std::vector<std::string> found;
};

void PrintTo(const Restriction& restriction, std::ostream* out) {
    const AssociationFilter& filter = restriction.filter;
    *out << filter.associationClass << '/' << filter.resultClass << '/' << filter.role << '/' << filter.resultRole;
}

class RestrictionTest : public AssociationsTest, public testing::WithParamInterface<Restriction> {};

TEST_P(RestrictionTest, HoldsEvenIfTheProviderIgnoresIt) {
    EXPECT_EQ(GetParam().found, names(serving({"Test_Links", "Test_BootsFrom"}), GetParam().filter));
}

INSTANTIATE_TEST_SUITE_P(ByAssociationClass, RestrictionTest,
                         testing::Values(Restriction{{"Test_BootsFrom", "", "", ""}, {"Test_BootsFrom a"}},
                                         Restriction{{"test_bootsfrom", "", "", ""}, {"Test_BootsFrom a"}},
                                         Restriction{{"CIM_Has", "", "", ""},
                                                     {"Test_Links t", "Test_Links c", "Test_BootsFrom a"}},
                                         Restriction{{"Test_HasDisk", "", "", ""}, {}}));

INSTANTIATE_TEST_SUITE_P(ByResultClass, RestrictionTest,
                         testing::Values(Restriction{{"", "Test_Tape", "", ""}, {"Test_Links t"}},
                                         Restriction{{"", "cim_disk", "", ""}, {"Test_Links c", "Test_BootsFrom a"}},
                                         Restriction{{"", "CIM_Device", "", ""},
                                                     {"Test_Links t", "Test_Links c", "Test_BootsFrom a"}},
                                         Restriction{{"", "Test_Host", "", ""}, {}}));

INSTANTIATE_TEST_SUITE_P(ByRole, RestrictionTest,
                         testing::Values(Restriction{{"Test_BootsFrom", "", "host", ""}, {"Test_BootsFrom a"}},
                                         Restriction{{"", "", "Disk", ""}, {}}, Restriction{{"", "", "Guest", ""}, {}},
                                         Restriction{{"Test_BootsFrom", "", "", "DISK"}, {"Test_BootsFrom a"}},
                                         Restriction{{"", "", "", "Host"}, {}},
                                         Restriction{{"Test_BootsFrom", "", "Host", "Disk"}, {"Test_BootsFrom a"}},
                                         Restriction{{"", "", "Host", "Host"}, {}}));

TEST_F(AssociationsTest, GetTheirOwnClassAndTheFilter) {
    const auto shown = [&](const AssociationFilter& filter) {
        const auto found = serving({"Test_ShowsFilter"}).associators(invocation, host, filter, std::nullopt);
        return std::get<std::string>(find(found.at(0).objects.at(0).properties, "Vendor")->value.content);
    };
    EXPECT_EQ("Test_ShowsFilter none none none", shown({}));
    EXPECT_EQ("Test_ShowsFilter Test_Disk Host Disk", shown({"CIM_Has", "Test_Disk", "Host", "Disk"}));
    // A class that every object at the far end has does not restrict the result.
    EXPECT_EQ("Test_ShowsFilter none none none", shown({"", "CIM_Device", "", ""}));
}

TEST_F(AssociationsTest, GiveTheSourceInTheSpellingOfItsDeclaration) {
    const auto references = serving({"Test_BootsFrom"}).referenceNames(invocation, path("TEST_HOST", "h"), {});
    const auto& source = std::get<std::shared_ptr<const ObjectPath>>(references.at(0).keys.at(0).value.content);
    EXPECT_EQ("Test_Host", source->className);
}

TEST_F(AssociationsTest, GiveTheWantedPropertiesAndTheKeys) {
    const std::vector<std::string> wanted = {"since", "SIZE"};
    const auto namesOf = [](const Instance& instance) {
        std::vector<std::string> names;
        for (const NamedValue& property : instance.properties) {
            names.push_back(property.name);
        }
        return names;
    };
    Dispatcher& served = serving({"Test_BootsFrom"});
    EXPECT_THAT(namesOf(served.associators(invocation, host, {}, wanted).at(0).objects.at(0)),
                ElementsAre("Name", "Size"));
    EXPECT_THAT(namesOf(served.references(invocation, host, {}, wanted).at(0)), ElementsAre("Host", "Disk", "Since"));
    EXPECT_THAT(namesOf(served.references(invocation, host, {}, std::vector<std::string>()).at(0)),
                ElementsAre("Host", "Disk"));
}

TEST_F(AssociationsTest, AreReturnedAsReferences) {
    Dispatcher& served = serving({"Test_HasDisk", "Test_BootsFrom"});
    const auto all =
        ElementsAre(reference("Test_HasDisk", "b"), reference("Test_HasDisk", "a"), reference("Test_BootsFrom", "a"));
    EXPECT_THAT(served.referenceNames(invocation, host, {}), all);
    EXPECT_THAT(pathsOf(served.references(invocation, host, {"CIM_Has", "", "host", ""}, std::nullopt)), all);
    EXPECT_THAT(served.referenceNames(invocation, host, {"Test_BootsFrom", "", "", ""}),
                ElementsAre(reference("Test_BootsFrom", "a")));
    EXPECT_THAT(served.referenceNames(invocation, host, {"", "", "Disk", ""}), IsEmpty());
}

TEST_F(AssociationsTest, FailWithTheProviderThatFailsAndItsReasons) {
    Dispatcher& served = serving({"Test_BootsFrom", "Test_Fails"});
    const auto failure = isError(CMPI_RC_ERR_ACCESS_DENIED, "Test_Fails: not for you");
    const CimError error = errorOf([&] { served.associatorNames(invocation, host, {}); });
    EXPECT_THAT(error, failure);
    EXPECT_THAT(error.reasons, ElementsAre("no disk in the bay"));
    EXPECT_THAT(errorOf([&] { served.associators(invocation, host, {}, std::nullopt); }), failure);
    EXPECT_THAT(errorOf([&] { served.references(invocation, host, {}, std::nullopt); }), failure);
    EXPECT_THAT(errorOf([&] { served.referenceNames(invocation, host, {}); }), failure);
    EXPECT_THAT(names(served, {"Test_BootsFrom", "", "", ""}), ElementsAre("Test_BootsFrom a"));
}

TEST_F(AssociationsTest, ReachOtherProvidersThroughTheObjectManager) {
    EXPECT_THAT(names(serving({"Test_AsksAnother", "Test_HasDisk"}), {"Test_AsksAnother", "", "", ""}),
                ElementsAre("Test_AsksAnother b", "Test_AsksAnother a"));
}

TEST_F(AssociationsTest, FailIfAnUpCallFails) {
    Dispatcher& served = serving({"Test_AsksNobody", "Test_AsksForItself"});
    EXPECT_THAT(errorOf([&] {
                    served.associatorNames(invocation, host, {"Test_AsksNobody", "", "", ""});
                }),
                isError(CMPI_RC_ERR_INVALID_CLASS, "Test_AsksNobody: no provider is registered for class "
                                                   "\"Test_Nobody\" in namespace \"root/cimv2\""));
    const CimError endless = errorOf([&] {
        served.associatorNames(invocation, host, {"Test_AsksForItself", "", "", ""});
    });
    EXPECT_EQ(CMPI_RC_ERR_FAILED, endless.code);
    EXPECT_THAT(endless.what(), testing::EndsWith("nest deeper than 16 levels: does a provider ask for itself?"));
}

TEST_F(AssociationsTest, RefuseClassesAndInstancesThatDoNotExist) {
    Dispatcher& served = serving({"Test_BootsFrom"});
    const auto failure = [&](const ObjectPath& source, const AssociationFilter& filter) {
        return errorOf([&] { served.associatorNames(invocation, source, filter); });
    };
    EXPECT_THAT(failure(disk("nobody"), {}), isError(CMPI_RC_ERR_NOT_FOUND, "there is no such instance"));
    EXPECT_THAT(failure(path("Test_Guest", "g"), {}),
                isError(CMPI_RC_ERR_INVALID_PARAMETER, "the class \"Test_Guest\" is not declared"));
    EXPECT_THAT(failure(host, {"Test_Lends", "", "", ""}),
                isError(CMPI_RC_ERR_INVALID_PARAMETER, "the association class \"Test_Lends\" is not declared"));
    EXPECT_THAT(failure(host, {"", "Test_Guest", "", ""}),
                isError(CMPI_RC_ERR_INVALID_PARAMETER, "the result class \"Test_Guest\" is not declared"));
    for (const char* noAssociation : {"Test_Tape", "Test_Mirrored"}) {
        EXPECT_THAT(failure(host, {noAssociation, "", "", ""}),
                    isError(CMPI_RC_ERR_INVALID_PARAMETER,
                            "the class \"" + std::string(noAssociation) + "\" is not an association"));
    }
    ObjectPath elsewhere = host;
    elsewhere.nameSpace = "root/elsewhere";
    EXPECT_EQ(CMPI_RC_ERR_INVALID_NAMESPACE, failure(elsewhere, {}).code);
    Dispatcher& undeclared = serving({"Test_Undeclared"});
    EXPECT_THAT(errorOf([&] { undeclared.associatorNames(invocation, host, {}); }),
                isError(CMPI_RC_ERR_FAILED, "the registered association class \"Test_Undeclared\" is declared with 0 "
                                            "references, expected two or more"));
}

TEST_F(AssociationsTest, AreWalkedByManyThreadsAtOnce) {
    constexpr int threads = 8;
    constexpr int rounds = 100;
    Dispatcher& served = serving({"Test_HasDisk", "Test_AsksAnother", "Test_Fails"});
    const auto walk = [&] {
        for (int round = 0; round < rounds; ++round) {
            EXPECT_THAT(served.associatorNames(invocation, host, {"Test_AsksAnother", "", "", ""}).at(0).objects,
                        ElementsAre(disk("b"), disk("a")));
            EXPECT_THAT(served.references(invocation, host, {"Test_HasDisk", "", "", ""}, std::nullopt), SizeIs(2));
            EXPECT_THAT(errorOf([&] { served.associators(invocation, host, {}, std::nullopt); }).reasons,
                        ElementsAre("no disk in the bay"));
            log.take();
        }
    };
    std::vector<std::thread> running;
    for (int i = 0; i < threads; ++i) {
        running.emplace_back(walk);
    }
    for (std::thread& thread : running) {
        thread.join();
    }
}

TEST(DuplicatesTest, AreEqualPathsHoweverTheyAreWritten) {
    const ObjectPath first{"host", "root/cimv2", "Test_Disk", {{"Name", stringValue("a")}, {"Of", stringValue("h")}}};
    const ObjectPath same{"", "ROOT/cimv2", "test_disk", {{"of", stringValue("h")}, {"NAME", stringValue("a")}}};
    const ObjectPath other{"", "root/cimv2", "Test_Disk", {{"Name", stringValue("A")}, {"Of", stringValue("h")}}};
    const ObjectPath link{"", "root/cimv2", "Test_Has", {{"Disk", referenceValue(first)}}};
    const ObjectPath sameLink{"", "root/cimv2", "Test_Has", {{"Disk", referenceValue(same)}}};
    std::vector<ObjectPath> paths = {first, same, other, link, sameLink, other};
    dropDuplicates(paths);
    EXPECT_THAT(paths, ElementsAre(first, other, link));
}

TEST(DuplicatesTest, AreNeverPathsWithoutKeys) {
    const Instance unnamed{{"", "root/cimv2", "Test_Disk", {}}, {}};
    std::vector<Instance> instances = {unnamed, unnamed};
    dropDuplicates(instances);
    EXPECT_THAT(instances, SizeIs(2));
}

} // namespace
} // namespace ObjectManager

/*
 * Compares the shipped part of the common model with DMTF's own CIM schema, of which no copy is kept here: the
 * environment variable ORV_DMTF_SCHEMA names a folder with one (its .mof files may lie in folders below). If it is
 * not set, these tests are skipped. With another version than the one that the shipped part is taken from, the tests
 * compare what versions do not change: names, types, keys and default values.
 */
#include "classes/Catalogue.h"
#include "classes/Literals.h"
#include "classes/SchemaFiles.h"
#include "text/MofText.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <sstream>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace ObjectManager {
namespace {

/** A folder with the shipped schema and DMTF's classes, as a user would make it for `orvcim --schema`. */
class SchemaWithDmtfs {
public:
    explicit SchemaWithDmtfs(const std::filesystem::path& dmtf) {
        std::filesystem::create_directories(_folder);
        for (const auto& entry : std::filesystem::recursive_directory_iterator(dmtf)) {
            if (entry.path().extension() == ".mof") {
                std::filesystem::create_symlink(std::filesystem::absolute(entry.path()),
                                                _folder / entry.path().filename());
            }
        }
        for (const auto& file : filesOf(ORV_SCHEMA_FOLDER, ".mof")) {
            if (file.filename() != "orv-core.mof") {
                std::filesystem::create_symlink(file, _folder / file.filename());
            }
        }
    }
    ~SchemaWithDmtfs() { std::filesystem::remove_all(_folder); }
    SchemaWithDmtfs(const SchemaWithDmtfs&) = delete;
    SchemaWithDmtfs& operator=(const SchemaWithDmtfs&) = delete;

    const std::filesystem::path& folder() const { return _folder; }

private:
    std::filesystem::path _folder = testing::TempDir() + "schema-with-dmtfs";
};

/** The version of DMTF's schema that the shipped part of it is taken from. */
constexpr std::array shippedVersion = {2, 41, 0};

/** The version of a schema: the highest version of its classes, since each class keeps that of its last change. */
std::array<int, 3> versionOf(const Catalogue& schema) {
    std::array<int, 3> highest{};
    for (const Class* declared : schema.all()) {
        const NamedValue* const qualifier = find(declared->qualifiers, "Version");
        if (qualifier != nullptr && declared->name.starts_with("CIM_")) {
            std::istringstream text(std::get<std::string>(qualifier->value.content));
            std::array<int, 3> version{};
            char dot = '.';
            text >> version[0] >> dot >> version[1] >> dot >> version[2];
            highest = std::max(highest, version);
        }
    }
    return highest;
}

/**
 * The differences between two declarations, one a line. Texts for people, and references to other documents, may
 * differ.
 */
class Comparison {
public:
    /** @param sameVersion whether both declarations are of the same version of the schema. */
    Comparison(const Catalogue& theirs, bool sameVersion) : _theirs(theirs), _sameVersion(sameVersion) {}

    std::vector<std::string> differences(const Class& ours, const Class& theirs) {
        if (_sameVersion) {
            expectEqual(ours.name + ": superclass", ours.superClass, theirs.superClass);
        } else if (!ours.superClass.empty() && !_theirs.isA(theirs.name, ours.superClass)) {
            _differences.push_back(ours.name + ": DMTF's is not derived from " + ours.superClass);
        }
        qualifiers(ours.name, ours.qualifiers, theirs.qualifiers);
        for (const Property& property : ours.properties) {
            const std::string name = ours.name + '.' + property.name;
            if (const Property* other = expectThere(name, theirs.property(property.name))) {
                element(name, property, *other);
                expectEqual(name + ": default", mofLiteral(property.defaultValue), mofLiteral(other->defaultValue));
            }
        }
        for (const Method& method : ours.methods) {
            const std::string name = ours.name + '.' + method.name;
            if (const Method* other = expectThere(name, theirs.method(method.name))) {
                element(name, method, *other);
                parameters(name, method, *other);
            }
        }
        return _differences;
    }

private:
    void parameters(const std::string& name, const Method& ours, const Method& theirs) {
        expectEqual(name + ": parameters", std::to_string(ours.parameters.size()),
                    std::to_string(theirs.parameters.size()));
        for (std::size_t i = 0; i < std::min(ours.parameters.size(), theirs.parameters.size()); ++i) {
            const Parameter& parameter = ours.parameters[i];
            expectEqual(name + ": parameter", parameter.name, theirs.parameters[i].name);
            element(name + '(' + parameter.name + ')', parameter, theirs.parameters[i]);
        }
    }

    void element(const std::string& name, const Element& ours, const Element& theirs) {
        expectEqual(name + ": spelling", ours.name, theirs.name);
        expectEqual(name + ": type", typeName(ours.type), typeName(theirs.type));
        expectEqual(name + ": class", ours.referenceClass, theirs.referenceClass);
        if (_sameVersion) {
            expectEqual(name + ": origin", ours.origin, theirs.origin);
            expectEqual(name + ": declared by", ours.declaredBy, theirs.declaredBy);
        }
        qualifiers(name, ours.qualifiers, theirs.qualifiers);
    }

    void qualifiers(const std::string& name, const Qualifiers& ours, const Qualifiers& theirs) {
        for (const NamedValue& qualifier : ours) {
            qualifierOf(name, qualifier.name, ours, theirs);
        }
        for (const NamedValue& qualifier : theirs) {
            if (find(ours, qualifier.name) == nullptr) {
                qualifierOf(name, qualifier.name, ours, theirs);
            }
        }
    }

    void qualifierOf(const std::string& owner, const std::string& name, const Qualifiers& ours,
                     const Qualifiers& theirs) {
        constexpr std::array<std::string_view, 4> mayDiffer = {"Description", "MappingStrings", "ModelCorrespondence",
                                                               "UMLPackagePath"};
        if (std::any_of(mayDiffer.begin(), mayDiffer.end(),
                        [&](std::string_view other) { return equalNames(name, other); }) ||
            (!_sameVersion && !equalNames(name, "Key"))) {
            return;
        }
        const auto text = [&](const Qualifiers& qualifiers) {
            const NamedValue* found = find(qualifiers, name);
            return found == nullptr ? std::string("nothing") : mofLiteral(found->value);
        };
        expectEqual(owner + ": " + name, text(ours), text(theirs));
    }

    template <typename T>
    const T* expectThere(const std::string& name, const T* element) {
        if (element == nullptr) {
            _differences.push_back(name + ": DMTF has none");
        }
        return element;
    }

    void expectEqual(const std::string& name, const std::string& ours, const std::string& theirs) {
        if (ours != theirs) {
            _differences.push_back(name + ": ours is " + ours + ", DMTF's " + theirs);
        }
    }

    const Catalogue& _theirs;
    const bool _sameVersion;
    std::vector<std::string> _differences;
};

class DmtfSchemaTest : public testing::Test {
protected:
    void SetUp() override {
        const char* folder = std::getenv("ORV_DMTF_SCHEMA");
        if (folder == nullptr) {
            GTEST_SKIP() << "ORV_DMTF_SCHEMA is not set: nothing was compared with DMTF's schema";
        }
        _dmtf.reset(new Catalogue(readCatalogue(SchemaWithDmtfs(folder).folder()))); // a catalogue does not move
    }

    Catalogue _ours = readCatalogue(ORV_SCHEMA_FOLDER);
    std::unique_ptr<const Catalogue> _dmtf;
};

TEST_F(DmtfSchemaTest, HasEveryElementThatIsShippedAsItIsShipped) {
    const bool sameVersion = versionOf(*_dmtf) == shippedVersion;
    EXPECT_LE(versionOf(_ours), shippedVersion) << "a class is newer than the schema that it is taken from";
    for (const Class* ours : _ours.all()) {
        const Class* theirs = _dmtf->find(ours->name);
        ASSERT_NE(theirs, nullptr) << ours->name;
        EXPECT_THAT(Comparison(*_dmtf, sameVersion).differences(*ours, *theirs), testing::IsEmpty()) << ours->name;
    }
}

TEST_F(DmtfSchemaTest, DeclaresTheStandardQualifiersAsTheyAreKnownWithoutIt) {
    for (const Class* declared : _dmtf->all()) {
        for (const NamedValue& qualifier : declared->qualifiers) {
            const QualifierType* theirs = _dmtf->qualifierTypes().find(qualifier.name);
            const QualifierType* ours = _ours.qualifierTypes().find(qualifier.name);
            ASSERT_NE(ours, nullptr) << qualifier.name;
            EXPECT_EQ(ours->type, theirs->type) << qualifier.name;
            EXPECT_EQ(ours->overridable, theirs->overridable) << qualifier.name;
            EXPECT_EQ(ours->toSubclass, theirs->toSubclass) << qualifier.name;
            EXPECT_EQ(ours->translatable, theirs->translatable) << qualifier.name;
        }
    }
}

} // namespace
} // namespace ObjectManager

/**
 * The classes that an object manager knows, each with the elements that it inherits.
 */
#ifndef CLASSES_CATALOGUE_H
#define CLASSES_CATALOGUE_H

#include "classes/Class.h"
#include "classes/MofReader.h"
#include "classes/QualifierType.h"
#include "model/ClassInformation.h"

#include <filesystem>
#include <map>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/**
 * A consistent set of class declarations. It is never changed after construction, so several threads may use it at
 * once.
 */
class Catalogue final : public ClassInformation {
public:
    /**
     * @param declarations in any order, superclasses included.
     * @throws SchemaError if a class is declared twice, a superclass or the class of a reference is not declared, a
     *         class is its own ancestor, an inherited property or method is redeclared with another type, or the value
     *         of a qualifier does not fit its type.
     */
    explicit Catalogue(Declarations declarations);

    const QualifierTypes& qualifierTypes() const { return _qualifierTypes; }

    /**
     * The class with everything that it inherits; its ancestors' elements come first. An element that the class
     * overrides stands in the ancestor's place, and has its own qualifiers and those of the ancestor's qualifiers that
     * subclasses inherit. The class inherits qualifiers of its superclass in the same way.
     *
     * @return null if no class has that name.
     */
    const Class* find(std::string_view name) const;

    /** All classes, sorted by name. */
    std::vector<const Class*> all() const;

    /** Whether the class is `ancestor` or descends from it. An unknown class descends from no other. */
    bool isA(std::string_view name, std::string_view ancestor) const override;

    std::span<const std::string> keyNames(std::string_view name) const override;
    const std::string* declaredName(std::string_view name) const override;
    std::span<const ReferenceEnd> references(std::string_view name) const override;

private:
    struct Entry {
        Class whole;
        std::vector<std::string> keyNames;
        std::vector<ReferenceEnd> references;
    };

    QualifierTypes _qualifierTypes;
    std::map<std::string, Entry, NameLess> _classes;
};

/**
 * Reads the classes in all .mof files of a folder.
 *
 * @throws SchemaError if a declaration is wrong, or the folder or a file cannot be read.
 */
Catalogue readCatalogue(const std::filesystem::path& folder);

} // namespace ObjectManager

#endif

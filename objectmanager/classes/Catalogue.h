/**
 * The classes that an object manager knows, with what they inherit.
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

/** Class declarations that fit together. Never changed once it is made, so several threads may use it at once. */
class Catalogue final : public ClassInformation {
public:
    /**
     * @param declarations in any order, superclasses included.
     * @throws SchemaError where a class is declared twice, a superclass or the class of a reference is not declared, a
     *         class is its own ancestor, an inherited property or method is redeclared with another type, or a
     *         qualifier has no value of its type.
     */
    explicit Catalogue(Declarations declarations);

    const QualifierTypes& qualifierTypes() const { return _qualifierTypes; }

    /**
     * The class with everything that it inherits, the ancestors' elements first. An element that is declared again
     * stands in the ancestor's place. It has its own qualifiers and those of the ancestor's that go to subclasses, as
     * the class has its superclass's.
     *
     * @return null where no such class is known.
     */
    const Class* find(std::string_view name) const;

    /** All classes, by name. */
    std::vector<const Class*> all() const;

    /** Whether the class is `ancestor` or descends from it. An unknown class is nothing but itself. */
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
 * The classes of all .mof files of a folder.
 *
 * @throws SchemaError also where the folder or a file cannot be read.
 */
Catalogue readCatalogue(const std::filesystem::path& folder);

} // namespace ObjectManager

#endif

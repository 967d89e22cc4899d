/**
 * Qualifier types (DSP0004): type, default value, scopes and flavors of qualifiers.
 */
#ifndef CLASSES_QUALIFIERTYPE_H
#define CLASSES_QUALIFIERTYPE_H

#include "classes/Class.h"

#include <array>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

/** The kinds of elements that may have a qualifier, as bits that are or-ed. */
using Scopes = unsigned int;

constexpr Scopes aClass = 1;
constexpr Scopes anAssociation = 2;
constexpr Scopes aReference = 4;
constexpr Scopes aProperty = 8;
constexpr Scopes aMethod = 16;
constexpr Scopes aParameter = 32;
constexpr Scopes anIndication = 64;
/** Every kind; MOF writes it as "any". */
constexpr Scopes anyScope = 127;

struct ScopeName {
    std::string_view name;
    Scopes scope;
};

constexpr std::array<ScopeName, 7> scopeNames{{{"class", aClass},
                                               {"association", anAssociation},
                                               {"reference", aReference},
                                               {"property", aProperty},
                                               {"method", aMethod},
                                               {"parameter", aParameter},
                                               {"indication", anIndication}}};

/** A qualifier type. The initial flavors hold if its declaration gives none. */
struct QualifierType {
    std::string name;
    /** Includes CMPI_ARRAY if values are arrays. */
    CMPIType type = CMPI_null;
    /** Whether a subclass may give the qualifier another value. */
    bool overridable = true;
    /** Whether subclasses, and elements that override others, inherit the qualifier. */
    bool toSubclass = true;
    bool translatable = false;
    Scopes scopes = 0;
    /** The value of the qualifier if an element does not have it; null if the declaration gives none. */
    Value defaultValue{};
    /** The place of the declaration, "file:line"; empty for the qualifier types that DSP0004 defines. */
    std::string place;
};

/** Qualifier types by name. The qualifier types that DSP0004 defines are always among them. */
class QualifierTypes {
public:
    /**
     * @param declared replaces definitions of DSP0004. It may declare a type several times if the declarations are
     *                 equal.
     * @throws SchemaError if declarations of one type differ.
     */
    explicit QualifierTypes(const std::vector<QualifierType>& declared);

    /** The type called `name`, letter case ignored; null if there is none. */
    const QualifierType* find(std::string_view name) const;

    /** All types, sorted by name. */
    std::vector<const QualifierType*> all() const;

    /**
     * Converts the value of each qualifier to its declared type. A qualifier without a declared type keeps its value.
     *
     * @param place of the qualifiers, "file:line", for error messages.
     * @throws SchemaError if a value does not fit its qualifier's type.
     */
    void convert(Qualifiers& qualifiers, const std::string& place) const;

    /** The qualifiers of a class, or of an element that overrides another: its own, and those that it inherits. */
    Qualifiers merged(const Qualifiers& inherited, Qualifiers own) const;

private:
    std::map<std::string, QualifierType, NameLess> _types;
};

} // namespace ObjectManager

#endif

/**
 * Qualifier types (DSP0004): what is known of a qualifier beside its value.
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

/** What a qualifier may stand at: bits that are or-ed. */
using Scopes = unsigned int;

constexpr Scopes aClass = 1;
constexpr Scopes anAssociation = 2;
constexpr Scopes aReference = 4;
constexpr Scopes aProperty = 8;
constexpr Scopes aMethod = 16;
constexpr Scopes aParameter = 32;
constexpr Scopes anIndication = 64;
/** Written as "any". */
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

/** The flavors are those that a qualifier type has where its declaration gives none. */
struct QualifierType {
    std::string name;
    /** CMPI_ARRAY included where it is an array. */
    CMPIType type = CMPI_null;
    /** Whether a subclass may give the qualifier another value. */
    bool overridable = true;
    /** Whether a class inherits the qualifier, and an element that is declared again. */
    bool toSubclass = true;
    bool translatable = false;
    Scopes scopes = 0;
    /** What the qualifier is where it is not given; null where the declaration says nothing. */
    Value defaultValue{};
    /** Where the declaration stands, "file:line"; empty for those that every schema has. */
    std::string place;
};

/** Qualifier types by name. Those that DSP0004 defines for every schema are always there. */
class QualifierTypes {
public:
    /**
     * @param declared takes the place of what DSP0004 defines; may declare one type several times, as long as it does
     *                 so in the same way.
     * @throws SchemaError where declarations of one type differ.
     */
    explicit QualifierTypes(const std::vector<QualifierType>& declared);

    /** The type called `name`, letter case ignored, or null. */
    const QualifierType* find(std::string_view name) const;

    /** All types, by name. */
    std::vector<const QualifierType*> all() const;

    /**
     * Gives each qualifier a value of its type. One that has no type keeps what it has.
     *
     * @param place what errors give, "file:line".
     * @throws SchemaError where a value is none of its qualifier's type.
     */
    void convert(Qualifiers& qualifiers, const std::string& place) const;

    /** What a class, or an element that is declared again, has as qualifiers: its own, and what it inherits. */
    Qualifiers merged(const Qualifiers& inherited, Qualifiers own) const;

private:
    std::map<std::string, QualifierType, NameLess> _types;
};

} // namespace ObjectManager

#endif

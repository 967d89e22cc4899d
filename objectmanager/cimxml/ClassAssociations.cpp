#include "cimxml/ClassAssociations.h"

#include <algorithm>

namespace ObjectManager::CimXml {

namespace {

/** Whether the filter lets a name pass. An empty filter lets every name pass. */
bool isAsked(std::string_view name, std::string_view asked) {
    return asked.empty() || equalNames(name, asked);
}

bool isAskedClass(const Catalogue& catalogue, std::string_view name, std::string_view asked) {
    return asked.empty() || catalogue.isA(name, asked);
}

/** Calls for each association class, and each of its references that can refer to the source. */
template <typename Do>
void forEachNearEnd(const Catalogue& catalogue, const Class& source, const AssociationFilter& filter, Do doWith) {
    // A class with fewer than two references associates nothing.
    constexpr std::size_t fewestReferences = 2;
    for (const Class* association : catalogue.all()) {
        const auto ends = catalogue.references(association->name);
        if (ends.size() < fewestReferences || !isAskedClass(catalogue, association->name, filter.associationClass)) {
            continue;
        }
        for (const ReferenceEnd& end : ends) {
            if (catalogue.isA(source.name, end.className) && isAsked(end.role, filter.role)) {
                doWith(*association, end);
            }
        }
    }
}

void addOnce(std::vector<const Class*>& classes, const Class* found) {
    if (std::find(classes.begin(), classes.end(), found) == classes.end()) {
        classes.push_back(found);
    }
}

} // namespace

std::vector<const Class*> referencesOfClass(const Catalogue& catalogue, const Class& source,
                                            const AssociationFilter& filter) {
    std::vector<const Class*> found;
    forEachNearEnd(catalogue, source, filter,
                   [&](const Class& association, const ReferenceEnd&) { addOnce(found, &association); });
    return found;
}

std::vector<const Class*> associatorsOfClass(const Catalogue& catalogue, const Class& source,
                                             const AssociationFilter& filter) {
    std::vector<const Class*> found;
    forEachNearEnd(catalogue, source, filter, [&](const Class& association, const ReferenceEnd& near) {
        for (const ReferenceEnd& far : catalogue.references(association.name)) {
            if (far.role != near.role && isAsked(far.role, filter.resultRole) &&
                isAskedClass(catalogue, far.className, filter.resultClass)) {
                addOnce(found, catalogue.find(far.className));
            }
        }
    });
    return found;
}

} // namespace ObjectManager::CimXml

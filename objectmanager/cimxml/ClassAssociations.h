/** The associations between classes that the declarations allow. */
#ifndef CIMXML_CLASSASSOCIATIONS_H
#define CIMXML_CLASSASSOCIATIONS_H

#include "classes/Catalogue.h"
#include "model/Operations.h"

#include <vector>

namespace ObjectManager::CimXml {

/**
 * The association classes that can refer to instances of the source: those with a reference to this class or to one of
 * its ancestors, sorted by name.
 */
std::vector<const Class*> referencesOfClass(const Catalogue& catalogue, const Class& source,
                                            const AssociationFilter& filter);

/** The classes to which the other references of these association classes refer, each of them once. */
std::vector<const Class*> associatorsOfClass(const Catalogue& catalogue, const Class& source,
                                             const AssociationFilter& filter);

} // namespace ObjectManager::CimXml

#endif

/** Which associations between classes their declarations allow. */
#ifndef CIMXML_CLASSASSOCIATIONS_H
#define CIMXML_CLASSASSOCIATIONS_H

#include "classes/Catalogue.h"
#include "model/Operations.h"

#include <vector>

namespace ObjectManager::CimXml {

/**
 * The association classes that can refer to instances of the class: those with a reference to the class or to one of
 * its ancestors. By name.
 */
std::vector<const Class*> referencesOfClass(const Catalogue& catalogue, const Class& source,
                                            const AssociationFilter& filter);

/** The classes that the other references of these association classes are declared with, each once. */
std::vector<const Class*> associatorsOfClass(const Catalogue& catalogue, const Class& source,
                                             const AssociationFilter& filter);

} // namespace ObjectManager::CimXml

#endif

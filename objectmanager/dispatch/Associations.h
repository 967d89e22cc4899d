/** Decides which associations are followed from an instance, and which objects of their providers the answer has. */
#ifndef DISPATCH_ASSOCIATIONS_H
#define DISPATCH_ASSOCIATIONS_H

#include "broker/Broker.h"
#include "registry/Registry.h"

#include <string>
#include <vector>

namespace ObjectManager {

/** One step of a walk: an association class whose provider is asked. */
struct AssociationStep {
    const Registration* registration;
    /** The references that may lead to an associated object. */
    std::vector<ReferenceEnd> farEnds;
    /**
     * The result class that the provider is called with; empty if every object at the far ends is of the class that the
     * client asked for.
     */
    std::string resultClass;
};

/** Of objects with equal paths, keeps the first. A path without keys names no object: it is equal to no other path. */
void dropDuplicates(std::vector<ObjectPath>& paths);
void dropDuplicates(std::vector<Instance>& instances);

/**
 * A walk from an instance over the registered associations. The schema decides which classes it follows: those with one
 * reference that can refer to the source and another one that can refer to what the client looks for.
 */
class AssociationWalk {
public:
    /**
     * `classes` may be null: then no class is known. Registry and classes must outlive the walk.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE; with CMPI_RC_ERR_INVALID_PARAMETER if the class of the
     * source or a class of the filter is not declared (DSP0200), or the filter's association class is not an
     * association; with CMPI_RC_ERR_FAILED if a registered association class is declared with fewer than two
     * references, so that the objects that it links are not known.
     */
    AssociationWalk(const Registry& registry, const ClassInformation* classes, const ObjectPath& source,
                    const AssociationFilter& filter);

    /** The source; its class name is spelled as the class is declared. */
    const ObjectPath& source() const { return _source; }
    const AssociationFilter& filter() const { return _filter; }
    /** The steps, in the order in which their classes are registered. */
    const std::vector<AssociationStep>& steps() const { return _steps; }

    /** Drops those of the associated objects that the filter excludes. */
    void keepAsked(const AssociationStep& step, std::vector<ObjectPath>& paths) const;
    void keepAsked(const AssociationStep& step, std::vector<Instance>& instances) const;
    /** Drops the properties that are neither keys nor among the wanted ones. */
    void keepWanted(std::vector<Instance>& instances, const PropertyList& properties) const;

private:
    void requireDeclared(const std::string& className, const char* what) const;
    std::vector<ReferenceEnd> farEndsOf(const Registration& registration) const;
    bool isAsked(const AssociationStep& step, const ObjectPath& path) const;

    const ClassInformation* _classes;
    ObjectPath _source;
    const AssociationFilter& _filter;
    std::vector<AssociationStep> _steps;
};

} // namespace ObjectManager

#endif

/** Which associations a walk follows, and what of their providers' answers it keeps. */
#ifndef DISPATCH_ASSOCIATIONS_H
#define DISPATCH_ASSOCIATIONS_H

#include "broker/Broker.h"
#include "registry/Registry.h"

#include <string>
#include <vector>

namespace ObjectManager {

/** An association class whose provider is asked. */
struct AssociationStep {
    const Registration* registration;
    /** The references that may lead to an associated object. */
    std::vector<ReferenceEnd> farEnds;
    /** The result class that the provider is told; empty where every object at the far ends is of the one asked for. */
    std::string resultClass;
};

/** Keeps the first of the objects that have the same path. Without keys a path is no object's, and the same as none. */
void dropDuplicates(std::vector<ObjectPath>& paths);
void dropDuplicates(std::vector<Instance>& instances);

/**
 * A walk from an instance over the registered associations, by what the schema says of them: an association class is
 * followed where one of its references can refer to the source and another to what is looked for.
 */
class AssociationWalk {
public:
    /**
     * `classes` may be null, which knows no class. It and the registry outlive the walk.
     *
     * @throws CimError with CMPI_RC_ERR_INVALID_NAMESPACE, CMPI_RC_ERR_INVALID_PARAMETER where the class of the source
     * or one of the filter is not declared (DSP0200), or the filter's association class is no association,
     * CMPI_RC_ERR_FAILED where a registered association class has not two references, so that nobody knows what it
     * links.
     */
    AssociationWalk(const Registry& registry, const ClassInformation* classes, const ObjectPath& source,
                    const AssociationFilter& filter);

    /** The source, its class spelled as it is declared. */
    const ObjectPath& source() const { return _source; }
    const AssociationFilter& filter() const { return _filter; }
    /** In the order of registration. */
    const std::vector<AssociationStep>& steps() const { return _steps; }

    /** Drops from the associated objects that were found what the filter leaves out. */
    void keepAsked(const AssociationStep& step, std::vector<ObjectPath>& paths) const;
    void keepAsked(const AssociationStep& step, std::vector<Instance>& instances) const;
    /** Drops from instances what is neither key nor wanted property. */
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

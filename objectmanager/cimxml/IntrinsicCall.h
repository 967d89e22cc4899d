/** The call of an intrinsic method, and functions that several intrinsic methods use. */
#ifndef CIMXML_INTRINSICCALL_H
#define CIMXML_INTRINSICCALL_H

#include "cimxml/MethodTable.h"
#include "cimxml/Parameters.h"
#include "cimxml/Query.h"

#include <functional>
#include <string>
#include <vector>

namespace ObjectManager::CimXml {

struct Call {
    const Operation& operation;
    const Parameters& parameters;

    Dispatcher& dispatcher() const { return operation.dispatcher; }
    const Catalogue& catalogue() const { return operation.catalogue; }
    const std::string& nameSpace() const { return operation.message.nameSpace(); }
    ResponseWriter& writer() const { return operation.writer; }
    /** The user for whom providers are called, and the flags of the call. */
    Invocation invocation() const;
};

/* Classes. */

/** Whether a provider is registered for the class itself. */
bool isRegistered(const Operation& operation, std::string_view className);

CimError unknownClass(const std::string& className, CMPIrc code = CMPI_RC_ERR_INVALID_CLASS);

/** Throws if no provider serves instances of the class itself, so that it has none. */
void requireServed(const Operation& operation, const std::string& className);

/** Throws with the code `unknown` if the class does not exist: DSP0200's code depends on the operation. */
const Class& declaredClass(const Call& call, const std::string& className, CMPIrc unknown = CMPI_RC_ERR_INVALID_CLASS);

/** Calls `doWith` for the named class and each of its descendants, if the class has an instance provider. */
void forEachServed(const Call& call, const ObjectPath& classPath,
                   const std::function<void(const ObjectPath& classPath)>& doWith);

/* Parameters that select objects. */

/**
 * The properties to ask a provider for: those of the list that the class has, in the class's spelling, and its keys,
 * since the paths of instances are made of them.
 */
PropertyList askedOfProvider(const Call& call, const PropertyList& properties, const std::string& className);

/** For instances. LocalOnly and IncludeQualifiers are deprecated for instances, and always taken as false. */
Selection selectionOfInstances(const Call& call);

/** For the instances of the class ClassName. Without DeepInheritance, only that class's properties are selected. */
Selection selectionOfEnumeration(const Call& call);

/** For classes. `qualifiers` and `localOnly` are the method's defaults of IncludeQualifiers and LocalOnly. */
Selection selectionOfClasses(const Call& call, bool qualifiers, bool localOnly);

AssociationFilter associatorFilter(const Call& call);
AssociationFilter referenceFilter(const Call& call);

/* Objects. */

/** Calls `sink` for each instance of the class and of its descendants. Each has the given properties at least. */
void forEachInstance(const Call& call, const ObjectPath& classPath, const PropertyList& properties,
                     const InstanceSink& sink);
/** Calls `sink` for each instance of the query's class and its descendants that meets the query's condition. */
void forEachMatch(const Call& call, const Query& query, const InstanceSink& sink);
/** Calls `sink` for the path of each instance of the class ClassName and of its descendants. */
void forEachInstanceName(const Call& call, const PathSink& sink);

/** The associations of an instance, with all properties, since their references are needed for their paths. */
std::vector<Instance> referencesOf(const Call& call, const ObjectPath& source);

} // namespace ObjectManager::CimXml

#endif

/** An intrinsic method that is being answered, and what several of them have in common. */
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
    /** On whose behalf providers are called, and how. */
    Invocation invocation() const;
};

/* What classes there are. */

/** Whether a provider is registered for the class itself. */
bool isRegistered(const Operation& operation, std::string_view className);

CimError unknownClass(const std::string& className, CMPIrc code = CMPI_RC_ERR_INVALID_CLASS);

/** Throws where nobody serves instances of the class itself, so that there is none. */
void requireServed(const Operation& operation, const std::string& className);

/** Throws `unknown` where there is no such class: where the class itself is asked for, DSP0200 has another code. */
const Class& declaredClass(const Call& call, const std::string& className, CMPIrc unknown = CMPI_RC_ERR_INVALID_CLASS);

/** Calls for each class that is the one named or descends from it, and has a provider of instances. */
void forEachServed(const Call& call, const ObjectPath& classPath,
                   const std::function<void(const ObjectPath& classPath)>& doWith);

/* What is asked for. */

/**
 * What a provider is asked for: the properties as the class spells them, without those that it does not have, and with
 * its keys, lest instances lose their paths.
 */
PropertyList askedOfProvider(const Call& call, const PropertyList& properties, const std::string& className);

/** Of instances. LocalOnly and IncludeQualifiers, which are deprecated for them, are always taken as false. */
Selection selectionOfInstances(const Call& call);

/** Of the instances of the class ClassName; without DeepInheritance, the properties of that class only. */
Selection selectionOfEnumeration(const Call& call);

/** Of the classes that a method gives; `qualifiers` and `localOnly` hold where the client does not say. */
Selection selectionOfClasses(const Call& call, bool qualifiers, bool localOnly);

AssociationFilter associatorFilter(const Call& call);
AssociationFilter referenceFilter(const Call& call);

/* What is given. */

/** Calls for each instance of the class and of its descendants, with these properties at least. */
void forEachInstance(const Call& call, const ObjectPath& classPath, const PropertyList& properties,
                     const InstanceSink& sink);
/** Calls for each instance of the query's class and of its descendants that meets its condition. */
void forEachMatch(const Call& call, const Query& query, const InstanceSink& sink);
/** Calls for the path of each instance of the class ClassName and of its descendants. */
void forEachInstanceName(const Call& call, const PathSink& sink);

/** The associations of an instance, with all properties, since the paths of associations are made of some. */
std::vector<Instance> referencesOf(const Call& call, const ObjectPath& source);

} // namespace ObjectManager::CimXml

#endif

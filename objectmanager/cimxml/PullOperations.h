/** The pull operations of DSP0200: a client opens an enumeration, and pulls its objects part by part. */
#ifndef CIMXML_PULLOPERATIONS_H
#define CIMXML_PULLOPERATIONS_H

#include "cimxml/IntrinsicCall.h"

namespace ObjectManager::CimXml {

/*
 * The providers are asked for the objects when the enumeration is opened. The objects are kept in the form in which
 * they are sent, within EnumerationLimits.
 */

void openEnumerateInstances(const Call& call);
void openEnumerateInstancePaths(const Call& call);
void openAssociatorInstances(const Call& call);
void openAssociatorInstancePaths(const Call& call);
void openReferenceInstances(const Call& call);
void openReferenceInstancePaths(const Call& call);
/** Opens an enumeration of the instances that a query selects, without their paths. */
void openQueryInstances(const Call& call);
void pullInstances(const Call& call);
void pullInstancesWithPath(const Call& call);
void pullInstancePaths(const Call& call);
void closeEnumeration(const Call& call);
void enumerationCount(const Call& call);

} // namespace ObjectManager::CimXml

#endif

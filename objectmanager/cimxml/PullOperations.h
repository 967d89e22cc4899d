/** The pull operations of DSP0200: enumerations that a client opens, and takes a part of at a time. */
#ifndef CIMXML_PULLOPERATIONS_H
#define CIMXML_PULLOPERATIONS_H

#include "cimxml/IntrinsicCall.h"

namespace ObjectManager::CimXml {

/*
 * The objects are asked of the providers when the enumeration is opened, and kept in the form in which they are sent.
 * What is left of an enumeration is bounded by EnumerationLimits.
 */

void openEnumerateInstances(const Call& call);
void openEnumerateInstancePaths(const Call& call);
void openAssociatorInstances(const Call& call);
void openAssociatorInstancePaths(const Call& call);
void openReferenceInstances(const Call& call);
void openReferenceInstancePaths(const Call& call);
/** What ExecQuery answers: instances without their paths. */
void openQueryInstances(const Call& call);
void pullInstances(const Call& call);
void pullInstancesWithPath(const Call& call);
void pullInstancePaths(const Call& call);
void closeEnumeration(const Call& call);
void enumerationCount(const Call& call);

} // namespace ObjectManager::CimXml

#endif

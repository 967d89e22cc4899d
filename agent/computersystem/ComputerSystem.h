/**
 * TALVO_ComputerSystem as CMPI objects (CIM_ComputerSystem, DMTF DSP1052).
 */
#ifndef COMPUTERSYSTEM_COMPUTERSYSTEM_H
#define COMPUTERSYSTEM_COMPUTERSYSTEM_H

#include "IdentifyingFacts.h"

#include "cmpidt.h"
#include "cmpift.h"

#include <string>
#include <vector>

namespace Norv::ComputerSystemProvider {

inline constexpr const char* computerSystemClass = "TALVO_ComputerSystem";
inline constexpr const char* creationClassNameKey = "CreationClassName";
inline constexpr const char* nameKey = "Name";

/*
 * Objects belong to the broker and live as long as its request does. `reference` is a path of the request, whose
 * namespace the new object gets; `name` is the system's name, which is also the object's host. Both functions throw
 * OperationError where the broker fails.
 */

CMPIObjectPath* newSystemPath(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name);

/**
 * @param facts what identifies the system beside its name; without any, the instance has neither OtherIdentifyingInfo
 *              nor IdentifyingDescriptions.
 * @param properties names of the properties that are wanted beside the keys, ended by a null; null for all.
 */
CMPIInstance* newSystemInstance(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name,
                                const std::vector<IdentifyingFact>& facts, const char** properties);

} // namespace Norv::ComputerSystemProvider

#endif

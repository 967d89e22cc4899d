/**
 * Makes CMPI objects of TALVO_ComputerSystem (CIM_ComputerSystem, DMTF DSP1052).
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
 * The objects belong to the broker and live until its request ends. `reference` is the request's path; the new object
 * gets its namespace. `name` is the system's name, which is also the object's host name. Both functions throw
 * OperationError if the broker fails.
 */

CMPIObjectPath* newSystemPath(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name);

/**
 * @param facts identify the system beside its name. If there are none, the instance has neither OtherIdentifyingInfo
 *              nor IdentifyingDescriptions.
 * @param properties the names of the wanted properties beside the keys, as an array that ends with a null; null for all
 * properties.
 */
CMPIInstance* newSystemInstance(const CMPIBroker* broker, const CMPIObjectPath* reference, const std::string& name,
                                const std::vector<IdentifyingFact>& facts, const char** properties);

} // namespace Norv::ComputerSystemProvider

#endif

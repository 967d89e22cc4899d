/** CMPI objects as text, for people who look for a fault. */
#ifndef BROKER_DESCRIBE_H
#define BROKER_DESCRIBE_H

#include "model/Model.h"

#include <string>

namespace ObjectManager {

std::string describe(const Value& value);
/** In the form root/cimv2:CLASS.Key="value",... */
std::string describe(const ObjectPath& path);
/** The path and, in braces, the properties. */
std::string describe(const Instance& instance);
/** Name="value", ... */
std::string describe(const std::vector<NamedValue>& values);

} // namespace ObjectManager

#endif

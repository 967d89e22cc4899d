/**
 * Object paths and instances as values, and the CMPI objects that are made of them.
 */
#ifndef PROVIDER_OBJECTS_H
#define PROVIDER_OBJECTS_H

#include "cmpidt.h"
#include "cmpift.h"

#include <string>
#include <variant>
#include <vector>

namespace Norv::Provider {

struct Property;

/** What an instance is named by. */
struct Path {
    std::string nameSpace;
    std::string className;
    /** Each with a text or a path as its value. */
    std::vector<Property> keys;
    /** Empty where the object manager is to say it. */
    std::string host{};
};

struct Property {
    std::string name;
    std::variant<std::string, bool, CMPIUint16, std::vector<std::string>, std::vector<CMPIUint16>, Path> value;
};

/** An instance. Its keys are properties too, and are not among the others again. */
struct Instance {
    Path path;
    std::vector<Property> properties;
};

/*
 * Objects belong to the broker and live as long as its request does. These functions throw OperationError where the
 * broker fails.
 */

CMPIObjectPath* newPath(const CMPIBroker* broker, const Path& path);

/** @param properties names of those that are wanted beside the keys, ended by a null; null for all. */
CMPIInstance* newInstance(const CMPIBroker* broker, const Instance& instance, const char** properties);

/** The value of a path whose keys are texts. */
Path pathOf(const CMPIObjectPath* path);

/** Whether the broker's path names what `expected` does. Letter case counts in values of keys only, hosts not at all.
 */
bool isSame(const CMPIObjectPath* path, const Path& expected);

/** Whether two names of classes, namespaces or properties are the same: letter case is ignored. */
bool isSameName(const std::string& left, const std::string& right);

/** The namespace of a path. */
std::string nameSpaceOf(const CMPIObjectPath* path);

} // namespace Norv::Provider

#endif

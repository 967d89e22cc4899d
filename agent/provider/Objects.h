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

/** The path of an instance. */
struct Path {
    std::string nameSpace;
    std::string className;
    /** The keys, each with a text or a path as its value. */
    std::vector<Property> keys;
    /** The host; empty to leave it to the object manager. */
    std::string host{};
};

struct Property {
    std::string name;
    std::variant<std::string, bool, CMPIUint16, std::vector<std::string>, std::vector<CMPIUint16>, Path> value;
};

/** An instance. `properties` has the properties that are not keys; the keys are in the path. */
struct Instance {
    Path path;
    std::vector<Property> properties;
};

/*
 * The broker owns the objects, which live until its request ends. These functions throw OperationError if a call of the
 * broker fails.
 */

CMPIObjectPath* newPath(const CMPIBroker* broker, const Path& path);

/** @param properties the names of the properties that are wanted beside the keys, ended by a null; null for all. */
CMPIInstance* newInstance(const CMPIBroker* broker, const Instance& instance, const char** properties);

/** Reads a path. @throws OperationError if a key is not a text. */
Path pathOf(const CMPIObjectPath* path);

/** Whether the broker's path names the same object as `expected`. Hosts, and the letter case of names, are ignored. */
bool isSame(const CMPIObjectPath* path, const Path& expected);

/** Whether two names of classes, namespaces or properties are equal; letter case is ignored. */
bool isSameName(const std::string& left, const std::string& right);

/** The namespace of a path. */
std::string nameSpaceOf(const CMPIObjectPath* path);

} // namespace Norv::Provider

#endif

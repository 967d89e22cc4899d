#include "model/Operations.h"

#include <utility>

namespace ObjectManager {

std::vector<ObjectPath> Operations::enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath) {
    std::vector<ObjectPath> paths;
    enumerateInstanceNames(invocation, classPath, [&](const ObjectPath& path) { paths.push_back(path); });
    return paths;
}

std::vector<Instance> Operations::enumerateInstances(const Invocation& invocation, const ObjectPath& classPath,
                                                     const PropertyList& properties) {
    std::vector<Instance> instances;
    enumerateInstances(invocation, classPath, properties,
                       [&](const Instance& instance) { instances.push_back(instance); });
    return instances;
}

std::vector<Instance> Operations::execQuery(const Invocation& invocation, const ObjectPath& classPath,
                                            const std::string& query, const std::string& language) {
    std::vector<Instance> instances;
    execQuery(invocation, classPath, query, language, [&](const Instance& instance) { instances.push_back(instance); });
    return instances;
}

} // namespace ObjectManager

#include "model/Operations.h"

#include <utility>

namespace ObjectManager {

std::vector<ObjectPath> Operations::enumerateInstanceNames(const Invocation& invocation, const ObjectPath& classPath) {
    std::vector<ObjectPath> paths;
    enumerateInstanceNames(invocation, classPath, [&](ObjectPath&& path) { paths.push_back(std::move(path)); });
    return paths;
}

std::vector<Instance> Operations::enumerateInstances(const Invocation& invocation, const ObjectPath& classPath,
                                                     const PropertyList& properties) {
    std::vector<Instance> instances;
    enumerateInstances(invocation, classPath, properties,
                       [&](Instance&& instance) { instances.push_back(std::move(instance)); });
    return instances;
}

std::vector<Instance> Operations::execQuery(const Invocation& invocation, const ObjectPath& classPath,
                                            const std::string& query, const std::string& language) {
    std::vector<Instance> instances;
    execQuery(invocation, classPath, query, language,
              [&](Instance&& instance) { instances.push_back(std::move(instance)); });
    return instances;
}

} // namespace ObjectManager

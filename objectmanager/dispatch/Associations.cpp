#include "dispatch/Associations.h"

#include <algorithm>
#include <unordered_set>
#include <utility>

namespace ObjectManager {

namespace {

/** An association class with fewer references links nothing. */
constexpr std::size_t fewestReferences = 2;

const ObjectPath& pathOf(const ObjectPath& path) {
    return path;
}

const ObjectPath& pathOf(const Instance& instance) {
    return instance.path;
}

template <typename Object>
void keepFirstOfEachPath(std::vector<Object>& objects) {
    std::unordered_set<ObjectPath, ObjectPathHash> seen;
    std::erase_if(objects, [&](const Object& object) {
        const ObjectPath& path = pathOf(object);
        return !path.keys.empty() && !seen.insert(path).second;
    });
}

bool contains(std::span<const std::string> names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [&](const std::string& other) { return equalNames(other, name); });
}

} // namespace

void dropDuplicates(std::vector<ObjectPath>& paths) {
    keepFirstOfEachPath(paths);
}

void dropDuplicates(std::vector<Instance>& instances) {
    keepFirstOfEachPath(instances);
}

AssociationWalk::AssociationWalk(const Registry& registry, const ClassInformation* classes, const ObjectPath& source,
                                 const AssociationFilter& filter)
    : _classes(classes), _source(source), _filter(filter) {
    const std::vector<const Registration*> registrations = registry.all(source.nameSpace, ProviderKind::association);
    const std::string* declared = classes != nullptr ? classes->declaredName(source.className) : nullptr;
    if (declared == nullptr) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER, "the class \"" + source.className + "\" is not declared");
    }
    _source.className = *declared;
    requireDeclared(filter.associationClass, "association class");
    requireDeclared(filter.resultClass, "result class");
    if (!filter.associationClass.empty() && classes->references(filter.associationClass).size() < fewestReferences) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       "the class \"" + filter.associationClass + "\" is not an association");
    }
    for (const Registration* registration : registrations) {
        if (!filter.associationClass.empty() && !classes->isA(registration->className, filter.associationClass)) {
            continue;
        }
        std::vector<ReferenceEnd> farEnds = farEndsOf(*registration);
        if (!farEnds.empty()) {
            const bool allQualify = std::all_of(farEnds.begin(), farEnds.end(), [&](const ReferenceEnd& end) {
                return classes->isA(end.className, filter.resultClass);
            });
            _steps.push_back({registration, std::move(farEnds), allQualify ? "" : filter.resultClass});
        }
    }
}

void AssociationWalk::requireDeclared(const std::string& className, const char* what) const {
    if (!className.empty() && _classes->declaredName(className) == nullptr) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                       std::string("the ") + what + " \"" + className + "\" is not declared");
    }
}

/**
 * The references that can lead from the source to an associated object, and that the filter's roles permit; none if no
 * reference of the class can refer to the source.
 */
std::vector<ReferenceEnd> AssociationWalk::farEndsOf(const Registration& registration) const {
    const std::span<const ReferenceEnd> ends = _classes->references(registration.className);
    if (ends.size() < fewestReferences) {
        throw CimError(CMPI_RC_ERR_FAILED, "the registered association class \"" + registration.className +
                                               "\" is declared with " + std::to_string(ends.size()) +
                                               " references, expected two or more");
    }
    const auto isNear = [&](const ReferenceEnd& end) {
        return (_filter.role.empty() || equalNames(end.role, _filter.role)) &&
               _classes->isA(_source.className, end.className);
    };
    std::vector<ReferenceEnd> farEnds;
    for (const ReferenceEnd& far : ends) {
        const bool linked = std::any_of(ends.begin(), ends.end(),
                                        [&](const ReferenceEnd& near) { return &near != &far && isNear(near); });
        if (linked && (_filter.resultRole.empty() || equalNames(far.role, _filter.resultRole))) {
            farEnds.push_back(far);
        }
    }
    return farEnds;
}

bool AssociationWalk::isAsked(const AssociationStep& step, const ObjectPath& path) const {
    const auto playsRole = [&](const ReferenceEnd& far) { return _classes->isA(path.className, far.className); };
    return (_filter.resultClass.empty() || _classes->isA(path.className, _filter.resultClass)) &&
           (_filter.resultRole.empty() || std::any_of(step.farEnds.begin(), step.farEnds.end(), playsRole));
}

void AssociationWalk::keepAsked(const AssociationStep& step, std::vector<ObjectPath>& paths) const {
    std::erase_if(paths, [&](const ObjectPath& path) { return !isAsked(step, path); });
}

void AssociationWalk::keepAsked(const AssociationStep& step, std::vector<Instance>& instances) const {
    std::erase_if(instances, [&](const Instance& instance) { return !isAsked(step, instance.path); });
}

void AssociationWalk::keepWanted(std::vector<Instance>& instances, const PropertyList& properties) const {
    if (!properties) {
        return;
    }
    for (Instance& instance : instances) {
        const std::span<const std::string> keys = _classes->keyNames(instance.path.className);
        std::erase_if(instance.properties, [&](const NamedValue& property) {
            return !contains(*properties, property.name) && !contains(keys, property.name);
        });
    }
}

} // namespace ObjectManager

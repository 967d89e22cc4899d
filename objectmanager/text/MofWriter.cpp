#include "text/MofText.h"
#include "text/Writers.h"

#include <algorithm>
#include <iterator>

namespace ObjectManager {

namespace {

/** The class in which CIM indications embed the arguments and results of a method call. */
constexpr const char* methodParametersClass = "__MethodParameters";

} // namespace

void MofWriter::names(const std::vector<ObjectPath>& paths) {
    for (const ObjectPath& path : paths) {
        _out << mofInstance({path, path.keys});
    }
}

void MofWriter::instances(const std::vector<Instance>& instances) {
    for (const Instance& each : instances) {
        instance(each);
    }
}

void MofWriter::instance(const Instance& instance) {
    _out << mofInstance(instance);
}

void MofWriter::associatedNames(const std::vector<Associated<ObjectPath>>& found) {
    for (const Associated<ObjectPath>& each : found) {
        _out << "// through " << each.associationClass << '\n';
        names(each.objects);
    }
}

void MofWriter::associatedInstances(const std::vector<Associated<Instance>>& found) {
    for (const Associated<Instance>& each : found) {
        _out << "// through " << each.associationClass << '\n';
        instances(each.objects);
    }
}

void MofWriter::classes(const std::vector<Class>& classes) {
    const char* separator = "";
    for (const Class& each : classes) {
        _out << separator << mofClass(each);
        separator = "\n";
    }
}

void MofWriter::methodResult(const Method& method, const Value& returnValue, const std::vector<NamedValue>& outputs) {
    Instance result;
    result.path.className = methodParametersClass;
    result.properties.push_back({"ReturnValue", returnValue});
    std::copy(outputs.begin(), outputs.end(), std::back_inserter(result.properties));
    _out << "// " << method.name << '\n' << mofInstance(result);
}

void MofWriter::summary(const std::vector<std::vector<std::string>>& /*rows*/, const std::vector<Instance>& instances) {
    this->instances(instances);
}

} // namespace ObjectManager

#include "Expected.h"

#include <algorithm>
#include <iterator>

namespace OrvTest {
namespace {

const std::string separator = "==============================================================================";
const std::string nameSpace = "root/cimv2";
const std::string host = "managed.example.org";

std::string quoted(const std::string& text) {
    return '"' + text + '"';
}

} // namespace

testing::AssertionResult sameLines(const Lines& expected, const Lines& actual) {
    if (expected == actual) {
        return testing::AssertionSuccess();
    }
    const auto begin = std::mismatch(expected.begin(), expected.end(), actual.begin(), actual.end());
    const auto end = std::mismatch(expected.rbegin(), std::make_reverse_iterator(begin.first), actual.rbegin(),
                                   std::make_reverse_iterator(begin.second));
    testing::AssertionResult result = testing::AssertionFailure();
    result << begin.first - expected.begin() << " lines as expected, then (- expected, + actual)";
    std::for_each(begin.first, end.first.base(), [&](const std::string& line) { result << "\n- " << line; });
    std::for_each(begin.second, end.second.base(), [&](const std::string& line) { result << "\n+ " << line; });
    return result << "\nthen " << end.first - expected.rbegin() << " lines as expected";
}

const Source factorySource = {"Corvane.PowerMgmtObjFactory", "src/PowerStateManagementObjFactory.cpp"};
const Source serviceSource = {"Corvane.PowerMgmtSvcProvider", "src/PowerManagementServiceProvider.cpp"};
const Source capabilitiesSource = {"Corvane.PowerMgmtCapabilitiesProvider",
                                   "src/PowerManagementCapabilitiesProvider.cpp"};

std::string Source::record(int level, const std::string& function, const std::string& text) const {
    return "log+trace " + std::to_string(level) + ' ' + category + ' ' + function + ' ' + file + ": " + text;
}

std::string Source::entering(const std::string& function, const std::string& parameters) const {
    return record(3000, function,
                  "ENTERING: " + function + "() in " + file + " [Line: <line>],Parameters List: " + parameters);
}

std::string Source::exiting(const std::string& function, const std::string& parameters) const {
    return record(3000, function,
                  "EXITING: " + function + "() in " + file + " [Line: <line>],Parameters List: " + parameters);
}

std::string Source::message(int level, const std::string& function, const std::string& text) const {
    return record(level, function, "MESSAGE [File: " + file + ", Line: <line>]: " + text);
}

std::string Source::variable(const std::string& function, const std::string& name, const std::string& value) const {
    return record(4000, function, "VARIABLE: '" + name + "' has Value '" + value + "' at line <line> in " + file);
}

Lines Source::entry(const std::string& operation) const {
    const std::string mark = "log+trace 4000 " + category + " markProviderEntry include/Trace.h:";
    return {mark + "336: " + separator, mark + "337: ENTERING: " + operation + "() in " + file + " [Line: <line>]"};
}

Lines Source::exit(const std::string& operation) const {
    const std::string mark = "log+trace 4000 " + category + " markProviderExit include/Trace.h:";
    return {mark + "348: EXITING: " + operation + "() in " + file + " [Line: <line>]", mark + "349: " + separator};
}

Lines discovery() {
    Lines result = {"Instrumentation()", "instrumentation.selectNode(40) -> true"};
    int position = 0;
    unsigned int number = 0;
    for (const Node& node : Agent::instance().nodes) {
        const std::string internal = quoted("node/" + std::to_string(position++));
        const std::string read = "instrumentation.getProperty(123, " + std::to_string(number) + ") -> ";
        number = node.powerState.value_or(number);
        result = lines(result, "instrumentation.getPathToNode() -> " + internal,
                       "instrumentation.convertPathToString(" + internal + ") -> " + quoted(node.path),
                       "instrumentation.getProperty(125, []) -> false",
                       read + (node.powerState ? "true, " + std::to_string(number) : "false"), "++instrumentation");
    }
    return lines(result, "~Instrumentation()");
}

Lines failedDiscovery() {
    return {"Instrumentation()", "instrumentation.selectNode(40) -> false", "~Instrumentation()",
            factorySource.message(6000, "PowerStateManagementObjFactory", " getPowerStateManagementInstances Failed")};
}

std::string newPath(int number, const std::string& className) {
    return "broker.newObjectPath(" + quoted(nameSpace) + ", " + quoted(className) + ") -> path#" +
           std::to_string(number);
}

std::string namespaceSet(const std::string& path) {
    return path + ".setNameSpace(" + quoted(nameSpace) + ')';
}

std::string hostSet(const std::string& path) {
    return path + ".setHostname(" + quoted(host) + ')';
}

const ElementClass serviceClass = {
    .prefix = "PowerManagementService",
    .className = "TALVO_PowerManagementService",
    .key = "Name",
    .source = serviceSource,
    .keyPrefix = "PowerStateManagement_",
    .getAllPaths = "getAllPMCMPIObjPaths",
    .getAllInstances = "getAllPMCMPIInstances",
    .getOneInstance = "getOnePMCMPIInstance",
    .makeInstance = "makePMInstance",
    .noPath = "Create CMPIObjectPath                                  failed for Power Management Service.",
    .noInstance = "*** getOnePMCMPIInstance Failed: No Instance found***",
    .instancesExit = false,
    .pathsExit = true,
};

const ElementClass capabilitiesClass = {
    .prefix = "PowerManagementCapabilities",
    .className = "TALVO_PowerManagementCapabilities",
    .key = "InstanceID",
    .source = capabilitiesSource,
    .keyPrefix = "",
    .getAllPaths = "getAllPMCapCMPIObjPaths",
    .getAllInstances = "getAllPMCapCMPIInstances",
    .getOneInstance = "getOnePMCapCMPIInstance",
    .makeInstance = "makePMCapInstance",
    .noPath = "Create CMPIObjectPath                                  failed for PowerManagement"
              "                                  Capabilities Class.",
    .noInstance = "*** getOnePMCapCMPIInstance Failed :No Instance found***",
    .instancesExit = true,
    .pathsExit = false,
};

std::string ElementClass::pathsParameters(const std::string& ref) const {
    return " broker=&broker ref=&" + ref + " objectPaths=<address> status=<address>";
}

std::string ElementClass::instancesParameters(const std::string& properties, const std::string& ref,
                                              bool isObjPath) const {
    return " broker=&broker ref=&" + ref + " properties=" + properties + " isObjPath=" + (isObjPath ? '1' : '0') +
           " instances=<address> rc=<address>";
}

Lines ElementClass::keys(const std::string& object, const std::string& setter, const std::string& node) const {
    const auto line = [&](const std::string& name, const std::string& value) {
        return object + '.' + setter + '(' + name + ", CMPI_chars, " + quoted(value) + ')';
    };
    if (key == "InstanceID") {
        return {line("InstanceID", keyOf(node))};
    }
    return {line("CreationClassName", className), line("Name", keyOf(node)),
            line("SystemCreationClassName", "TALVO_ComputerSystem"), line("SystemName", host)};
}

Lines ElementClass::pathContent(int number, const std::string& node) const {
    const std::string path = "path#" + std::to_string(number);
    return lines(namespaceSet(path), hostSet(path), keys(path, "addKey", node));
}

Lines ElementClass::path(int number, const std::string& node) const {
    return lines(newPath(number, className), pathContent(number, node));
}

Lines ElementClass::allPaths(const Lines& nodes, const Place& place) const {
    Lines result = {factorySource.entering(getAllPaths, pathsParameters(place.ref))};
    int number = place.paths;
    for (const std::string& node : nodes) {
        result = lines(result, path(++number, node));
    }
    return pathsExit ? lines(result, factorySource.exiting(getAllPaths, pathsParameters(place.ref))) : result;
}

std::string ElementClass::makeParameters(const std::string& properties, const std::string& ref, bool isObjPath) const {
    const std::string list = key == "InstanceID" ? " properties=" + properties : "";
    return " broker=&broker ref=&" + ref + " pm=<address>" + list + " isObjPath=" + (isObjPath ? '1' : '0') +
           " rc=<address>";
}

Lines ElementClass::instanceFrame(int number, const std::string& node, const std::string& properties,
                                  const std::string& filter, const Lines& content, const Place& place) const {
    const std::string path = "path#" + std::to_string(place.paths + number);
    const std::string instance = "instance#" + std::to_string(place.instances + number);
    const std::string parameters = makeParameters(properties, place.ref, filter.empty());
    const std::string keyNames =
        key == "InstanceID" ? "{InstanceID}" : "{CreationClassName, Name, SystemCreationClassName, SystemName}";
    return lines(factorySource.entering(makeInstance, parameters), newPath(place.paths + number, className),
                 namespaceSet(path), hostSet(path), "broker.newInstance(" + path + ") -> " + instance + ", no status",
                 filter.empty() ? Lines() : Lines{instance + ".setPropertyFilter(" + filter + ", " + keyNames + ')'},
                 keys(instance, "setProperty", node), content, factorySource.exiting(makeInstance, parameters));
}

std::string ElementClass::elementName(int number, const std::string& node) const {
    const std::string before = key == "InstanceID" ? "PowerStateManagementCapabilities_" : "PowerStateManagement_";
    return "instance#" + std::to_string(number) + ".setProperty(ElementName, CMPI_chars, " + quoted(before + node) +
           ')';
}

Lines ElementClass::instance(int number, const std::string& node, const Place& place) const {
    const std::string instance = "instance#" + std::to_string(place.instances + number);
    if (key == "InstanceID") {
        const auto list = [&](int array, const std::string& property, const std::vector<int>& codes) {
            const std::string name = "array#" + std::to_string(array);
            Lines result = {"broker.newArray(3, CMPI_uint16) -> " + name};
            int index = 0;
            for (const int code : codes) {
                result.push_back(name + ".setElementAt(" + std::to_string(index++) + ", CMPI_uint16, " +
                                 std::to_string(code) + ')');
            }
            return lines(result, instance + ".setProperty(" + property + ", CMPI_uint16A, " + name + ')');
        };
        return instanceFrame(number, node, "0", "null",
                             lines(list(2 * number - 1, "PowerChangeCapabilities", {3, 4, 8}),
                                   elementName(place.instances + number, node),
                                   list(2 * number, "PowerStatesSupported", {2, 5, 8})),
                             place);
    }
    const auto localized = [&](const std::string& property, const std::string& id) {
        return lines("getLanguageId() -> 7", "getResourceLibrary(2, 7)",
                     "ResourceString(library 2 in language 7, " + id + ')', "make_string(" + id + ')',
                     instance + ".setProperty(" + property + ", CMPI_chars, " + quoted(id) + ')');
    };
    return instanceFrame(number, node, "0", "null",
                         lines(localized("Caption", "MSGID_POWER_MANAGEMENT_CAPTION"),
                               localized("Description", "MSGID_POWER_MANAGEMENT_DESCRIPTION"),
                               elementName(place.instances + number, node)),
                         place);
}

Lines ElementClass::instanceWithElementName(int number, const std::string& node) const {
    return instanceFrame(number, node, "&properties", "{ElementName}", {elementName(number, node)});
}

Lines ElementClass::allInstances(const Lines& nodes, const Place& place) const {
    Lines result = {factorySource.entering(getAllInstances, instancesParameters("0", place.ref))};
    int number = 0;
    for (const std::string& node : nodes) {
        result = lines(result, instance(++number, node, place));
    }
    return instancesExit ? lines(result, factorySource.exiting(getAllInstances, instancesParameters("0", place.ref)))
                         : result;
}

Lines ElementClass::allInstancesForPaths(const Lines& nodes, const Place& place) const {
    const std::string parameters = instancesParameters("0", place.ref, true);
    Lines result = {factorySource.entering(getAllInstances, parameters)};
    int number = 0;
    for (const std::string& node : nodes) {
        result = lines(result, instanceFrame(++number, node, "0", "", {}, place));
    }
    return instancesExit ? lines(result, factorySource.exiting(getAllInstances, parameters)) : result;
}

namespace {

std::string targetParameters(const std::string& association, const char* resultClass) {
    return " _broker=&broker ref=&ref _RefLeftClass=" + association +
           " _RefRightClass=" + (resultClass == nullptr ? "" : std::string(resultClass) + " rc=<address>");
}

std::string targetMessage(const std::string& target) {
    if (target.empty()) {
        return "Target Class is empty";
    }
    if (target == "TALVO_PowerManagementCapabilities") {
        return "Target Class is                          TALVO_PowerManagementCapabilities";
    }
    return target == "TALVO_ComputerSystem" ? "Target Class is TALVO_ComputerSystem"
                                            : "Target Class is TALVO_PowerManagementService";
}

} // namespace

Lines targetNamed(const std::string& association, const char* resultClass, const std::string& target) {
    const std::string name = "get_assoc_targetClass_Name";
    return {factorySource.entering(name, targetParameters(association, resultClass)), "ref.getClassName() -> ref.class",
            factorySource.message(4000, name, targetMessage(target))};
}

Lines targetFound(const std::string& association, const char* resultClass, const std::string& target) {
    const std::string name = "get_assoc_targetClass_ObjectPath";
    return lines(factorySource.entering(name, targetParameters(association, resultClass)),
                 targetNamed(association, resultClass, target), factorySource.variable(name, "targetName", target),
                 target.empty() ? Lines() : Lines{newPath(1, target), namespaceSet("path#1"), hostSet("path#1")},
                 factorySource.exiting(name, targetParameters(association, resultClass)));
}

} // namespace OrvTest

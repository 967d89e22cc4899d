#include "cimxml/Operations.h"

#include "agentlog/AgentLog.h"
#include "cimxml/Parameters.h"

#include <algorithm>
#include <array>

namespace ObjectManager::CimXml {

namespace {

/** An intrinsic method that is being answered. */
struct Call {
    const Operation& operation;
    const Parameters& parameters;

    Dispatcher& dispatcher() const { return operation.dispatcher; }
    const Catalogue& catalogue() const { return operation.catalogue; }
    const std::string& nameSpace() const { return operation.message.nameSpace(); }
    ResponseWriter& writer() const { return operation.writer; }

    Invocation invocation() const {
        Invocation invocation;
        invocation.principal = operation.caller.user;
        invocation.flags = (parameters.flag("IncludeClassOrigin", false) ? CMPI_FLAG_IncludeClassOrigin : 0) |
                           (parameters.flag("DeepInheritance", true) ? CMPI_FLAG_DeepInheritance : 0);
        return invocation;
    }
};

/* What classes there are. */

bool isRegistered(const Operation& operation, std::string_view className) {
    const auto& registrations = operation.dispatcher.registry().registrations();
    return std::any_of(registrations.begin(), registrations.end(), [&](const Registration& registration) {
        return equalNames(registration.className, className) && registration.isIn(operation.message.nameSpace());
    });
}

CimError unknownClass(const std::string& className, CMPIrc code = CMPI_RC_ERR_INVALID_CLASS) {
    return {code, "there is no class " + className};
}

/** Throws where nobody serves instances of the class itself, so that there is none. */
void requireServed(const Operation& operation, const std::string& className) {
    if (!isRegistered(operation, className)) {
        throw operation.catalogue.find(className) == nullptr
            ? unknownClass(className)
            : CimError(CMPI_RC_ERR_NOT_FOUND, "no provider serves instances of the class " + className);
    }
}

/** The failure of one class's provider in an enumeration of an ancestor, named by the class. */
CimError failureOf(const std::string& className, const CimError& error) {
    CimError failure(error.code, className + ": " + error.what());
    failure.reasons = error.reasons;
    return failure;
}

/** Calls for each class that is the one named or descends from it, and has a provider of instances. */
template <class Do>
void forEachServed(const Call& call, const ObjectPath& classPath, Do doWith) {
    bool served = false;
    for (const Registration* registration :
         call.dispatcher().registry().all(classPath.nameSpace, ProviderKind::instance)) {
        if (call.catalogue().isA(registration->className, classPath.className)) {
            served = true;
            ObjectPath path = classPath;
            path.className = registration->className;
            try {
                doWith(path);
            } catch (const CimError& error) {
                if (equalNames(path.className, classPath.className)) {
                    throw;
                }
                throw failureOf(path.className, error);
            }
        }
    }
    // Nobody having to serve it, a class that is declared has no instances.
    if (!served &&
        (isRegistered(call.operation, classPath.className) || call.catalogue().find(classPath.className) == nullptr)) {
        call.dispatcher().registry().find(classPath.nameSpace, classPath.className, ProviderKind::instance);
    }
}

/** Throws `unknown` where there is no such class: where the class itself is asked for, DSP0200 has another code. */
const Class& declaredClass(const Call& call, const std::string& className, CMPIrc unknown = CMPI_RC_ERR_INVALID_CLASS) {
    const Class* declared = call.catalogue().find(className);
    if (declared == nullptr) {
        throw unknownClass(className, unknown);
    }
    return *declared;
}

/* What of them is asked for. */

/**
 * What a provider is asked for: the properties as the class spells them, without those that it does not have, and with
 * its keys, lest instances lose their paths.
 */
PropertyList askedOfProvider(const Call& call, const PropertyList& properties, const std::string& className) {
    const Class* declared = call.catalogue().find(className);
    if (!properties || declared == nullptr) {
        return properties;
    }
    const auto keys = call.catalogue().keyNames(className);
    PropertyList asked(std::in_place, keys.begin(), keys.end());
    for (const std::string& name : *properties) {
        const Property* property = declared->property(name);
        if (property != nullptr && !property->isKey()) {
            asked->push_back(property->name);
        }
    }
    return asked;
}

/** Of instances. LocalOnly and IncludeQualifiers, which are deprecated for them, are always taken as false. */
Selection selectionOfInstances(const Call& call) {
    call.parameters.flag("LocalOnly", true);
    call.parameters.flag("IncludeQualifiers", false);
    Selection selection;
    selection.properties = call.parameters.propertyList();
    selection.classOrigin = call.parameters.flag("IncludeClassOrigin", false);
    return selection;
}

Selection selectionOfClasses(const Call& call) {
    Selection selection;
    selection.properties = call.parameters.propertyList();
    selection.localOnly = call.parameters.flag("LocalOnly", true);
    selection.qualifiers = call.parameters.flag("IncludeQualifiers", true);
    selection.classOrigin = call.parameters.flag("IncludeClassOrigin", false);
    return selection;
}

/* The methods, in the order of their table. */

void getInstance(const Call& call) {
    const ObjectPath path = call.parameters.instanceName("InstanceName");
    const Selection selection = selectionOfInstances(call);
    requireServed(call.operation, path.className);
    const PropertyList properties = askedOfProvider(call, selection.properties, path.className);
    const Instance instance = call.dispatcher().getInstance(call.invocation(), path, properties);
    call.writer().raw("<IRETURNVALUE>\n");
    call.writer().instance(instance, selection);
    call.writer().raw("</IRETURNVALUE>\n");
}

void enumerateInstances(const Call& call) {
    const ObjectPath classPath = call.parameters.className("ClassName");
    Selection selection = selectionOfInstances(call);
    if (!call.parameters.flag("DeepInheritance", true)) {
        selection.within = call.catalogue().find(classPath.className);
    }
    call.writer().raw("<IRETURNVALUE>\n");
    forEachServed(call, classPath, [&](const ObjectPath& path) {
        const PropertyList properties = askedOfProvider(call, selection.properties, path.className);
        call.dispatcher().enumerateInstances(call.invocation(), path, properties, [&](Instance&& instance) {
            call.writer().namedInstance(instance, selection);
        });
    });
    call.writer().raw("</IRETURNVALUE>\n");
}

void enumerateInstanceNames(const Call& call) {
    const ObjectPath classPath = call.parameters.className("ClassName");
    call.writer().raw("<IRETURNVALUE>\n");
    forEachServed(call, classPath, [&](const ObjectPath& path) {
        call.dispatcher().enumerateInstanceNames(call.invocation(), path,
                                                 [&](ObjectPath&& name) { call.writer().instanceName(name); });
    });
    call.writer().raw("</IRETURNVALUE>\n");
}

/** The source of a walk. Between classes there is none. */
ObjectPath source(const Call& call) {
    ObjectPath path = call.parameters.objectName("ObjectName");
    if (path.keys.empty()) {
        declaredClass(call, path.className);
        throw CimError(CMPI_RC_ERR_NOT_SUPPORTED,
                       "found the class " + path.className + " as ObjectName, expected an instance: " +
                           call.operation.message.method() + " is not supported between classes");
    }
    return path;
}

AssociationFilter associatorFilter(const Call& call) {
    return {call.parameters.optionalClassName("AssocClass"), call.parameters.optionalClassName("ResultClass"),
            call.parameters.optionalText("Role"), call.parameters.optionalText("ResultRole")};
}

AssociationFilter referenceFilter(const Call& call) {
    return {call.parameters.optionalClassName("ResultClass"), {}, call.parameters.optionalText("Role"), {}};
}

void associators(const Call& call) {
    const Selection selection = selectionOfInstances(call);
    const auto found =
        call.dispatcher().associators(call.invocation(), source(call), associatorFilter(call), selection.properties);
    call.writer().raw("<IRETURNVALUE>\n");
    for (const auto& [associationClass, instances] : found) {
        for (const Instance& instance : instances) {
            call.writer().objectWithPath(instance, selection);
        }
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void associatorNames(const Call& call) {
    const auto found = call.dispatcher().associatorNames(call.invocation(), source(call), associatorFilter(call));
    call.writer().raw("<IRETURNVALUE>\n");
    for (const auto& [associationClass, paths] : found) {
        for (const ObjectPath& path : paths) {
            call.writer().objectPath(path);
        }
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void references(const Call& call) {
    const Selection selection = selectionOfInstances(call);
    // With all properties, since the paths of associations are made of some.
    const auto found =
        call.dispatcher().references(call.invocation(), source(call), referenceFilter(call), std::nullopt);
    call.writer().raw("<IRETURNVALUE>\n");
    for (const Instance& instance : found) {
        call.writer().objectWithPath(instance, selection);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void referenceNames(const Call& call) {
    const auto found = call.dispatcher().referenceNames(call.invocation(), source(call), referenceFilter(call));
    call.writer().raw("<IRETURNVALUE>\n");
    for (const ObjectPath& path : found) {
        call.writer().objectPath(path);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

/** The property of the class that PropertyName names. */
const Property& namedProperty(const Call& call, const ObjectPath& path) {
    const std::string name = call.parameters.text("PropertyName");
    requireServed(call.operation, path.className);
    const Property* property = declaredClass(call, path.className).property(name);
    if (property == nullptr) {
        throw CimError(CMPI_RC_ERR_NO_SUCH_PROPERTY, path.className + " has no property " + name);
    }
    return *property;
}

void getProperty(const Call& call) {
    const ObjectPath path = call.parameters.instanceName("InstanceName");
    const std::string& name = namedProperty(call, path).name;
    const PropertyList properties = askedOfProvider(call, PropertyList({name}), path.className);
    const Instance instance = call.dispatcher().getInstance(call.invocation(), path, properties);
    const NamedValue* property = find(instance.properties, name);
    call.writer().raw("<IRETURNVALUE>");
    if (property != nullptr) {
        call.writer().value(property->value);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void setProperty(const Call& call) {
    const ObjectPath path = call.parameters.instanceName("InstanceName");
    const Property& property = namedProperty(call, path);
    const Instance changed{path, {{property.name, call.parameters.value("NewValue", property.type)}}};
    call.dispatcher().modifyInstance(call.invocation(), path, changed, PropertyList({property.name}));
}

void createInstance(const Call& call) {
    const Instance instance = call.parameters.instance("NewInstance");
    if (!isRegistered(call.operation, instance.path.className)) {
        declaredClass(call, instance.path.className);
        throw CimError(CMPI_RC_ERR_NOT_SUPPORTED,
                       "no provider serves instances of the class " + instance.path.className);
    }
    const ObjectPath path = call.dispatcher().createInstance(call.invocation(), instance.path, instance);
    call.writer().raw("<IRETURNVALUE>\n");
    call.writer().instanceName(path);
    call.writer().raw("</IRETURNVALUE>\n");
}

void modifyInstance(const Call& call) {
    const Instance instance = call.parameters.namedInstance("ModifiedInstance");
    call.parameters.flag("IncludeQualifiers", true);
    requireServed(call.operation, instance.path.className);
    call.dispatcher().modifyInstance(call.invocation(), instance.path, instance, call.parameters.propertyList());
}

void deleteInstance(const Call& call) {
    const ObjectPath path = call.parameters.instanceName("InstanceName");
    requireServed(call.operation, path.className);
    call.dispatcher().deleteInstance(call.invocation(), path);
}

/** The class that a query is about: the word behind FROM, which all languages of queries have. */
std::string classOfQuery(const std::string& query) {
    constexpr std::string_view space = " \t\r\n";
    bool from = false;
    for (std::size_t start = query.find_first_not_of(space); start != std::string::npos;) {
        const std::size_t end = std::min(query.find_first_of(space, start), query.size());
        std::string word = query.substr(start, end - start);
        if (from) {
            return word;
        }
        from = equalNames(word, "from");
        start = query.find_first_not_of(space, end);
    }
    throw CimError(CMPI_RC_ERR_INVALID_QUERY, "found the query \"" + query + "\", expected FROM and a class in it");
}

void execQuery(const Call& call) {
    const std::string language = call.parameters.text("QueryLanguage");
    const std::string query = call.parameters.text("Query");
    const ObjectPath classPath{{}, call.nameSpace(), classOfQuery(query), {}};
    call.writer().raw("<IRETURNVALUE>\n");
    forEachServed(call, classPath, [&](const ObjectPath& path) {
        call.dispatcher().execQuery(call.invocation(), path, query, language, [&](Instance&& instance) {
            call.writer().raw("<VALUE.OBJECT>\n");
            call.writer().instance(instance, {});
            call.writer().raw("</VALUE.OBJECT>\n");
        });
    });
    call.writer().raw("</IRETURNVALUE>\n");
}

void getClass(const Call& call) {
    const Selection selection = selectionOfClasses(call);
    const Class& declared =
        declaredClass(call, call.parameters.className("ClassName").className, CMPI_RC_ERR_NOT_FOUND);
    call.writer().raw("<IRETURNVALUE>\n");
    call.writer().classDeclaration(declared, selection);
    call.writer().raw("</IRETURNVALUE>\n");
}

/** The classes that an enumeration finds: the descendants of one class, or the children only; else of none. */
std::vector<const Class*> classesBelow(const Call& call) {
    const std::string ancestor = call.parameters.optionalClassName("ClassName");
    const bool deep = call.parameters.flag("DeepInheritance", false);
    if (!ancestor.empty()) {
        declaredClass(call, ancestor);
    }
    std::vector<const Class*> classes = call.catalogue().all();
    std::erase_if(classes, [&](const Class* declared) {
        if (deep) {
            return !ancestor.empty() &&
                   (equalNames(declared->name, ancestor) || !call.catalogue().isA(declared->name, ancestor));
        }
        return !equalNames(declared->superClass, ancestor);
    });
    return classes;
}

void enumerateClasses(const Call& call) {
    const Selection selection = selectionOfClasses(call);
    const std::vector<const Class*> classes = classesBelow(call);
    call.writer().raw("<IRETURNVALUE>\n");
    for (const Class* declared : classes) {
        call.writer().classDeclaration(*declared, selection);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void enumerateClassNames(const Call& call) {
    const std::vector<const Class*> classes = classesBelow(call);
    call.writer().raw("<IRETURNVALUE>\n");
    for (const Class* declared : classes) {
        call.writer().className(declared->name);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

enum class Access { read, change };

struct IntrinsicMethod {
    std::string_view name;
    Access access;
    ParameterNames parameters;
    void (*answer)(const Call& call);
};

constexpr IntrinsicMethod intrinsicMethods[] = {
    {"GetInstance",
     Access::read,
     {"InstanceName", "LocalOnly", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"},
     getInstance},
    {"EnumerateInstances",
     Access::read,
     {"ClassName", "LocalOnly", "DeepInheritance", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"},
     enumerateInstances},
    {"EnumerateInstanceNames", Access::read, {"ClassName"}, enumerateInstanceNames},
    {"Associators",
     Access::read,
     {"ObjectName", "AssocClass", "ResultClass", "Role", "ResultRole", "IncludeQualifiers", "IncludeClassOrigin",
      "PropertyList"},
     associators},
    {"AssociatorNames",
     Access::read,
     {"ObjectName", "AssocClass", "ResultClass", "Role", "ResultRole"},
     associatorNames},
    {"References",
     Access::read,
     {"ObjectName", "ResultClass", "Role", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"},
     references},
    {"ReferenceNames", Access::read, {"ObjectName", "ResultClass", "Role"}, referenceNames},
    {"GetProperty", Access::read, {"InstanceName", "PropertyName"}, getProperty},
    {"SetProperty", Access::change, {"InstanceName", "PropertyName", "NewValue"}, setProperty},
    {"CreateInstance", Access::change, {"NewInstance"}, createInstance},
    {"ModifyInstance", Access::change, {"ModifiedInstance", "IncludeQualifiers", "PropertyList"}, modifyInstance},
    {"DeleteInstance", Access::change, {"InstanceName"}, deleteInstance},
    {"ExecQuery", Access::read, {"QueryLanguage", "Query"}, execQuery},
    {"GetClass",
     Access::read,
     {"ClassName", "LocalOnly", "IncludeQualifiers", "IncludeClassOrigin", "PropertyList"},
     getClass},
    {"EnumerateClasses",
     Access::read,
     {"ClassName", "DeepInheritance", "LocalOnly", "IncludeQualifiers", "IncludeClassOrigin"},
     enumerateClasses},
    {"EnumerateClassNames", Access::read, {"ClassName", "DeepInheritance"}, enumerateClassNames},
};

/** The arguments, in the order of the method's parameters. What is null is left out, as if it had not been given. */
std::vector<NamedValue> argumentsOf(const Operation& operation, const Method& method) {
    const std::vector<Argument>& given = operation.message.arguments();
    for (const Argument& argument : given) {
        const Parameter* parameter = findElement(method.parameters, argument.name);
        if (parameter == nullptr || !parameter->isIn()) {
            throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                           "found the argument " + argument.name + ", which is no input of " + method.name);
        }
        if (std::count_if(given.begin(), given.end(),
                          [&](const Argument& other) { return equalNames(other.name, argument.name); }) > 1) {
            throw CimError(CMPI_RC_ERR_INVALID_PARAMETER,
                           "found the argument " + argument.name + " twice, expected it once");
        }
    }
    const ValueReader reader(operation.catalogue, operation.message.nameSpace());
    std::vector<NamedValue> arguments;
    for (const Parameter& parameter : method.parameters) {
        const auto argument = std::find_if(given.begin(), given.end(),
                                           [&](const Argument& a) { return equalNames(a.name, parameter.name); });
        if (argument != given.end() && argument->content != nullptr) {
            arguments.push_back({parameter.name, reader.argument(*argument->content, parameter)});
        } else if (hasFlag(parameter.qualifiers, "Required")) {
            throw CimError(CMPI_RC_ERR_INVALID_PARAMETER, "found no argument " + parameter.name +
                                                              ", expected it since " + method.name + " requires it");
        }
    }
    return arguments;
}

/** Calls a class's own method. A power request that the agent refused fails, also where the provider tells of none. */
void callMethod(const Operation& operation) {
    const Message& message = operation.message;
    const ValueReader reader(operation.catalogue, message.nameSpace());
    const bool isClass = message.target().name == "CLASSNAME";
    const ObjectPath path = isClass ? reader.className(message.target()) : reader.instanceName(message.target());
    const Class* declared = operation.catalogue.find(path.className);
    if (declared == nullptr) {
        throw unknownClass(path.className);
    }
    const Method* method = declared->method(message.method());
    if (method == nullptr) {
        throw CimError(CMPI_RC_ERR_METHOD_NOT_FOUND, declared->name + " has no method " + message.method());
    }
    if (isClass && !hasFlag(method->qualifiers, "Static")) {
        throw CimError(CMPI_RC_ERR_INVALID_PARAMETER, "found the class " + declared->name + " as the target of " +
                                                          method->name +
                                                          ", expected an instance: the method is not static");
    }
    const std::vector<NamedValue> arguments = argumentsOf(operation, *method);
    requireServed(operation, path.className);
    Invocation invocation;
    invocation.principal = operation.caller.user;
    if (!isClass) {
        operation.dispatcher.requireInstance(invocation, path);
    }
    LogTap* log = operation.dispatcher.log();
    const std::uint64_t before = log != nullptr ? log->newest() : 0;
    const MethodResult result = operation.dispatcher.invokeMethod(invocation, path, method->name, arguments);
    if (log != nullptr) {
        const std::string refusal = powerRequestText(log->since(before), PowerAnswer::refused);
        if (!refusal.empty()) {
            throw CimError(CMPI_RC_ERR_FAILED, refusal);
        }
    }
    operation.writer.returnValue(result.returnValue);
    for (const NamedValue& argument : result.outArguments) {
        operation.writer.parameter(argument);
    }
}

const IntrinsicMethod& intrinsicMethod(const std::string& name) {
    const auto* const found =
        std::find_if(std::begin(intrinsicMethods), std::end(intrinsicMethods),
                     [&](const IntrinsicMethod& method) { return equalNames(method.name, name); });
    if (found == std::end(intrinsicMethods)) {
        throw CimError(CMPI_RC_ERR_NOT_SUPPORTED, "the operation " + name + " is not supported");
    }
    return *found;
}

void requireAccess(const Caller& caller, Access access) {
    if (access == Access::read ? !caller.mayRead : !caller.mayRead || !caller.mayChangePower) {
        throw CimError(CMPI_RC_ERR_ACCESS_DENIED,
                       (caller.user.empty() ? "this user" : caller.user) +
                           (caller.mayRead ? " may read, but not change anything" : " may do nothing here"));
    }
}

} // namespace

void perform(const Operation& operation) {
    requireAccess(operation.caller, Access::read);
    const Message& message = operation.message;
    if (!message.isIntrinsic()) {
        requireAccess(operation.caller, Access::change);
        operation.dispatcher.registry().requireNameSpace(message.nameSpace());
        callMethod(operation);
        return;
    }
    const IntrinsicMethod& method = intrinsicMethod(message.method());
    requireAccess(operation.caller, method.access);
    operation.dispatcher.registry().requireNameSpace(message.nameSpace());
    method.answer({operation, Parameters(message, operation.catalogue, method.parameters)});
}

} // namespace ObjectManager::CimXml

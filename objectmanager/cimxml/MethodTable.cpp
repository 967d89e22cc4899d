#include "cimxml/MethodTable.h"

#include "cimxml/ClassAssociations.h"
#include "cimxml/IntrinsicCall.h"
#include "cimxml/PullOperations.h"

#include <algorithm>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

/* The intrinsic methods, in the order of the table. */

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
    const Selection selection = selectionOfEnumeration(call);
    call.writer().raw("<IRETURNVALUE>\n");
    forEachInstance(call, call.parameters.className("ClassName"), selection.properties,
                    [&](Instance&& instance) { call.writer().namedInstance(instance, selection); });
    call.writer().raw("</IRETURNVALUE>\n");
}

void enumerateInstanceNames(const Call& call) {
    call.writer().raw("<IRETURNVALUE>\n");
    forEachInstanceName(call, [&](ObjectPath&& name) { call.writer().instanceName(name); });
    call.writer().raw("</IRETURNVALUE>\n");
}

/* For classes, associators and references are those that the declarations allow. */

/** The class that ObjectName names. Throws if it or a class of the filter is not declared. */
const Class& sourceClass(const Call& call, const AssociationFilter& filter) {
    for (const std::string& className : {filter.associationClass, filter.resultClass}) {
        if (!className.empty()) {
            declaredClass(call, className, CMPI_RC_ERR_INVALID_PARAMETER);
        }
    }
    return declaredClass(call, call.parameters.className("ObjectName").className, CMPI_RC_ERR_INVALID_PARAMETER);
}

void writeClasses(const Call& call, const std::vector<const Class*>& classes) {
    const Selection selection = selectionOfClasses(call, false, false);
    call.writer().raw("<IRETURNVALUE>\n");
    for (const Class* declared : classes) {
        call.writer().classWithPath(*declared, selection);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void writeClassPaths(const Call& call, const std::vector<const Class*>& classes) {
    call.writer().raw("<IRETURNVALUE>\n");
    for (const Class* declared : classes) {
        call.writer().classObjectPath(declared->name);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void associators(const Call& call) {
    if (call.parameters.isClassName("ObjectName")) {
        const AssociationFilter filter = associatorFilter(call);
        return writeClasses(call, associatorsOfClass(call.catalogue(), sourceClass(call, filter), filter));
    }
    const Selection selection = selectionOfInstances(call);
    const auto found = call.dispatcher().associators(call.invocation(), call.parameters.instanceName("ObjectName"),
                                                     associatorFilter(call), selection.properties);
    call.writer().raw("<IRETURNVALUE>\n");
    for (const auto& [associationClass, instances] : found) {
        for (const Instance& instance : instances) {
            call.writer().objectWithPath(instance, selection);
        }
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void associatorNames(const Call& call) {
    if (call.parameters.isClassName("ObjectName")) {
        const AssociationFilter filter = associatorFilter(call);
        return writeClassPaths(call, associatorsOfClass(call.catalogue(), sourceClass(call, filter), filter));
    }
    const auto found = call.dispatcher().associatorNames(call.invocation(), call.parameters.instanceName("ObjectName"),
                                                         associatorFilter(call));
    call.writer().raw("<IRETURNVALUE>\n");
    for (const auto& [associationClass, paths] : found) {
        for (const ObjectPath& path : paths) {
            call.writer().objectPath(path);
        }
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void references(const Call& call) {
    if (call.parameters.isClassName("ObjectName")) {
        const AssociationFilter filter = referenceFilter(call);
        return writeClasses(call, referencesOfClass(call.catalogue(), sourceClass(call, filter), filter));
    }
    const Selection selection = selectionOfInstances(call);
    const auto found = referencesOf(call, call.parameters.instanceName("ObjectName"));
    call.writer().raw("<IRETURNVALUE>\n");
    for (const Instance& instance : found) {
        call.writer().objectWithPath(instance, selection);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

void referenceNames(const Call& call) {
    if (call.parameters.isClassName("ObjectName")) {
        const AssociationFilter filter = referenceFilter(call);
        return writeClassPaths(call, referencesOfClass(call.catalogue(), sourceClass(call, filter), filter));
    }
    const auto found = call.dispatcher().referenceNames(call.invocation(), call.parameters.instanceName("ObjectName"),
                                                        referenceFilter(call));
    call.writer().raw("<IRETURNVALUE>\n");
    for (const ObjectPath& path : found) {
        call.writer().objectPath(path);
    }
    call.writer().raw("</IRETURNVALUE>\n");
}

/** The property that PropertyName names, as the class declares it. */
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

/** The server enumerates the class and selects itself: few providers can execute queries. */
void execQuery(const Call& call) {
    const Query query = parseQuery(call.parameters.text("Query"), call.parameters.text("QueryLanguage"));
    Selection selection;
    selection.properties = query.properties;
    call.writer().raw("<IRETURNVALUE>\n");
    forEachMatch(call, query, [&](Instance&& instance) {
        call.writer().raw("<VALUE.OBJECT>\n");
        call.writer().instance(instance, selection);
        call.writer().raw("</VALUE.OBJECT>\n");
    });
    call.writer().raw("</IRETURNVALUE>\n");
}

void getClass(const Call& call) {
    const Selection selection = selectionOfClasses(call, true, true);
    const Class& declared =
        declaredClass(call, call.parameters.className("ClassName").className, CMPI_RC_ERR_NOT_FOUND);
    call.writer().raw("<IRETURNVALUE>\n");
    call.writer().classDeclaration(declared, selection);
    call.writer().raw("</IRETURNVALUE>\n");
}

/**
 * The classes to enumerate: the children of the class ClassName, or all of its descendants if DeepInheritance is true.
 * Without ClassName, these are the classes without a superclass, or all classes.
 */
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
    const Selection selection = selectionOfClasses(call, true, true);
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

void getQualifier(const Call& call) {
    const std::string name = call.parameters.text("QualifierName");
    const QualifierType* type = call.catalogue().qualifierTypes().find(name);
    if (type == nullptr) {
        throw CimError(CMPI_RC_ERR_NOT_FOUND, "there is no qualifier type " + name);
    }
    call.writer().raw("<IRETURNVALUE>\n");
    call.writer().qualifierDeclaration(*type);
    call.writer().raw("</IRETURNVALUE>\n");
}

void enumerateQualifiers(const Call& call) {
    call.writer().raw("<IRETURNVALUE>\n");
    for (const QualifierType* type : call.catalogue().qualifierTypes().all()) {
        call.writer().qualifierDeclaration(*type);
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
    {"OpenEnumerateInstances",
     Access::read,
     {"ClassName", "DeepInheritance", "IncludeClassOrigin", "PropertyList", "FilterQueryLanguage", "FilterQuery",
      "OperationTimeout", "ContinueOnError", "MaxObjectCount"},
     openEnumerateInstances},
    {"OpenEnumerateInstancePaths",
     Access::read,
     {"ClassName", "FilterQueryLanguage", "FilterQuery", "OperationTimeout", "ContinueOnError", "MaxObjectCount"},
     openEnumerateInstancePaths},
    {"OpenAssociatorInstances",
     Access::read,
     {"InstanceName", "AssocClass", "ResultClass", "Role", "ResultRole", "IncludeClassOrigin", "PropertyList",
      "FilterQueryLanguage", "FilterQuery", "OperationTimeout", "ContinueOnError", "MaxObjectCount"},
     openAssociatorInstances},
    {"OpenAssociatorInstancePaths",
     Access::read,
     {"InstanceName", "AssocClass", "ResultClass", "Role", "ResultRole", "FilterQueryLanguage", "FilterQuery",
      "OperationTimeout", "ContinueOnError", "MaxObjectCount"},
     openAssociatorInstancePaths},
    {"OpenReferenceInstances",
     Access::read,
     {"InstanceName", "ResultClass", "Role", "IncludeClassOrigin", "PropertyList", "FilterQueryLanguage", "FilterQuery",
      "OperationTimeout", "ContinueOnError", "MaxObjectCount"},
     openReferenceInstances},
    {"OpenReferenceInstancePaths",
     Access::read,
     {"InstanceName", "ResultClass", "Role", "FilterQueryLanguage", "FilterQuery", "OperationTimeout",
      "ContinueOnError", "MaxObjectCount"},
     openReferenceInstancePaths},
    {"OpenQueryInstances",
     Access::read,
     {"FilterQueryLanguage", "FilterQuery", "ReturnQueryResultClass", "OperationTimeout", "ContinueOnError",
      "MaxObjectCount"},
     openQueryInstances},
    {"PullInstances", Access::read, {"EnumerationContext", "MaxObjectCount"}, pullInstances},
    {"PullInstancesWithPath", Access::read, {"EnumerationContext", "MaxObjectCount"}, pullInstancesWithPath},
    {"PullInstancePaths", Access::read, {"EnumerationContext", "MaxObjectCount"}, pullInstancePaths},
    {"CloseEnumeration", Access::read, {"EnumerationContext"}, closeEnumeration},
    {"EnumerationCount", Access::read, {"EnumerationContext"}, enumerationCount},
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
    {"GetQualifier", Access::read, {"QualifierName"}, getQualifier},
    {"EnumerateQualifiers", Access::read, {}, enumerateQualifiers},
};

/** The arguments in the order of the method's parameters. A null argument is left out, as if it were not given. */
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

/** Calls a method of a class. @return a text on the outcome beyond the return value. */
std::string callMethod(const Operation& operation) {
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
    MethodOutcome outcome = operation.dispatcher.callMethod(operation.invocation(), path, method->name, arguments);
    operation.writer.returnValue(outcome.result.returnValue);
    for (const NamedValue& argument : outcome.result.outArguments) {
        operation.writer.parameter(argument);
    }
    return std::move(outcome.remark);
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
                           (caller.mayRead ? " may read, but not change anything" : " has no rights on this server"));
    }
}

} // namespace

Invocation Operation::invocation() const {
    return {.principal = caller.user, .address = caller.address, .meter = &stream};
}

std::string perform(const Operation& operation) {
    requireAccess(operation.caller, Access::read);
    const Message& message = operation.message;
    if (!message.isIntrinsic()) {
        requireAccess(operation.caller, Access::change);
        operation.dispatcher.registry().requireNameSpace(message.nameSpace());
        return callMethod(operation);
    }
    const IntrinsicMethod& method = intrinsicMethod(message.method());
    requireAccess(operation.caller, method.access);
    operation.dispatcher.registry().requireNameSpace(message.nameSpace());
    method.answer({operation, Parameters(message, operation.catalogue, method.parameters)});
    return {};
}

} // namespace ObjectManager::CimXml

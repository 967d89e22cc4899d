#include "cimxml/PullOperations.h"

#include "cimxml/StatusCodes.h"

#include <chrono>
#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace ObjectManager::CimXml {

namespace {

EnumerationOwner ownerOf(const Call& call) {
    return {call.operation.caller.user, call.nameSpace()};
}

/** Throws if the client asks for a filter, which DSP0200 lets a server refuse. */
void requireUnfiltered(const Call& call) {
    if (!call.parameters.optionalText("FilterQueryLanguage").empty() ||
        !call.parameters.optionalText("FilterQuery").empty()) {
        throw CimError(filteredEnumerationNotSupported,
                       "found FilterQueryLanguage or FilterQuery, expected neither: enumerations are not filtered");
    }
}

/** Throws if the client wants the enumeration to go on after an error. */
void requireEndAtError(const Call& call) {
    if (call.parameters.flag("ContinueOnError", false)) {
        throw CimError(continuationOnErrorNotSupported,
                       "found ContinueOnError, expected FALSE: an enumeration ends with the first error");
    }
}

/** The time after which the enumeration is closed unless the client pulls: the one it asks for, or the server's. */
std::chrono::milliseconds timeOf(const Call& call) {
    const std::chrono::milliseconds longest = call.operation.enumerations.limits().time;
    const auto asked = call.parameters.optionalNumber("OperationTimeout");
    if (!asked) {
        return longest;
    }
    const std::chrono::seconds time(*asked);
    if (*asked == 0 || time > longest) {
        throw CimError(invalidOperationTimeout,
                       "found the OperationTimeout " + std::to_string(*asked) + ", expected 1 to " +
                           std::to_string(std::chrono::floor<std::chrono::seconds>(longest).count()) + " seconds");
    }
    return time;
}

/** Writes what follows the objects in the replies of open and pull operations. */
void writeState(const Call& call, const std::string& context, bool end) {
    call.writer().raw("</IRETURNVALUE>\n");
    call.writer().parameter({"EnumerationContext", stringValue(context)});
    call.writer().parameter({"EndOfSequence", booleanValue(end)});
}

/**
 * An enumeration that is being opened: the reply has its first objects, the others are kept. The reply is not begun
 * before it is certain that the limits allow to keep them: otherwise the reply is an error.
 */
class Opening {
public:
    Opening(const Call& call, Pulled kind)
        : _call(call), _kind(kind), _atOnce(call.parameters.optionalNumber("MaxObjectCount").value_or(0)),
          _time(timeOf(call)), _first(call.writer().another()), _rest(call.writer().another()) {
        if (kind != Pulled::instances) {
            requireUnfiltered(call);
        }
        requireEndAtError(call);
    }

    /** Adds an object. @param write the writer's function for it. */
    template <typename Object, typename... Given>
    void add(void (ResponseWriter::*write)(const Object&, const Given&...), const Object& object,
             const Given&... given) {
        if (_given < _atOnce) {
            (_first.*write)(object, given...);
            ++_given;
        } else {
            (_rest.*write)(object, given...);
            _ends.push_back(_rest.size());
            _call.operation.enumerations.requireRoom(_rest.size() + _ends.size() * ObjectTexts::bytesOfEnd);
        }
        _call.operation.stream.holdText(_first.size() + _rest.size());
    }

    /** Opens the enumeration, and writes the reply. Called after the last object was added. */
    void finish() {
        std::string context;
        if (!_ends.empty()) {
            context = _call.operation.enumerations.open(ownerOf(_call), _kind, {_rest.take(), std::move(_ends)}, _given,
                                                        _time);
        }
        _call.writer().raw("<IRETURNVALUE>\n");
        _call.writer().objects(_first.take());
        writeState(_call, context, context.empty());
    }

private:
    const Call& _call;
    Pulled _kind;
    /** How many objects the reply may have. */
    std::size_t _atOnce;
    std::chrono::milliseconds _time;
    std::size_t _given = 0;
    ResponseWriter _first;
    ResponseWriter _rest;
    /** The position in `_rest` at which each of its objects ends. */
    std::vector<std::size_t> _ends;
};

ObjectPath sourceOf(const Call& call) {
    return call.parameters.instanceName("InstanceName");
}

void pull(const Call& call, Pulled kind) {
    const std::string context = call.parameters.text("EnumerationContext");
    const std::size_t count = call.parameters.number("MaxObjectCount");
    call.writer().raw("<IRETURNVALUE>\n");
    const bool end =
        call.operation.enumerations.pull(ownerOf(call), context, kind, count, [&](std::string_view objects) {
            call.operation.stream.holdText(objects.size());
            call.writer().objects(objects);
        });
    writeState(call, end ? std::string() : context, end);
}

} // namespace

void openEnumerateInstances(const Call& call) {
    const Selection selection = selectionOfEnumeration(call);
    Opening opening(call, Pulled::instancesWithPath);
    forEachInstance(call, call.parameters.className("ClassName"), selection.properties,
                    [&](Instance&& instance) { opening.add(&ResponseWriter::instanceWithPath, instance, selection); });
    opening.finish();
}

void openEnumerateInstancePaths(const Call& call) {
    Opening opening(call, Pulled::instancePaths);
    forEachInstanceName(call, [&](ObjectPath&& path) { opening.add(&ResponseWriter::instancePath, path); });
    opening.finish();
}

void openAssociatorInstances(const Call& call) {
    const Selection selection = selectionOfInstances(call);
    Opening opening(call, Pulled::instancesWithPath);
    for (const auto& [associationClass, instances] : call.dispatcher().associators(
             call.invocation(), sourceOf(call), associatorFilter(call), selection.properties)) {
        for (const Instance& instance : instances) {
            opening.add(&ResponseWriter::instanceWithPath, instance, selection);
        }
    }
    opening.finish();
}

void openAssociatorInstancePaths(const Call& call) {
    Opening opening(call, Pulled::instancePaths);
    for (const auto& [associationClass, paths] :
         call.dispatcher().associatorNames(call.invocation(), sourceOf(call), associatorFilter(call))) {
        for (const ObjectPath& path : paths) {
            opening.add(&ResponseWriter::instancePath, path);
        }
    }
    opening.finish();
}

void openReferenceInstances(const Call& call) {
    const Selection selection = selectionOfInstances(call);
    Opening opening(call, Pulled::instancesWithPath);
    for (const Instance& instance : referencesOf(call, sourceOf(call))) {
        opening.add(&ResponseWriter::instanceWithPath, instance, selection);
    }
    opening.finish();
}

void openReferenceInstancePaths(const Call& call) {
    Opening opening(call, Pulled::instancePaths);
    for (const ObjectPath& path :
         call.dispatcher().referenceNames(call.invocation(), sourceOf(call), referenceFilter(call))) {
        opening.add(&ResponseWriter::instancePath, path);
    }
    opening.finish();
}

void openQueryInstances(const Call& call) {
    const Query query = parseQuery(call.parameters.text("FilterQuery"), call.parameters.text("FilterQueryLanguage"));
    if (call.parameters.flag("ReturnQueryResultClass", false)) {
        throw CimError(CMPI_RC_ERR_NOT_SUPPORTED,
                       "found ReturnQueryResultClass, expected FALSE: the result has instances "
                       "of the class " +
                           query.className);
    }
    Selection selection;
    selection.properties = query.properties;
    Opening opening(call, Pulled::instances);
    forEachMatch(call, query,
                 [&](Instance&& instance) { opening.add(&ResponseWriter::instance, instance, selection); });
    opening.finish();
}

void pullInstances(const Call& call) {
    pull(call, Pulled::instances);
}

void pullInstancesWithPath(const Call& call) {
    pull(call, Pulled::instancesWithPath);
}

void pullInstancePaths(const Call& call) {
    pull(call, Pulled::instancePaths);
}

void closeEnumeration(const Call& call) {
    call.operation.enumerations.close(ownerOf(call), call.parameters.text("EnumerationContext"));
}

void enumerationCount(const Call& call) {
    const std::uint64_t count =
        call.operation.enumerations.count(ownerOf(call), call.parameters.text("EnumerationContext"));
    call.writer().raw("<IRETURNVALUE>");
    call.writer().value(unsignedValue(CMPI_uint64, count));
    call.writer().raw("</IRETURNVALUE>\n");
}

} // namespace ObjectManager::CimXml

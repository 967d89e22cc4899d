#include "cimxml/PullOperations.h"

#include "cimxml/StatusCodes.h"

#include <chrono>
#include <cstddef>
#include <string>
#include <utility>

namespace ObjectManager::CimXml {

namespace {

EnumerationOwner ownerOf(const Call& call) {
    return {call.operation.caller.user, call.nameSpace()};
}

/** Throws where the client asks for what DSP0200 lets a server refuse. */
void requireUnfiltered(const Call& call) {
    if (!call.parameters.optionalText("FilterQueryLanguage").empty() ||
        !call.parameters.optionalText("FilterQuery").empty()) {
        throw CimError(filteredEnumerationNotSupported,
                       "found a FilterQuery, expected none: enumerations are not filtered");
    }
}

/** Throws where the client wants an enumeration to go on behind a failure. */
void requireEndAtError(const Call& call) {
    if (call.parameters.flag("ContinueOnError", false)) {
        throw CimError(continuationOnErrorNotSupported,
                       "found ContinueOnError, expected FALSE: an enumeration ends where it fails");
    }
}

/** After which the enumeration is closed unless the client pulls: what it asks for, within the server's limit. */
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

/** Writes what stands behind the objects in the answers to Open and Pull. */
void writeState(const Call& call, const std::string& context, bool end) {
    call.writer().raw("</IRETURNVALUE>\n");
    call.writer().parameter({"EnumerationContext", stringValue(context)});
    call.writer().parameter({"EndOfSequence", booleanValue(end)});
}

/** An enumeration that is being opened: the first objects are the answer, the others are kept. */
class Opening {
public:
    Opening(const Call& call, Pulled kind)
        : _call(call), _kind(kind), _atOnce(call.parameters.optionalNumber("MaxObjectCount").value_or(0)),
          _time(timeOf(call)) {
        if (kind != Pulled::instances) {
            requireUnfiltered(call);
        }
        requireEndAtError(call);
        call.writer().raw("<IRETURNVALUE>\n");
        _rest = call.writer().size();
    }

    /** To be called when an object has been written. */
    void written() {
        const std::size_t size = _call.writer().size();
        if (_given < _atOnce) {
            ++_given;
            _rest = size;
            return;
        }
        _objects.ends.push_back(size - _rest);
        _call.operation.enumerations.requireRoom(size - _rest + _objects.bytes());
    }

    /** To be called when all objects have been written. */
    void finish() {
        std::string context;
        if (!_objects.ends.empty()) {
            _objects.text = _call.writer().written().substr(_rest);
            _call.writer().truncate(_rest);
            context = _call.operation.enumerations.open(ownerOf(_call), _kind, std::move(_objects), _given, _time);
        }
        writeState(_call, context, context.empty());
    }

private:
    const Call& _call;
    Pulled _kind;
    /** How many objects the answer may have. */
    std::size_t _atOnce;
    std::chrono::milliseconds _time;
    std::size_t _given = 0;
    /** Where in the answer begins what is kept. */
    std::size_t _rest = 0;
    ObjectTexts _objects;
};

ObjectPath sourceOf(const Call& call) {
    return call.parameters.instanceName("InstanceName");
}

void pull(const Call& call, Pulled kind) {
    const std::string context = call.parameters.text("EnumerationContext");
    const std::size_t count = call.parameters.number("MaxObjectCount");
    call.writer().raw("<IRETURNVALUE>\n");
    const bool end = call.operation.enumerations.pull(ownerOf(call), context, kind, count,
                                                      [&](std::string_view objects) { call.writer().raw(objects); });
    writeState(call, end ? std::string() : context, end);
}

} // namespace

void openEnumerateInstances(const Call& call) {
    const Selection selection = selectionOfEnumeration(call);
    Opening opening(call, Pulled::instancesWithPath);
    forEachInstance(call, call.parameters.className("ClassName"), selection.properties, [&](Instance&& instance) {
        call.writer().instanceWithPath(instance, selection);
        opening.written();
    });
    opening.finish();
}

void openEnumerateInstancePaths(const Call& call) {
    Opening opening(call, Pulled::instancePaths);
    forEachInstanceName(call, [&](ObjectPath&& path) {
        call.writer().instancePath(path);
        opening.written();
    });
    opening.finish();
}

void openAssociatorInstances(const Call& call) {
    const Selection selection = selectionOfInstances(call);
    Opening opening(call, Pulled::instancesWithPath);
    for (const auto& [associationClass, instances] : call.dispatcher().associators(
             call.invocation(), sourceOf(call), associatorFilter(call), selection.properties)) {
        for (const Instance& instance : instances) {
            call.writer().instanceWithPath(instance, selection);
            opening.written();
        }
    }
    opening.finish();
}

void openAssociatorInstancePaths(const Call& call) {
    Opening opening(call, Pulled::instancePaths);
    for (const auto& [associationClass, paths] :
         call.dispatcher().associatorNames(call.invocation(), sourceOf(call), associatorFilter(call))) {
        for (const ObjectPath& path : paths) {
            call.writer().instancePath(path);
            opening.written();
        }
    }
    opening.finish();
}

void openReferenceInstances(const Call& call) {
    const Selection selection = selectionOfInstances(call);
    Opening opening(call, Pulled::instancesWithPath);
    for (const Instance& instance : referencesOf(call, sourceOf(call))) {
        call.writer().instanceWithPath(instance, selection);
        opening.written();
    }
    opening.finish();
}

void openReferenceInstancePaths(const Call& call) {
    Opening opening(call, Pulled::instancePaths);
    for (const ObjectPath& path :
         call.dispatcher().referenceNames(call.invocation(), sourceOf(call), referenceFilter(call))) {
        call.writer().instancePath(path);
        opening.written();
    }
    opening.finish();
}

void openQueryInstances(const Call& call) {
    const Query query = parseQuery(call.parameters.text("FilterQuery"), call.parameters.text("FilterQueryLanguage"));
    if (call.parameters.flag("ReturnQueryResultClass", false)) {
        throw CimError(CMPI_RC_ERR_NOT_SUPPORTED, "found ReturnQueryResultClass, expected FALSE: the class of what is "
                                                  "found is " +
                                                      query.className);
    }
    Selection selection;
    selection.properties = query.properties;
    Opening opening(call, Pulled::instances);
    forEachMatch(call, query, [&](Instance&& instance) {
        call.writer().instance(instance, selection);
        opening.written();
    });
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

#include "broker/Objects.h"

namespace ObjectManager {

namespace {

thread_local Request* currentRequest = nullptr;

} // namespace

Request::Request(const Broker& broker, MemoryMeter* meter)
    : _broker(broker), _outer(currentRequest), _depth(_outer != nullptr ? _outer->_depth + 1 : 1), _meter(meter),
      _arena(broker.limits().bytes, meter) {
    currentRequest = this;
}

Request::~Request() {
    currentRequest = _outer;
    while (_buried != nullptr) {
        ObjectHeader& clone = *_buried;
        _buried = clone.previous;
        deleteShell(clone);
    }
}

Request* Request::current() {
    return currentRequest;
}

CMPIObjectPath* Request::objectPath(const ObjectPath& path) {
    return newObjectOf<CMPIObjectPath>(*this, fromModel(_arena, path));
}

CMPIInstance* Request::instance(const Instance& instance) {
    return newObjectOf<CMPIInstance>(*this, fromModel(_arena, instance));
}

CMPIArgs* Request::arguments(const std::vector<NamedValue>& arguments) {
    return newObjectOf<CMPIArgs>(*this, {fromModel(_arena, arguments)});
}

CMPIContext* Request::context(const std::vector<NamedValue>& entries) {
    return newObjectOf<CMPIContext>(*this, {fromModel(_arena, entries)});
}

const char** Request::propertyList(const PropertyList& properties) {
    if (!properties) {
        return nullptr;
    }
    const std::size_t bytes = (properties->size() + 1) * sizeof(const char*);
    auto* names = static_cast<const char**>(_arena.allocate(bytes, alignof(const char*)));
    const char** last = std::transform(properties->begin(), properties->end(), names,
                                       [this](const std::string& name) { return copyText(_arena, name); });
    *last = nullptr;
    return names;
}

std::string Request::excess() const {
    const RequestLimits& limits = _broker.limits();
    if (_objects > limits.objects) {
        return "returned more than " + std::to_string(limits.objects) + " objects, which one request may have at most";
    }
    if (_arena.isExhausted()) {
        return "needed more than " + std::to_string(limits.bytes) + " bytes, which one request may have at most";
    }
    return "";
}

bool Request::countObject() {
    // The count stops at the limit and one, which stands for every greater number.
    if (_objects <= _broker.limits().objects) {
        ++_objects;
    }
    return _objects <= _broker.limits().objects;
}

void Request::reportMisuse(std::string_view what) {
    if (_misuse.empty()) {
        _misuse = what;
    }
}

void Request::adopt(ObjectHeader& object) {
    object.previous = _newest;
    _newest = &object;
}

void Request::bury(ObjectHeader& clone) {
    clone.previous = _buried;
    _buried = &clone;
}

} // namespace ObjectManager

/** The scope of one request to a provider: the CMPI objects that are made during a request end with it. */
#ifndef BROKER_REQUEST_H
#define BROKER_REQUEST_H

#include "broker/Arena.h"
#include "broker/Broker.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager {

struct ObjectHeader;

/**
 * A request is the current one of the thread that constructs it, until the same thread destroys it. Requests nest: the
 * innermost request of a thread is the current one. The CMPI objects that are made in a thread belong to its current
 * request. A released object keeps its shell until the request ends: a later use of the object is noticed, and touches
 * no memory that was given back.
 */
class Request {
public:
    /**
     * @param broker must outlive the request; its limits hold for the request.
     * @param meter counts the memory of the request. May be null; must outlive the request.
     */
    explicit Request(const Broker& broker, MemoryMeter* meter = nullptr);
    Request(const Request&) = delete;
    Request& operator=(const Request&) = delete;
    ~Request();

    /** The current request of the calling thread; null if it has none. */
    static Request* current();

    const Broker& broker() const { return _broker; }
    /** How deep the request is nested: 1 if it is the thread's outermost one. */
    unsigned int depth() const { return _depth; }
    /** May be null. */
    MemoryMeter* meter() const { return _meter; }

    /* These make CMPI objects of this request from values. They throw what the request's memory throws. */

    CMPIObjectPath* objectPath(const ObjectPath& path);
    CMPIInstance* instance(const Instance& instance);
    CMPIArgs* arguments(const std::vector<NamedValue>& arguments);
    CMPIContext* context(const std::vector<NamedValue>& entries);
    /** The names, with a null pointer behind the last one; a null pointer if the list means all properties. */
    const char** propertyList(const PropertyList& properties);

    /**
     * The limit that the request has exceeded, as the end of a sentence that begins with the provider's name; empty if
     * it has exceeded none.
     */
    std::string excess() const;
    /** Counts an object that the provider returns. @return whether the limit permits it. */
    bool countObject();

    /**
     * The first breach of CMPI's rules by the provider, as the end of a sentence that begins with the provider's name
     * ("released a CMPIString twice"); empty if there was none.
     */
    const std::string& misuse() const { return _misuse; }
    /** Keeps `what`, a breach of the rules, for `misuse`, if it is the first one. */
    void reportMisuse(std::string_view what);

    /* Only the broker calls the following functions. */

    /** The memory in which the request's objects lie. */
    std::pmr::memory_resource& memory() { return _arena; }
    /** Makes an object in this memory one of the request. */
    void adopt(ObjectHeader& object);
    /** Takes over the shell of a released clone, and deletes it when the request ends. */
    void bury(ObjectHeader& clone);
    /** The object that was adopted last; null if there is none. */
    ObjectHeader* newest() const { return _newest; }

private:
    const Broker& _broker;
    Request* _outer;
    unsigned int _depth;
    MemoryMeter* _meter;
    Arena _arena;
    ObjectHeader* _newest = nullptr;
    /** The clone that was buried last; null if there is none. */
    ObjectHeader* _buried = nullptr;
    std::string _misuse;
    /** How many objects the provider has returned; it does not grow further beyond the limit. */
    std::size_t _objects = 0;
};

/** The arguments that a CMPI object holds, as values; none if the object is null or was released. */
std::vector<NamedValue> argumentsOf(const CMPIArgs* arguments);

/** The text of a CMPI string; empty if the object is null or was released. */
std::string textOf(const CMPIString* string);

} // namespace ObjectManager

#endif

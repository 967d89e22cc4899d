/** The scope of one request to a provider: every CMPI object that is made while it runs ends with it. */
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
 * From its construction to its destruction, by the same thread, a request is this thread's current one; requests nest.
 * CMPI objects made on the thread belong to the current request. A released object keeps its shell until the request
 * ends, so that using it again is noticed and touches nothing that is gone.
 */
class Request {
public:
    /** @param meter is told of the memory of the request; may be null, outlives the request. */
    explicit Request(const Broker& broker, MemoryMeter* meter = nullptr);
    Request(const Request&) = delete;
    Request& operator=(const Request&) = delete;
    ~Request();

    /** The calling thread's innermost request, or null. */
    static Request* current();

    const Broker& broker() const { return _broker; }
    /** 1 for a request that is not nested in another. */
    unsigned int depth() const { return _depth; }
    /** May be null. */
    MemoryMeter* meter() const { return _meter; }

    /* CMPI objects of this request, made of values. */

    CMPIObjectPath* objectPath(const ObjectPath& path);
    CMPIInstance* instance(const Instance& instance);
    CMPIArgs* arguments(const std::vector<NamedValue>& arguments);
    CMPIContext* context(const std::vector<NamedValue>& entries);
    /** Ended by a null; null itself where the list means all properties. */
    const char** propertyList(const PropertyList& properties);

    /**
     * Which limit the request has exceeded, as the end of a sentence that begins with the provider's name; empty if it
     * has exceeded none.
     */
    std::string excess() const;
    /** Counts an object that the provider returns. @return whether there may be one more. */
    bool countObject();

    /**
     * What the provider first did against the rules of the interface, as the end of a sentence that begins with its
     * name ("released a CMPIString twice"); empty as long as it did nothing.
     */
    const std::string& misuse() const { return _misuse; }
    /** Remembers `what` where it is the first. */
    void reportMisuse(std::string_view what);

    /* For the broker's own objects. */

    std::pmr::memory_resource& memory() { return _arena; }
    void adopt(ObjectHeader& object);
    /** Keeps the shell of a released clone until the request ends. */
    void bury(ObjectHeader& clone);
    /** The object made last, null where there is none. */
    ObjectHeader* newest() const { return _newest; }

private:
    const Broker& _broker;
    Request* _outer;
    unsigned int _depth;
    MemoryMeter* _meter;
    Arena _arena;
    ObjectHeader* _newest = nullptr;
    ObjectHeader* _buried = nullptr;
    std::string _misuse;
    std::size_t _objects = 0;
};

/** The arguments that a CMPI object holds, as values; none where it holds nothing. */
std::vector<NamedValue> argumentsOf(const CMPIArgs* arguments);

/** The text of a CMPI string; empty where it holds nothing. */
std::string textOf(const CMPIString* string);

} // namespace ObjectManager

#endif

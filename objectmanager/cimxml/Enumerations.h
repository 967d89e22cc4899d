/** Enumerations that clients have opened and pull from, a part at a time (the pull operations of DSP0200). */
#ifndef CIMXML_ENUMERATIONS_H
#define CIMXML_ENUMERATIONS_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

namespace ObjectManager::CimXml {

/** What clients may leave with the server. One user may have half of the enumerations and half of the bytes. */
struct EnumerationLimits {
    /** Enumerations that are open at a time. */
    std::size_t count = 200;
    /** Bytes of what all of them hold. */
    std::size_t bytes = std::size_t{64} * 1024 * 1024;
    /** After which an enumeration that nobody pulls from is closed. Clients may ask for less. */
    std::chrono::milliseconds time = std::chrono::seconds{60};
};

/** What an enumeration gives; each has a pull operation of its own. */
enum class Pulled { instancesWithPath, instancePaths, instances };

/** Who opened an enumeration, and where. Nobody else can pull from it or close it. */
struct EnumerationOwner {
    std::string user;
    std::string nameSpace;
};

/** Objects in the form in which they are sent, one behind the other. */
struct ObjectTexts {
    std::string text;
    /** Where each object ends. */
    std::vector<std::size_t> ends;

    /** How much of an enumeration's limit the end of an object takes: the same on all machines. */
    static constexpr std::size_t bytesOfEnd = 8;

    /** How much of an enumeration's limit they take. */
    std::size_t bytes() const { return text.size() + ends.size() * bytesOfEnd; }
};

/**
 * The open enumerations of a server. All functions may be called by several threads at once, and those that name a
 * context throw CimError with the code CIM_ERR_INVALID_ENUMERATION_CONTEXT where the owner has no such enumeration
 * open: it was never opened, belongs to somebody else, was closed or pulled to its end, or its time ran out.
 */
class Enumerations {
public:
    using TimePoint = std::chrono::steady_clock::time_point;
    using Clock = std::function<TimePoint()>;
    /** Makes the names of enumerations, which clients get as EnumerationContext. */
    using NewContext = std::function<std::string()>;

    Enumerations(const EnumerationLimits& limits, Clock clock, NewContext newContext)
        : _limits(limits), _clock(std::move(clock)), _newContext(std::move(newContext)) {}

    const EnumerationLimits& limits() const { return _limits; }

    /**
     * Throws CimError with the code CIM_ERR_SERVER_LIMITS_EXCEEDED where so many bytes are more than one user may leave
     * with the server.
     */
    void requireRoom(std::size_t bytes) const;

    /**
     * Keeps what is left of an enumeration.
     *
     * @param given how many objects the client got already.
     * @param time after which it is closed unless the client pulls before.
     * @return its context.
     * @throws CimError with the code CIM_ERR_SERVER_LIMITS_EXCEEDED where there is no room for it.
     */
    std::string open(const EnumerationOwner& owner, Pulled kind, ObjectTexts rest, std::size_t given,
                     std::chrono::milliseconds time);

    /**
     * Calls `take` with the next objects, as many as `count` at most, when it has closed the enumeration if there are
     * no more. What `take` throws changes nothing in that.
     *
     * @param kind an enumeration that gives something else is not found.
     * @return whether there are no more.
     */
    bool pull(const EnumerationOwner& owner, const std::string& context, Pulled kind, std::size_t count,
              const std::function<void(std::string_view objects)>& take);

    void close(const EnumerationOwner& owner, const std::string& context);

    /** How many objects the enumeration gives altogether, pulled or not. */
    std::uint64_t count(const EnumerationOwner& owner, const std::string& context);

    /** Closes those whose time has run out. Every other function does so, too. */
    void closeExpired();

private:
    struct Enumeration {
        EnumerationOwner owner;
        Pulled kind;
        std::shared_ptr<const ObjectTexts> objects;
        std::size_t givenBefore;
        /** The index of the next object in `objects`. */
        std::size_t next;
        std::chrono::milliseconds time;
        TimePoint expires;
    };
    using Map = std::map<std::string, Enumeration>;

    /* With the lock held. */
    void dropExpired();
    Map::iterator find(const EnumerationOwner& owner, const std::string& context);

    const EnumerationLimits _limits;
    const Clock _clock;
    const NewContext _newContext;
    std::mutex _mutex;
    Map _open;
};

/** A name that nobody guesses. */
std::string randomContext();

} // namespace ObjectManager::CimXml

#endif

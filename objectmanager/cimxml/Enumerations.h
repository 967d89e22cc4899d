/** Enumerations that clients have opened, and whose objects they pull part by part (pull operations of DSP0200). */
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

/** Limits for all open enumerations together. One user may have half of the enumerations and half of the bytes. */
struct EnumerationLimits {
    /** How many enumerations may be open at a time. */
    std::size_t count = 200;
    /** How many bytes the objects that are still to be pulled may have. */
    std::size_t bytes = std::size_t{64} * 1024 * 1024;
    /** The time after which an enumeration that nobody pulls from is closed. Clients may ask for a shorter one. */
    std::chrono::milliseconds time = std::chrono::seconds{60};
};

/** The kind of objects in an enumeration. Each kind has its own pull operation. */
enum class Pulled { instancesWithPath, instancePaths, instances };

/** The user who opened an enumeration, and its namespace. Nobody else can pull from the enumeration or close it. */
struct EnumerationOwner {
    std::string user;
    std::string nameSpace;
};

/** Objects in the form in which they are sent, one after the other. */
struct ObjectTexts {
    std::string text;
    /** The position in the text at which each object ends. */
    std::vector<std::size_t> ends;

    /** How many bytes the end of one object counts against the limits: the same number on all machines. */
    static constexpr std::size_t bytesOfEnd = 8;

    /** How many bytes all objects count against the limits. */
    std::size_t bytes() const { return text.size() + ends.size() * bytesOfEnd; }
};

/**
 * The open enumerations of a server. Used by several threads at once.
 *
 * A function that takes a context throws CimError with the code CIM_ERR_INVALID_ENUMERATION_CONTEXT if the owner has no
 * open enumeration of that context: it was never opened, belongs to somebody else, was closed or pulled to its end, or
 * its time is over.
 */
class Enumerations {
public:
    using TimePoint = std::chrono::steady_clock::time_point;
    using Clock = std::function<TimePoint()>;
    /** Makes the context of an enumeration: a name, which the client gets as EnumerationContext. */
    using NewContext = std::function<std::string()>;

    Enumerations(const EnumerationLimits& limits, Clock clock, NewContext newContext)
        : _limits(limits), _clock(std::move(clock)), _newContext(std::move(newContext)) {}

    const EnumerationLimits& limits() const { return _limits; }

    /**
     * Throws CimError with the code CIM_ERR_SERVER_LIMITS_EXCEEDED if the enumerations of one user may not have `bytes`
     * bytes.
     */
    void requireRoom(std::size_t bytes) const;

    /**
     * Keeps the objects of an enumeration that the client has still to pull.
     *
     * @param given how many objects the client got when it opened the enumeration.
     * @param time after which the enumeration is closed unless the client pulls from it.
     * @return the enumeration's context.
     * @throws CimError with the code CIM_ERR_SERVER_LIMITS_EXCEEDED if the limits leave no room for the enumeration.
     */
    std::string open(const EnumerationOwner& owner, Pulled kind, ObjectTexts rest, std::size_t given,
                     std::chrono::milliseconds time);

    /**
     * Takes the next objects out of the enumeration, at most `count`, and then calls `take` with them. If these are the
     * last objects, the enumeration is closed before `take` is called. An exception of `take` undoes none of that.
     *
     * @param kind the kind of objects that the client asks for; throws if the enumeration has another kind.
     * @return whether these were the last objects.
     */
    bool pull(const EnumerationOwner& owner, const std::string& context, Pulled kind, std::size_t count,
              const std::function<void(std::string_view objects)>& take);

    void close(const EnumerationOwner& owner, const std::string& context);

    /** How many objects the enumeration has altogether, pulled or not. */
    std::uint64_t count(const EnumerationOwner& owner, const std::string& context);

    /** Closes the enumerations whose time is over. Every other function does so, too. */
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

    /* Called with the lock held. */
    void dropExpired();
    Map::iterator find(const EnumerationOwner& owner, const std::string& context);

    const EnumerationLimits _limits;
    const Clock _clock;
    const NewContext _newContext;
    std::mutex _mutex;
    Map _open;
};

/** Makes a context that nobody can guess. */
std::string randomContext();

} // namespace ObjectManager::CimXml

#endif

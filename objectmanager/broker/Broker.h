/**
 * The CMPI broker: the function tables through which providers reach the object manager.
 *
 * Every slot is there; what is not supported answers CMPI_RC_ERR_NOT_SUPPORTED. Slots may be called from any thread,
 * but objects are made only where the calling thread has a current Request.
 */
#ifndef BROKER_BROKER_H
#define BROKER_BROKER_H

#include "model/ClassInformation.h"
#include "model/Operations.h"

#include "cmpift.h"

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>

namespace ObjectManager {

/** What a provider, or the broker about a provider, had to say. */
struct BrokerMessage {
    enum class Kind { log, trace };

    Kind kind = Kind::log;
    /** A CMPISeverity of a log message, a CMPILevel of a trace. */
    int level = 0;
    /** The identifier of a log message, the component of a trace. */
    std::string source;
    std::string text;
};

/** How much one request to a provider may take. */
struct RequestLimits {
    /** Instances, object paths and values that the provider returns. */
    std::size_t objects = 100'000;
    /** Memory of all CMPI objects of the request, those that are returned among them. */
    std::size_t bytes = std::size_t{192} * 1024 * 1024;
};

/** Called from any thread; must not throw. */
using MessageSink = std::function<void(const BrokerMessage&)>;

class Broker {
public:
    /** How deep up-calls may nest: a provider that asks for itself ends here. */
    static constexpr unsigned int maximumDepth = 16;

    /**
     * `upCalls` answers the providers' own requests and `classes` their questions about classes; both may be null and
     * outlive the broker. Messages of providers go to standard error until another sink is set.
     */
    explicit Broker(Operations* upCalls = nullptr, const ClassInformation* classes = nullptr);
    Broker(const Broker&) = delete;
    Broker& operator=(const Broker&) = delete;
    ~Broker() = default;

    /** Not to be called while providers run. */
    void setMessageSink(MessageSink sink) { _sink = std::move(sink); }

    /** What providers are given. Lives as long as this object. */
    const CMPIBroker* handle() const { return &_handle; }

    Operations* upCalls() const { return _upCalls; }
    const ClassInformation* classes() const { return _classes; }

    /** Holds for the requests that begin from now on. Not to be called while there are any. */
    void setLimits(const RequestLimits& limits) { _limits = limits; }
    const RequestLimits& limits() const { return _limits; }

    void message(const BrokerMessage& message) const { _sink(message); }

private:
    CMPIBroker _handle;
    Operations* _upCalls;
    const ClassInformation* _classes;
    RequestLimits _limits;
    MessageSink _sink;
};

} // namespace ObjectManager

#endif

/**
 * The CMPI broker: the function tables through which providers reach the object manager.
 *
 * No slot is null: the slot of a function that is not supported reports CMPI_RC_ERR_NOT_SUPPORTED. Slots may be called
 * in any thread, but a slot makes an object only if the calling thread has a current Request; otherwise it reports
 * CMPI_RC_ERR_FAILED.
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

/** A message of a provider, or a message of the broker about a provider. */
struct BrokerMessage {
    enum class Kind { log, trace };

    Kind kind = Kind::log;
    /** The CMPISeverity of a log message, or the CMPILevel of a trace. */
    int level = 0;
    /** The identifier of a log message, or the component of a trace; may be empty. */
    std::string source;
    std::string text;
};

/** The limits of one request to a provider; `Request::excess` tells whether it has exceeded them. */
struct RequestLimits {
    /** How many instances, object paths and values the provider may return. */
    std::size_t objects = 100'000;
    /** How many bytes of memory the request may have for its CMPI objects, the returned ones included. */
    std::size_t bytes = std::size_t{192} * 1024 * 1024;
};

/** Called with each message, from several threads at once. Must not throw. */
using MessageSink = std::function<void(const BrokerMessage&)>;

/** The broker that providers are given. */
class Broker {
public:
    /**
     * How deep the requests of a thread may nest. This limit ends the recursion of providers whose up-calls lead back
     * to themselves.
     */
    static constexpr unsigned int maximumDepth = 16;

    /**
     * Messages of providers go to standard error until another sink is set.
     *
     * @param upCalls serves the operations for which providers ask; if it is null, they are not supported. Must outlive
     *        the broker.
     * @param classes answers questions about classes; if it is null, no class is known. Must outlive the broker.
     */
    explicit Broker(Operations* upCalls = nullptr, const ClassInformation* classes = nullptr);
    Broker(const Broker&) = delete;
    Broker& operator=(const Broker&) = delete;
    ~Broker() = default;

    /** Must not be called while providers run. */
    void setMessageSink(MessageSink sink) { _sink = std::move(sink); }

    /** The broker in the form in which providers get it. It lives as long as this object. */
    const CMPIBroker* handle() const { return &_handle; }

    /** May be null. */
    Operations* upCalls() const { return _upCalls; }
    /** May be null. */
    const ClassInformation* classes() const { return _classes; }

    /** Sets the limits of the requests that begin from now on. Must not be called while there are requests. */
    void setLimits(const RequestLimits& limits) { _limits = limits; }
    const RequestLimits& limits() const { return _limits; }

    /** Passes a message to the sink. */
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

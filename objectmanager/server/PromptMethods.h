/** Which requests are answered where they are read, without handing them to a worker. */
#ifndef SERVER_PROMPTMETHODS_H
#define SERVER_PROMPTMETHODS_H

#include "server/HttpMessage.h"

#include <atomic>
#include <chrono>
#include <deque>
#include <string>
#include <utility>
#include <vector>

namespace ObjectManager::Server {

/**
 * Handing a request that takes less than a moment to a worker and back costs a third of it. But whoever reads one
 * client's requests reads others' as well, and keeps them waiting for as long as it answers this one. So it does that
 * only for methods whose answers wait for nothing but the processor, as long as none of their answers has taken much of
 * it recently: clients that alternate quick and slow requests of one method find a worker for each.
 *
 * Used by several threads at once.
 */
class PromptMethods {
public:
    using Clock = std::chrono::steady_clock;

    /** More processor time is much. */
    static constexpr std::chrono::microseconds limit{500};
    /** For how long a method is handed to workers after one of its answers took much. */
    static constexpr std::chrono::minutes pause{1};

    class Method {
    public:
        explicit Method(std::string name) : _name(std::move(name)) {}

        const std::string& name() const { return _name; }
        /** Not before the method has been quick once. */
        bool isPrompt(Clock::time_point now) const;
        /** @param processorTime what an answer to a request of the method took. */
        void took(Clock::duration processorTime, Clock::time_point now);

    private:
        std::string _name;
        /** From when on it is prompt. */
        std::atomic<Clock::time_point> _start = Clock::time_point::max();
    };

    /** @param names as in the header CIMMethod. */
    explicit PromptMethods(const std::vector<std::string>& names) : _methods(names.begin(), names.end()) {}

    /** The method that the request asks for; null where it is none of these. */
    Method* find(const HttpRequest& request);

private:
    std::deque<Method> _methods;
};

} // namespace ObjectManager::Server

#endif

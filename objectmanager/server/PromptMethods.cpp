#include "server/PromptMethods.h"

#include <algorithm>

namespace ObjectManager::Server {

bool PromptMethods::Method::isPrompt(Clock::time_point now) const {
    return _start.load(std::memory_order_relaxed) <= now;
}

void PromptMethods::Method::took(Clock::duration processorTime, Clock::time_point now) {
    if (processorTime > limit) {
        _start.store(now + pause, std::memory_order_relaxed);
        return;
    }
    Clock::time_point never = Clock::time_point::max();
    _start.compare_exchange_strong(never, now, std::memory_order_relaxed);
}

PromptMethods::Method* PromptMethods::find(const HttpRequest& request) {
    const std::string* const name = request.header("CIMMethod");
    if (name == nullptr) {
        return nullptr;
    }
    const auto method = std::find_if(_methods.begin(), _methods.end(),
                                     [&](const Method& each) { return equalTokens(each.name(), *name); });
    return method == _methods.end() ? nullptr : &*method;
}

} // namespace ObjectManager::Server

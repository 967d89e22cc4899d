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

PromptMethods::Method* PromptMethods::find(const CimXml::HttpRequest& request) {
    const auto header = std::find_if(request.headers.begin(), request.headers.end(),
                                     [](const auto& each) { return equalNames(each.first, "CIMMethod"); });
    if (header == request.headers.end()) {
        return nullptr;
    }
    const auto method = std::find_if(_methods.begin(), _methods.end(),
                                     [&](const Method& each) { return equalNames(each.name(), header->second); });
    return method == _methods.end() ? nullptr : &*method;
}

} // namespace ObjectManager::Server

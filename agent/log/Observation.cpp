#include "Observation.h"

#include <atomic>

namespace OrvLog {

namespace {

constinit std::atomic<const Observer1*> theObserver = nullptr;

} // namespace

void showToObserver(const Record& record) {
    const Observer1* const observer = theObserver.load(std::memory_order_acquire);
    if (observer != nullptr && record.kind == Kind::log && record.level >= observer->lowestLevel) {
        const ObservedRecord1 observed{.kind = record.toldKind,
                                       .level = record.level,
                                       .category = record.category.data(),
                                       .categorySize = record.category.size(),
                                       .text = record.text.data(),
                                       .textSize = record.text.size()};
        observer->record(observer->context, &observed);
    }
}

} // namespace OrvLog

void orvLogObserve1(const OrvLog::Observer1* observer) {
    OrvLog::theObserver.store(observer, std::memory_order_release);
}

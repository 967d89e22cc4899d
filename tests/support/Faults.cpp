#include "Faults.h"

namespace OrvTest {

void Faults::at(const std::string& call, unsigned int occurrence, Fault fault) {
    const std::lock_guard lock(_mutex);
    Plan& plan = _plans[call];
    plan.faults[plan.count + occurrence] = std::move(fault);
}

void Faults::always(const std::string& call, Fault fault) {
    const std::lock_guard lock(_mutex);
    _plans[call].usual = std::move(fault);
}

Fault Faults::next(const std::string& call) {
    Fault fault;
    {
        const std::lock_guard lock(_mutex);
        Plan& plan = _plans[call];
        const auto found = plan.faults.find(++plan.count);
        fault = found == plan.faults.end() ? plan.usual : found->second;
    }
    if (fault.action) {
        fault.action();
    }
    return fault;
}

void Faults::clear() {
    const std::lock_guard lock(_mutex);
    _plans.clear();
}

} // namespace OrvTest

#include "Backend.h"

#include "SimulatedBackend.h"
#if ORV_LOGIND
#include "LogindBackend.h"
#endif

namespace Norv::Agent {

std::unique_ptr<Backend> makeBackend(const Configuration& configuration) {
    const InstrumentationSettings& settings = configuration.instrumentation;
#if ORV_LOGIND
    if (settings.backend == InstrumentationSettings::Backend::logind) {
        return std::make_unique<LogindBackend>(settings.logind);
    }
#endif
    return std::make_unique<SimulatedBackend>(settings.simulated);
}

} // namespace Norv::Agent

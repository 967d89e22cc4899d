#include "ConfigurationWatch.h"

#include "Configuration.h"
#include "base/CoarseClock.h"

#include <chrono>
#include <utility>

namespace Norv::Agent {

namespace {

constexpr std::int64_t interval = 1000;
// Longer than the resolution of file systems' time stamps, and shorter than the time between two looks.
constexpr std::chrono::milliseconds exactness{900};

} // namespace

ConfigurationWatch::ConfigurationWatch()
    : _file(configurationFile()), _next(coarseMilliseconds() + interval), _known(signature()),
      _recent(isRecent(_known)) {}

bool ConfigurationWatch::isDue() const {
    return coarseMilliseconds() >= _next.load(std::memory_order_relaxed);
}

bool ConfigurationWatch::look() {
    _next.store(coarseMilliseconds() + interval, std::memory_order_relaxed);
    const std::optional<FileSignature> former = std::exchange(_known, signature());
    return std::exchange(_recent, isRecent(_known)) || former != _known;
}

std::optional<FileSignature> ConfigurationWatch::signature() const {
    struct stat status {};
    if (::stat(_file.c_str(), &status) != 0) {
        return std::nullopt;
    }
    return FileSignature(status);
}

bool ConfigurationWatch::isRecent(const std::optional<FileSignature>& signature) {
    return signature && std::chrono::system_clock::now().time_since_epoch() - signature->modified < exactness;
}

} // namespace Norv::Agent

#include "ConfigurationWatch.h"

#include "CoarseClock.h"
#include "Configuration.h"

#include <utility>

#include <sys/stat.h>

namespace Norv::Agent {

namespace {

constexpr std::int64_t interval = 1000;
// More than file systems need to tell two changes apart, and less than the time until the next look.
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
    const std::optional<Signature> former = std::exchange(_known, signature());
    return std::exchange(_recent, isRecent(_known)) || former != _known;
}

std::optional<ConfigurationWatch::Signature> ConfigurationWatch::signature() const {
    struct stat status {};
    if (::stat(_file.c_str(), &status) != 0) {
        return std::nullopt;
    }
    return Signature{status.st_dev, status.st_ino, status.st_size,
                     std::chrono::seconds(status.st_mtim.tv_sec) + std::chrono::nanoseconds(status.st_mtim.tv_nsec)};
}

bool ConfigurationWatch::isRecent(const std::optional<Signature>& signature) {
    return signature && std::chrono::system_clock::now().time_since_epoch() - signature->modified < exactness;
}

} // namespace Norv::Agent

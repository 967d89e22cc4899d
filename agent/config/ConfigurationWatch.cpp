#include "ConfigurationWatch.h"

#include "Configuration.h"

#include <ctime>
#include <utility>

#include <sys/stat.h>

namespace Norv::Agent {

namespace {

constexpr std::int64_t interval = 1000;

// Coarse is exact enough, and costs a fraction.
std::int64_t milliseconds() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC_COARSE, &now);
    return std::int64_t{now.tv_sec} * 1000 + now.tv_nsec / 1'000'000;
}

} // namespace

ConfigurationWatch::ConfigurationWatch()
    : _file(configurationFile()), _next(milliseconds() + interval), _known(signature()) {}

bool ConfigurationWatch::isDue() const {
    return milliseconds() >= _next.load(std::memory_order_relaxed);
}

bool ConfigurationWatch::look() {
    _next.store(milliseconds() + interval, std::memory_order_relaxed);
    const std::optional<Signature> former = std::exchange(_known, signature());
    return former != _known;
}

std::optional<ConfigurationWatch::Signature> ConfigurationWatch::signature() const {
    struct stat status {};
    if (::stat(_file.c_str(), &status) != 0) {
        return std::nullopt;
    }
    return Signature{status.st_dev, status.st_ino, status.st_size,
                     std::chrono::seconds(status.st_mtim.tv_sec) + std::chrono::nanoseconds(status.st_mtim.tv_nsec)};
}

} // namespace Norv::Agent

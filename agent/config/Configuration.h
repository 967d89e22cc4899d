/**
 * The agent's configuration file, orv-agent.toml(5). Each of the agent's libraries links this privately and reads the
 * file on its own; whether the whole file is right is decided here, the same way for all of them.
 */
#ifndef AGENT_CONFIGURATION_H
#define AGENT_CONFIGURATION_H

#include <chrono>
#include <cstdint>
#include <filesystem>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace Norv::Agent {

/** Records of this level pass every threshold that can be configured: power requests and configuration errors. */
inline constexpr int alwaysWrittenLevel = 10000;

/** Thresholds of the categories that begin with a prefix; what is not set is taken from the general threshold. */
struct CategoryThreshold {
    std::string prefix;
    std::optional<int> logLevel;
    std::optional<int> traceLevel;
};

/** Table [log]. */
struct LogSettings {
    enum class Destination { standardError, file, syslog };

    Destination destination = Destination::standardError;
    /** Where the destination is a file. */
    std::filesystem::path file;
    /** Size in bytes at which the file is rotated; 0 never rotates it. */
    std::uint64_t rotateSize = 10ULL * 1024 * 1024;
    /** How many rotated files are kept. */
    unsigned int rotateCount = 5;
    /** Thresholds, 0 to alwaysWrittenLevel: a record at or above its threshold is written. */
    int logLevel = 6000;
    int traceLevel = alwaysWrittenLevel;
    /** The longest prefix that matches decides. */
    std::vector<CategoryThreshold> categories;
};

/** Element of [[instrumentation.simulated.node]]: a power-management node of the simulated machine. */
struct SimulatedNode {
    /** Names from the root down, separated by slashes, for example "chassis/blade1". Unique. */
    std::string path;
    /** What property 123 reads until the first write. */
    unsigned int powerState = 1;
    /** What property 125 reads. */
    std::vector<unsigned int> powerStates = {2, 5, 8};
};

/** Table [instrumentation.simulated]. */
struct SimulatedSettings {
    /** Where the simulated machine's state is kept, shared by every process. Empty where the machine is another one. */
    std::filesystem::path stateFile;
    std::chrono::milliseconds rebootTime{10'000};
    std::chrono::milliseconds shutdownTime{5'000};
    std::vector<SimulatedNode> nodes = {SimulatedNode{"system"}};
};

/** Table [instrumentation.logind]. */
struct LogindSettings {
    /** From an accepted request until the machine goes down, so that the answer reaches who asked; 0 for at once. */
    std::chrono::milliseconds delay{5'000};
    /** How long an operation may wait for the bus and for systemd-logind, all in all. */
    std::chrono::milliseconds timeout{5'000};
    /** Locked while a request is made, so that of two that are made at once the second finds the first. */
    std::filesystem::path lockFile;
};

/** Table [instrumentation]. */
struct InstrumentationSettings {
    /** Builds without systemd's library have no logind: a file that asks for it cannot be used. */
    enum class Backend { simulated, logind };

    Backend backend = Backend::simulated;
    SimulatedSettings simulated;
    LogindSettings logind;
};

struct Configuration {
    /** The file that was read; empty where there is none and the built-in defaults hold. */
    std::filesystem::path source;
    /** [system] name; not set where the host's own name is meant. */
    std::optional<std::string> systemName;
    LogSettings log;
    InstrumentationSettings instrumentation;
};

/** A configuration that cannot be used. what() is one line naming file, line, key, value and what was expected. */
class ConfigurationError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** The file that the environment variable ORV_AGENT_CONFIG names, else /etc/orv/agent.toml, whether it exists or not.
 */
std::string configurationFile();

/**
 * Reads the file that the environment variable ORV_AGENT_CONFIG names, else /etc/orv/agent.toml where it exists, else
 * gives the built-in defaults. Keys that the file leaves out have their defaults.
 *
 * @throws ConfigurationError where the file cannot be read or anything in it is wrong or unknown.
 */
Configuration loadConfiguration();

} // namespace Norv::Agent

#endif

/**
 * The agent's configuration file, orv-agent.toml(5). Each of the agent's libraries links this code privately and reads
 * the file itself; since all use this code and check the whole file, they agree on whether it is correct.
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

/** The level of power requests and configuration errors: such records pass every threshold that can be configured. */
inline constexpr int alwaysWrittenLevel = 10000;

/**
 * Thresholds of the categories that begin with a prefix. The general threshold holds instead of one that has no value.
 */
struct CategoryThreshold {
    std::string prefix;
    std::optional<int> logLevel;
    std::optional<int> traceLevel;
};

/** Table [log]. */
struct LogSettings {
    enum class Destination { standardError, file, syslog };

    Destination destination = Destination::standardError;
    /** The path, if the destination is a file. */
    std::filesystem::path file;
    /** Size in bytes at which the file is rotated; 0 never rotates it. */
    std::uint64_t rotateSize = 10ULL * 1024 * 1024;
    /** How many rotated files are kept. */
    unsigned int rotateCount = 5;
    /** Thresholds, 0 to alwaysWrittenLevel: a record at or above its threshold is written. */
    int logLevel = 6000;
    int traceLevel = alwaysWrittenLevel;
    /** For a category, the longest prefix that matches decides. */
    std::vector<CategoryThreshold> categories;
};

/** Element of [[instrumentation.simulated.node]]: a power-management node of the simulated machine. */
struct SimulatedNode {
    /** The names of the nodes from the root down, separated by slashes, for example "chassis/blade1". Unique. */
    std::string path;
    /** The value of property 123 until the first power request. */
    unsigned int powerState = 1;
    /** The value of property 125. */
    std::vector<unsigned int> powerStates = {2, 5, 8};
};

/** Table [instrumentation.simulated]. */
struct SimulatedSettings {
    /** The file that holds the simulated machine's state; all processes share it. Empty for another backend. */
    std::filesystem::path stateFile;
    std::chrono::milliseconds rebootTime{10'000};
    std::chrono::milliseconds shutdownTime{5'000};
    std::vector<SimulatedNode> nodes = {SimulatedNode{"system"}};
};

/** Table [instrumentation.logind]. */
struct LogindSettings {
    /**
     * The time between an accepted request and the end of the machine, in which the answer can reach the client; 0 for
     * at once.
     */
    std::chrono::milliseconds delay{5'000};
    /** The longest time that an operation may wait for the bus and for systemd-logind together. */
    std::chrono::milliseconds timeout{5'000};
    /**
     * The file that is locked while a request is made, so that of two simultaneous requests the second one finds the
     * first.
     */
    std::filesystem::path lockFile;
};

/** Table [instrumentation]. */
struct InstrumentationSettings {
    /** In builds without systemd's library, a file that asks for logind is an error. */
    enum class Backend { simulated, logind };

    Backend backend = Backend::simulated;
    SimulatedSettings simulated;
    LogindSettings logind;
};

struct Configuration {
    /** The file that was read; empty if there is none and the built-in defaults hold. */
    std::filesystem::path source;
    /** [system] name; no value for the host's own name. */
    std::optional<std::string> systemName;
    LogSettings log;
    InstrumentationSettings instrumentation;
};

/**
 * A configuration that cannot be used. what() is one line that names file, line, key and value, and what was expected.
 */
class ConfigurationError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/** The path of the configuration file, whether the file exists or not: the value of the environment variable
 * ORV_AGENT_CONFIG, else /etc/orv/agent.toml. */
std::string configurationFile();

/**
 * Reads the file that the environment variable ORV_AGENT_CONFIG names. If the variable is not set, reads
 * /etc/orv/agent.toml; if that does not exist, returns the built-in defaults. Keys that the file leaves out have their
 * defaults.
 *
 * @throws ConfigurationError if the file cannot be read, or anything in it is wrong or unknown.
 */
Configuration loadConfiguration();

} // namespace Norv::Agent

#endif

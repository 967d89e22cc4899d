#include "Configuration.h"

#include "PowerStates.h"
#include "TableReader.h"
#include "base/RegularFile.h"

#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <limits>
#include <system_error>
#include <unordered_set>

namespace Norv::Agent {

namespace {

constexpr const char* fileVariable = "ORV_AGENT_CONFIG";
constexpr const char* defaultFile = "/etc/orv/agent.toml";

using Destination = LogSettings::Destination;
constexpr std::array<std::pair<std::string_view, Destination>, 3> destinations{{
    {"stderr", Destination::standardError},
    {"file", Destination::file},
    {"syslog", Destination::syslog},
}};

using Backend = InstrumentationSettings::Backend;
constexpr std::array<std::pair<std::string_view, Backend>, 2> backends{{
    {"simulated", Backend::simulated},
    {"logind", Backend::logind},
}};

constexpr Integer<int> level{0, alwaysWrittenLevel};
constexpr Integer<unsigned int> sixteenBits{0, std::numeric_limits<std::uint16_t>::max()};
constexpr NumberOrName<unsigned int> powerState{sixteenBits, nodePowerStates};
constexpr NumberOrName<unsigned int> supportedPowerState{sixteenBits, supportedPowerStates};
constexpr Integer<std::uint64_t> fileSize{0, std::numeric_limits<std::int64_t>::max()};
constexpr Integer<unsigned int> fileCount{0, 1000};
constexpr Seconds transitionTime{std::chrono::seconds{0}, std::chrono::hours{24}};
constexpr Seconds waitingTime{std::chrono::milliseconds{100}, std::chrono::minutes{1}};

// The value of an environment variable; no value if it is not set or empty.
std::optional<std::string> environment(const char* name) {
    const char* value = std::getenv(name);
    return value == nullptr || *value == '\0' ? std::nullopt : std::optional<std::string>(value);
}

void readLog(TableReader& table, LogSettings& log) {
    table.read("destination", Choice<Destination>{destinations}, log.destination);
    if (!table.read("file", AbsolutePath{}, log.file) && log.destination == Destination::file) {
        table.reject("file", AbsolutePath::expected() + " where the destination is a file");
    }
    table.read("rotate-size", fileSize, log.rotateSize);
    table.read("rotate-count", fileCount, log.rotateCount);
    table.read("level", level, log.logLevel);
    table.read("trace-level", level, log.traceLevel);

    std::unordered_set<std::string> prefixes;
    table.readTables("category", [&](TableReader& category) {
        CategoryThreshold threshold;
        category.require("prefix", Text{}, threshold.prefix);
        if (!prefixes.insert(threshold.prefix).second) {
            category.reject("prefix", "a prefix that no other category has");
        }
        category.read("level", level, threshold.logLevel);
        category.read("trace-level", level, threshold.traceLevel);
        log.categories.push_back(std::move(threshold));
    });
}

void readSimulated(TableReader& table, SimulatedSettings& simulated) {
    table.read("state-file", AbsolutePath{}, simulated.stateFile);
    table.read("reboot-time", transitionTime, simulated.rebootTime);
    table.read("shutdown-time", transitionTime, simulated.shutdownTime);

    std::unordered_set<std::string> paths;
    std::vector<SimulatedNode> nodes;
    const bool configured = table.readTables("node", [&](TableReader& element) {
        SimulatedNode node;
        element.require("path", NodePath{}, node.path);
        if (!paths.insert(node.path).second) {
            element.reject("path", "a path that no other node has");
        }
        element.read("power-state", powerState, node.powerState);
        element.readList("power-states", supportedPowerState, node.powerStates);
        nodes.push_back(std::move(node));
    });
    if (configured) {
        simulated.nodes = std::move(nodes);
    }
}

void readLogind(TableReader& table, LogindSettings& logind) {
    table.read("delay", transitionTime, logind.delay);
    table.read("timeout", waitingTime, logind.timeout);
    table.read("lock-file", AbsolutePath{}, logind.lockFile);
}

void readInstrumentation(TableReader& table, InstrumentationSettings& instrumentation) {
    table.read("backend", Choice<Backend>{backends}, instrumentation.backend);
    if (ORV_LOGIND == 0 && instrumentation.backend == Backend::logind) {
        table.reject("backend", "\"simulated\": backend logind is not built in");
    }
    table.readTable("simulated", [&](TableReader& simulated) { readSimulated(simulated, instrumentation.simulated); });
    table.readTable("logind", [&](TableReader& logind) { readLogind(logind, instrumentation.logind); });
}

void readConfiguration(TableReader& file, Configuration& configuration) {
    file.readTable("system", [&](TableReader& system) { system.read("name", Text{}, configuration.systemName); });
    file.readTable("log", [&](TableReader& log) { readLog(log, configuration.log); });
    file.readTable("instrumentation", [&](TableReader& instrumentation) {
        readInstrumentation(instrumentation, configuration.instrumentation);
    });
    file.finish();
}

[[noreturn]] void rejectFile(const std::string& file, const std::string& reason, const std::string& expected) {
    throw ConfigurationError(file + ": " + reason + ": expected " + expected);
}

std::string contentOf(const std::string& file) {
    constexpr const char* readable = "a file that can be read";
    std::optional<FileContent> content;
    try {
        content = readRegularFile(file);
    } catch (const std::system_error& error) {
        if (error.code() == std::errc::invalid_argument) {
            rejectFile(file, "not a regular file", readable);
        }
        if (error.code() == std::errc::file_too_large) {
            rejectFile(file, error.code().message(), "a file of " + std::to_string(largestFile) + " bytes at most");
        }
        rejectFile(file, error.code().message(), readable);
    }
    if (!content) {
        rejectFile(file, std::generic_category().message(ENOENT), readable);
    }
    return std::move(content->text);
}

Configuration configurationFrom(const std::string& file) {
    Configuration configuration;
    configuration.source = file;
    const std::string content = contentOf(file);
    const toml::parse_result parsed = toml::parse(std::string_view(content), std::string_view());
    if (!parsed) {
        throw ConfigurationError(file + ':' + std::to_string(parsed.error().source().begin.line) +
                                 ": not TOML: " + std::string(parsed.error().description()));
    }
    TableReader reader(parsed.table(), file);
    readConfiguration(reader, configuration);
    return configuration;
}

// Whether there is no file, so that the built-in defaults hold. A file that exists but cannot be reached is an error,
// not a reason for the defaults.
bool isWithoutFile() {
    std::error_code error;
    return !environment(fileVariable) &&
           std::filesystem::symlink_status(defaultFile, error).type() == std::filesystem::file_type::not_found;
}

/**
 * The default path of a file that the agent writes. `key` is the one that can name another path, for the error message.
 */
std::filesystem::path ownFile(const char* name, const char* key) {
    if (geteuid() == 0) {
        return std::filesystem::path("/var/lib/orv") / name;
    }
    // The XDG Base Directory Specification requires that relative paths are ignored.
    if (const auto state = environment("XDG_STATE_HOME"); state && state->starts_with('/')) {
        return std::filesystem::path(*state) / "orv" / name;
    }
    if (const auto home = environment("HOME")) {
        return std::filesystem::path(*home) / ".local/state/orv" / name;
    }
    throw ConfigurationError(std::string(key) + ": missing: expected an absolute path, or the environment variable "
                                                "XDG_STATE_HOME or HOME to say where state is kept");
}

/**
 * Completes the paths of the configured backend only: environment variables that another backend would need may be
 * missing.
 */
void completePaths(InstrumentationSettings& instrumentation) {
    if (instrumentation.backend == Backend::simulated && instrumentation.simulated.stateFile.empty()) {
        instrumentation.simulated.stateFile = ownFile("simulated-machine.json", "instrumentation.simulated.state-file");
    }
    if (instrumentation.backend == Backend::logind && instrumentation.logind.lockFile.empty()) {
        instrumentation.logind.lockFile = ownFile("power-request.lock", "instrumentation.logind.lock-file");
    }
}

} // namespace

std::string configurationFile() {
    return environment(fileVariable).value_or(defaultFile);
}

Configuration loadConfiguration() {
    Configuration configuration = isWithoutFile() ? Configuration{} : configurationFrom(configurationFile());
    completePaths(configuration.instrumentation);
    return configuration;
}

} // namespace Norv::Agent

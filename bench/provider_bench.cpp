/**
 * Measures the provider library's operations through the embedded object manager, and the floor: a bare loop with the
 * same calls of the broker and the agent and as many log records, which no provider can avoid. After the measurements,
 * prints the cost of one object (an instance, a path, a pair of an association, a method call) and that of the floor.
 * Each line has one figure: table, row, column and value, with tabs between them.
 *
 * The agent reads its configuration once in a process, so each number of nodes and each setting of the log runs in a
 * process of its own.
 *
 * If valgrind runs the program with the tool callgrind, it writes dumps of the instructions of each operation instead;
 * bench/count-instructions reads them.
 */
#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"

#include <benchmark/benchmark.h>
#include <valgrind/callgrind.h>

#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <map>
#include <regex>
#include <string>
#include <string_view>
#include <vector>

namespace {

using namespace ObjectManager;

/** What one process measures. */
struct Setup {
    unsigned int nodes;
    unsigned int systems;
    /** Whether every record is written to a file, or only those that the default thresholds let pass. */
    bool logEverything;
    bool associations;
};

constexpr Setup setups[] = {
    {1, 1, false, false},     {100, 1, false, false}, {10'000, 1, false, false}, {60'000, 1, false, false},
    {1, 1, true, false},      {100, 1, true, false},  {10'000, 1, true, false},  {60'000, 1, true, false},
    {1, 1, false, true},      {100, 1, false, true},  {1'000, 1, false, true},   {100, 10, false, true},
    {1'000, 10, false, true}, {300, 1, false, true},
};

/** A name with a number of constant length, so that the order by name is that of the numbers. */
std::string nodePath(unsigned int node) {
    return "node" + std::to_string(100'000 + node);
}

void writeConfiguration(const Setup& setup, const std::filesystem::path& folder) {
    std::ofstream file(folder / "agent.toml");
    file << "[system]\nname = \"bench.example\"\n";
    if (setup.logEverything) {
        file << "[log]\ndestination = \"file\"\nfile = \"" << (folder / "agent.log").string()
             << "\"\nlevel = 0\ntrace-level = 0\n";
    }
    file << "[instrumentation.simulated]\nstate-file = \"" << (folder / "machine.json").string()
         << "\"\nreboot-time = 0\n";
    for (unsigned int i = 0; i < setup.nodes; ++i) {
        file << "[[instrumentation.simulated.node]]\npath = \"" << nodePath(i) << "\"\n";
    }
    file.close();
    // The log reads a file a second time that has just changed, which would be measured as well.
    std::filesystem::last_write_time(folder / "agent.toml",
                                     std::filesystem::file_time_type::clock::now() - std::chrono::hours{1});
    setenv("ORV_AGENT_CONFIG", (folder / "agent.toml").c_str(), 1);
    setenv("ORV_BENCH_SYSTEMS", std::to_string(setup.systems).c_str(), 1);
}

constexpr const char* nameSpace = "root/cimv2";

Registration registration(const char* className, const char* provider, const char* location) {
    Registration made;
    made.className = className;
    made.provider = provider;
    made.location = location;
    made.nameSpaces = {nameSpace};
    made.instance = true;
    made.method = std::string(className).ends_with("Service");
    return made;
}

constexpr const char* library = "orvpowerstatemanagementprovider";

Registration associationRegistration(const char* className, const char* provider) {
    Registration made = registration(className, provider, library);
    made.association = true;
    made.method = false;
    return made;
}

/** @param systems how many computer systems there are; a machine has one. */
Registry registry(unsigned int systems) {
    return Registry({
        registration("TALVO_PowerManagementService", "PowerManagementServiceProvider", library),
        registration("TALVO_PowerManagementCapabilities", "PowerManagementCapabilitiesProvider", library),
        associationRegistration("TALVO_AssociatedPowerManagementService", "AssociatedPowerManagementServiceProvider"),
        associationRegistration("TALVO_PowerManagementHostedService", "PowerManagementHostedServiceProvider"),
        associationRegistration("TALVO_PowerManagementElementCapabilities",
                                "PowerManagementElementCapabilitiesProvider"),
        systems == 1 ? registration("TALVO_ComputerSystem", "ComputerSystemProvider", "orvcomputersystemprovider")
                     : registration("TALVO_ComputerSystem", "FloorComputerSystemProvider", "orvfloorprovider"),
        registration("FLOOR_Service", "FloorServiceProvider", "orvfloorprovider"),
        registration("FLOOR_Capabilities", "FloorCapabilitiesProvider", "orvfloorprovider"),
    });
}

ObjectPath pathOf(const std::string& className, std::vector<NamedValue> keys = {}) {
    return ObjectPath{"", nameSpace, className, std::move(keys)};
}

/** Runs one operation. @return how many objects it returned. */
using Operation = std::function<std::size_t(Dispatcher&, const std::string& className)>;

// Each object of an answer is looked at and dropped, as when the answer for a client is written.

const Operation enumInstanceNames = [](Dispatcher& dispatcher, const std::string& className) {
    std::size_t count = 0;
    dispatcher.enumerateInstanceNames({}, pathOf(className), [&](ObjectPath&& /*path*/) { ++count; });
    return count;
};

const Operation enumInstances = [](Dispatcher& dispatcher, const std::string& className) {
    std::size_t count = 0;
    dispatcher.enumerateInstances({}, pathOf(className), {}, [&](Instance&& /*instance*/) { ++count; });
    return count;
};

/** A lookup by key. The key is that of the last node; the floor does not look at it. */
Operation getInstance(const std::string& key, const std::string& value) {
    return [key, value](Dispatcher& dispatcher, const std::string& className) {
        dispatcher.getInstance({}, pathOf(className, {{key, stringValue(value)}}), {});
        return std::size_t{1};
    };
}

/** RequestPowerStateChange. For a state that the provider refuses, nothing is written to the tree. */
Operation requestPowerStateChange(std::uint64_t powerState) {
    return [powerState](Dispatcher& dispatcher, const std::string& className) {
        const std::vector<NamedValue> arguments = {
            {"PowerState", unsignedValue(CMPI_uint16, powerState)},
            {"ManagedElement", referenceValue(pathOf("TALVO_ComputerSystem"))},
        };
        try {
            dispatcher.invokeMethod({}, pathOf(className), "RequestPowerStateChange", arguments);
        } catch (const CimError& error) {
            if (!error.refused) {
                throw;
            }
        }
        return std::size_t{1};
    };
}

/** The objects that are associated with the first node's service through associations of a class. */
using Traversal = std::size_t (*)(Dispatcher&, const ObjectPath& source, const AssociationFilter& filter);

template <typename Object>
std::size_t countOf(const std::vector<Associated<Object>>& found) {
    std::size_t count = 0;
    for (const Associated<Object>& associated : found) {
        count += associated.objects.size();
    }
    return count;
}

std::size_t associators(Dispatcher& dispatcher, const ObjectPath& source, const AssociationFilter& filter) {
    return countOf(dispatcher.associators({}, source, filter, {}));
}

std::size_t associatorNames(Dispatcher& dispatcher, const ObjectPath& source, const AssociationFilter& filter) {
    return countOf(dispatcher.associatorNames({}, source, filter));
}

std::size_t references(Dispatcher& dispatcher, const ObjectPath& source, const AssociationFilter& filter) {
    return dispatcher.references({}, source, filter, {}).size();
}

std::size_t referenceNames(Dispatcher& dispatcher, const ObjectPath& source, const AssociationFilter& filter) {
    return dispatcher.referenceNames({}, source, filter).size();
}

Operation traversal(Traversal traverse) {
    return [traverse](Dispatcher& dispatcher, const std::string& className) {
        const ObjectPath source =
            pathOf("TALVO_PowerManagementService", {{"CreationClassName", stringValue("TALVO_PowerManagementService")},
                                                    {"Name", stringValue("PowerStateManagement_" + nodePath(0))},
                                                    {"SystemCreationClassName", stringValue("TALVO_ComputerSystem")},
                                                    {"SystemName", stringValue("bench.example")}});
        return traverse(dispatcher, source, {className, {}, {}, {}});
    };
}

struct Measured {
    std::string operation;
    /** The class that is measured, and the class of the floor; null if the floor has none. */
    const char* className;
    const char* floorClass;
    Operation run;
};

std::vector<Measured> elementOperations() {
    constexpr const char* service = "TALVO_PowerManagementService";
    constexpr const char* capabilities = "TALVO_PowerManagementCapabilities";
    return {
        {"service EnumInstanceNames", service, "FLOOR_Service", enumInstanceNames},
        {"service EnumInstances", service, "FLOOR_Service", enumInstances},
        {"service GetInstance", service, "FLOOR_Service", getInstance("Name", "PowerStateManagement_" + nodePath(0))},
        {"service RequestPowerStateChange refused", service, "FLOOR_Service", requestPowerStateChange(2)},
        {"service RequestPowerStateChange accepted", service, "FLOOR_Service", requestPowerStateChange(5)},
        {"capabilities EnumInstanceNames", capabilities, "FLOOR_Capabilities", enumInstanceNames},
        {"capabilities EnumInstances", capabilities, "FLOOR_Capabilities", enumInstances},
        {"capabilities GetInstance", capabilities, "FLOOR_Capabilities", getInstance("InstanceID", nodePath(0))},
    };
}

std::vector<Measured> associationOperations(const Setup& setup) {
    if (setup.nodes == 300) {
        constexpr const char* className = "TALVO_PowerManagementElementCapabilities";
        return {{"capabilities association EnumInstanceNames", className, nullptr, enumInstanceNames}};
    }
    std::vector<Measured> all;
    const auto add = [&](const std::string& name, const char* className) {
        all.push_back({name + " EnumInstanceNames", className, nullptr, enumInstanceNames});
        all.push_back({name + " EnumInstances", className, nullptr, enumInstances});
        all.push_back({name + " Associators", className, nullptr, traversal(associators)});
        all.push_back({name + " AssociatorNames", className, nullptr, traversal(associatorNames)});
        all.push_back({name + " References", className, nullptr, traversal(references)});
        all.push_back({name + " ReferenceNames", className, nullptr, traversal(referenceNames)});
    };
    add("system association", "TALVO_AssociatedPowerManagementService");
    add("host association", "TALVO_PowerManagementHostedService");
    // The way in which clients mostly ask.
    all.push_back({"service Associators", "", nullptr, traversal(associators)});
    all.push_back({"service References", "", nullptr, traversal(references)});
    // Every service with every capabilities object: many pairs.
    if (setup.nodes <= 100) {
        add("capabilities association", "TALVO_PowerManagementElementCapabilities");
    }
    return all;
}

/** Sends each measurement to the parent process as a line "name<TAB>nanoseconds of one object", and shows it. */
class Reporter : public benchmark::ConsoleReporter {
public:
    explicit Reporter(std::FILE* results) : ConsoleReporter(OO_Tabular), _results(results) {}

    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            const auto rate = run.counters.find("items_per_second");
            if (!run.error_occurred && rate != run.counters.end()) {
                std::fprintf(_results, "%s\t%.1f\n", run.benchmark_name().c_str(), 1e9 / rate->second.value);
            }
        }
        std::fflush(_results);
    }

private:
    std::FILE* _results;
};

void measure(benchmark::State& state, Dispatcher& dispatcher, const std::string& className, const Operation& run) {
    std::size_t objects = 0;
    try {
        for (auto _ : state) {
            objects += run(dispatcher, className);
        }
    } catch (const CimError& error) {
        state.SkipWithError(error.what());
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(objects));
}

/** The benchmarks that the option --benchmark_filter selects. */
std::regex filterOf(const std::vector<std::string_view>& arguments) {
    constexpr std::string_view filter = "--benchmark_filter=";
    for (const std::string_view argument : arguments) {
        if (argument.starts_with(filter)) {
            return std::regex(std::string(argument.substr(filter.size())));
        }
    }
    return std::regex("");
}

/** The text that a setup appends to an operation's name. */
std::string suffixOf(const Setup& setup) {
    const std::string nodes = std::to_string(setup.nodes);
    const std::string size =
        setup.associations ? nodes + "x" + (setup.nodes == 300 ? nodes : std::to_string(setup.systems)) : nodes;
    return std::string(setup.logEverything ? "/log everything/" : "/log default/") + size;
}

/** Whether instructions are counted for this setup: fewer setups than are timed, since instructions do not vary. */
bool isCounted(const Setup& setup) {
    return setup.systems == 1 &&
           (setup.nodes == 1 || setup.nodes == 100 || (setup.nodes == 10'000 && !setup.logEverything));
}

/** Has callgrind write a dump for each operation. The dump's name has the number of runs. */
void countInstructions(Dispatcher& dispatcher, const std::vector<Measured>& operations, const Setup& setup,
                       const std::regex& filter) {
    const unsigned int runs = setup.nodes == 1 ? 20 : setup.nodes == 100 ? 4 : 1;
    for (const Measured& measured : operations) {
        const std::string name = "provider/" + measured.operation + suffixOf(setup);
        if (!std::regex_search(name, filter)) {
            continue;
        }
        // The first run makes what exists once in a process, which is not counted.
        measured.run(dispatcher, measured.className);
        CALLGRIND_ZERO_STATS;
        for (unsigned int i = 0; i < runs; ++i) {
            measured.run(dispatcher, measured.className);
        }
        const std::string dump = std::to_string(runs) + '*' + name;
        CALLGRIND_DUMP_STATS_AT(dump.c_str());
    }
}

int runSetup(const Setup& setup, int argc, char** argv, const std::filesystem::path& folder, std::FILE* results) {
    writeConfiguration(setup, folder);
    // Every power request is logged on standard error; these lines are dropped.
    if (std::freopen("/dev/null", "w", stderr) == nullptr) {
        return 1;
    }
    // Associations are found in the declarations of classes; the floor's classes have none.
    const Catalogue catalogue = readCatalogue(ORV_SCHEMA_FOLDER);
    Dispatcher dispatcher(registry(setup.systems),
                          {{ORV_LIBRARY_FOLDER}, setup.associations ? &catalogue : nullptr, nullptr});
    // The first request reads the configuration of all the nodes.
    enumInstanceNames(dispatcher, "TALVO_PowerManagementService");
    const std::vector<Measured> operations = setup.associations ? associationOperations(setup) : elementOperations();
    if (RUNNING_ON_VALGRIND) {
        countInstructions(dispatcher, operations, setup, filterOf({argv + 1, argv + argc}));
        return 0;
    }
    for (const Measured& measured : operations) {
        const auto add = [&](const char* what, const char* className) {
            benchmark::RegisterBenchmark((measured.operation + what + suffixOf(setup)).c_str(), measure,
                                         std::ref(dispatcher), std::string(className), measured.run);
        };
        add("", measured.className);
        if (measured.floorClass != nullptr && !setup.logEverything) {
            add(" floor", measured.floorClass);
        }
    }
    benchmark::Initialize(&argc, argv);
    Reporter reporter(results);
    benchmark::RunSpecifiedBenchmarks(&reporter);
    return 0;
}

/** Nanoseconds for one object, by the benchmark's name, in the order of the measurements. */
using Results = std::vector<std::pair<std::string, double>>;

bool runInProcess(const Setup& setup, int argc, char** argv, Results& results) {
    std::string folder = (std::filesystem::temp_directory_path() / "orv-bench-XXXXXX").string();
    int ends[2];
    if (mkdtemp(folder.data()) == nullptr || pipe(ends) != 0) {
        std::perror("provider_bench");
        return false;
    }
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        close(ends[0]);
        const int status = runSetup(setup, argc, argv, folder, fdopen(ends[1], "w"));
        std::fflush(nullptr);
        _exit(status);
    }
    close(ends[1]);
    std::FILE* const lines = fdopen(ends[0], "r");
    char name[256];
    double nanoseconds = 0;
    while (std::fscanf(lines, "%255[^\t]\t%lf\n", name, &nanoseconds) == 2) {
        results.emplace_back(name, nanoseconds);
    }
    std::fclose(lines);
    int status = 0;
    waitpid(child, &status, 0);
    std::filesystem::remove_all(folder);
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

/** The name of the floor for a measurement. The floor is measured once for all settings of the log. */
std::string floorOf(std::string name) {
    const std::size_t slash = name.find('/');
    const std::size_t size = name.rfind('/');
    return name.substr(0, slash) + " floor/log default" + name.substr(size);
}

/** Prints each figure in a line: table, row, column and value, with tabs between them. */
void print(const Results& results) {
    const std::map<std::string, double> byName(results.begin(), results.end());
    for (const auto& [name, nanoseconds] : results) {
        if (name.find(" floor/") != std::string::npos) {
            continue;
        }
        std::printf("provider\t%s\tns\t%.4g\n", name.c_str(), nanoseconds);
        if (const auto floor = byName.find(floorOf(name)); floor != byName.end()) {
            std::printf("provider\t%s\tfloor ns\t%.4g\n", name.c_str(), floor->second);
        }
    }
}

} // namespace

int main(int argc, char** argv) {
    Results results;
    bool ran = true;
    for (const Setup& setup : setups) {
        if (!RUNNING_ON_VALGRIND || isCounted(setup)) {
            ran = runInProcess(setup, argc, argv, results) && ran;
        }
    }
    print(results);
    return ran ? 0 : 1;
}

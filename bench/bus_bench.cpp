/**
 * What requests cost on the machine itself: the provider's operations through the agent's backend logind, on a message
 * bus of this program's own with a systemd-logind that answers at once. Counts the calls, the connections and the round
 * trips to the bus of each operation, and takes the median of their times.
 */
#include "LogindStandIn.h"
#include "PrivateBus.h"

#include "agentlog/LogTap.h"
#include "classes/Catalogue.h"
#include "dispatch/Dispatcher.h"
#include "power/PowerRequests.h"
#include "registry/RegistrationReader.h"

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <numeric>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace {

using namespace ObjectManager;
using AgentTest::LogindStandIn;
using AgentTest::PrivateBus;

constexpr const char* service = "TALVO_PowerManagementService";

ObjectPath pathOf(const std::string& className, std::vector<NamedValue> keys = {}) {
    return ObjectPath{"", "root/cimv2", className, std::move(keys)};
}

ObjectPath servicePath() {
    return pathOf(service, {{"CreationClassName", stringValue(service)},
                            {"Name", stringValue("PowerStateManagement_system")},
                            {"SystemCreationClassName", stringValue("TALVO_ComputerSystem")},
                            {"SystemName", stringValue("bench.example")}});
}

ObjectPath systemPath() {
    return pathOf("TALVO_ComputerSystem",
                  {{"CreationClassName", stringValue("TALVO_ComputerSystem")}, {"Name", stringValue("bench.example")}});
}

std::vector<NamedValue> rebootOf(ObjectPath system) {
    return {{"PowerState", unsignedValue(CMPI_uint16, 5)}, {"ManagedElement", referenceValue(std::move(system))}};
}

/** One reading of the machine's state asks six questions at once. */
constexpr std::size_t reading = 6;
/** What is asked before a request is made, and the request. */
constexpr std::size_t check = 7;
constexpr std::size_t request = 1;

struct Measured {
    const char* name;
    /** The calls of each round trip. */
    std::vector<std::size_t> roundTrips;
    std::function<void(Dispatcher&)> run;
};

Measured associators(const char* name, const std::string& className, std::vector<std::size_t> roundTrips) {
    return {name, std::move(roundTrips), [className](Dispatcher& dispatcher) {
                dispatcher.associators({}, servicePath(), {className, {}, {}, {}}, {});
            }};
}

const Measured operations[] = {
    {"EnumerateInstanceNames",
     {reading},
     [](Dispatcher& dispatcher) { dispatcher.enumerateInstanceNames({}, pathOf(service), [](ObjectPath&&) {}); }},
    {"EnumerateInstances",
     {reading},
     [](Dispatcher& dispatcher) { dispatcher.enumerateInstances({}, pathOf(service), {}, [](Instance&&) {}); }},
    {"GetInstance", {reading}, [](Dispatcher& dispatcher) { dispatcher.getInstance({}, servicePath(), {}); }},
    {"RequestPowerStateChange",
     {reading, check, request},
     [](Dispatcher& dispatcher) {
         dispatcher.invokeMethod({}, servicePath(), "RequestPowerStateChange", rebootOf(systemPath()));
     }},
    associators("Associators, computer system", "TALVO_AssociatedPowerManagementService", {reading, reading}),
    associators("Associators, capabilities", "TALVO_PowerManagementElementCapabilities", {reading, reading, reading}),
    // As clients mostly ask: whether the service is there, and then the providers of all associations.
    associators("Associators", "", {reading, reading, reading, reading, reading, reading}),
    // As clients make the request: whether the service is there, and whose power it manages, and then the provider.
    {"InvokeMethod",
     {reading, reading, reading, reading, check, request},
     [](Dispatcher& dispatcher) {
         dispatcher.callMethod({}, servicePath(), "RequestPowerStateChange", rebootOf(systemPath()));
     }},
};

void configure(const PrivateBus& bus) {
    const auto file = bus.folder() / "agent.toml";
    // A request is made for a time that never comes.
    AgentTest::writeFile(file, "[system]\nname = \"bench.example\"\n[log]\ndestination = \"file\"\nfile = \"" +
                                   (bus.folder() / "agent.log").string() +
                                   "\"\n[instrumentation]\nbackend = \"logind\"\n[instrumentation.logind]\n"
                                   "delay = 3600\nlock-file = \"" +
                                   (bus.folder() / "lock").string() + "\"\n");
    // The log reads a file a second time that has just changed, which would be measured as well.
    std::filesystem::last_write_time(file, std::filesystem::file_time_type::min() + std::chrono::hours(1));
    setenv("ORV_AGENT_CONFIG", file.c_str(), 1);
}

double medianOf(std::vector<double>& values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

void measure(benchmark::State& state, Dispatcher& dispatcher, LogindStandIn& logind, const Measured& measured) {
    using Microseconds = std::chrono::duration<double, std::micro>;
    std::vector<double> times;
    try {
        logind.expect(measured.roundTrips);
        measured.run(dispatcher);
        const LogindStandIn::Asked asked = logind.asked();
        const std::size_t expected =
            std::accumulate(measured.roundTrips.begin(), measured.roundTrips.end(), std::size_t{0});
        if (asked.calls != expected) {
            throw std::runtime_error("found " + std::to_string(asked.calls) + " calls, expected " +
                                     std::to_string(expected));
        }
        for (auto _ : state) {
            state.PauseTiming();
            logind.expect();
            state.ResumeTiming();
            const auto begin = std::chrono::steady_clock::now();
            measured.run(dispatcher);
            times.push_back(Microseconds(std::chrono::steady_clock::now() - begin).count());
        }
        state.counters["round trips"] = static_cast<double>(measured.roundTrips.size());
        state.counters["calls"] = static_cast<double>(asked.calls);
        state.counters["connections"] = static_cast<double>(asked.connections);
        state.counters["median µs"] = medianOf(times);
    } catch (const std::exception& error) {
        state.SkipWithError(error.what());
    }
}

} // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return EXIT_FAILURE;
    }
    try {
        PrivateBus bus;
        configure(bus);
        LogindStandIn logind;
        const Catalogue catalogue = readCatalogue(ORV_SCHEMA_FOLDER);
        LogTap log;
        const PowerRequestRule powerRequests(catalogue, log);
        Dispatcher dispatcher(Registry(readRegistrations(ORV_SCHEMA_FOLDER)),
                              {{ORV_LIBRARY_FOLDER}, &catalogue, &log, {&powerRequests}});
        for (const Measured& measured : operations) {
            benchmark::RegisterBenchmark(measured.name, measure, std::ref(dispatcher), std::ref(logind),
                                         std::cref(measured));
        }
        benchmark::RunSpecifiedBenchmarks();
    } catch (const std::exception& error) {
        std::fprintf(stderr, "bus_bench: %s\n", error.what());
        return EXIT_FAILURE;
    }
    return EXIT_SUCCESS;
}

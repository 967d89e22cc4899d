/**
 * What a call of the agent's log costs; most calls write nothing. Counts the allocations, too.
 */
#include "Allocations.h"
#include "OrvLog/OrvLogger.h"
#include "base/Descriptor.h"
#include "base/FolderOfFile.h"

#include <benchmark/benchmark.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <string>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

namespace {

using OrvLog::OrvLogger;

const std::string filtered = "Corvane.Filtered";
const std::string written = "Corvane.Written";

using Write = void (*)(const char*, const char*, int, const std::string&, int, char*, int, int, const std::string&);

/** Writes records with a text of as many characters as the benchmark's argument says. */
void writeRecords(benchmark::State& state, Write write, const std::string& category, int level) {
    const std::string text(static_cast<std::size_t>(state.range(0)), 'x');
    // The first record makes what exists once in a process, which is not measured.
    write(__func__, __FILE__, __LINE__, category, level, nullptr, 0, 0, text);
    const int before = LogTest::allocations();
    for (auto _ : state) {
        write(__func__, __FILE__, __LINE__, category, level, nullptr, 0, 0, text);
    }
    state.counters["allocations"] = LogTest::allocations() - before;
}

/** The record of a step, far below the threshold. */
void filteredStep(benchmark::State& state) {
    writeRecords(state, OrvLogger::logLevelMessage, filtered, 3000);
}

/** The record of an operation, which the log remembers in case a failure follows. */
void filteredOperation(benchmark::State& state) {
    writeRecords(state, OrvLogger::logLevelMessage, filtered, 4000);
}

void filteredTrace(benchmark::State& state) {
    writeRecords(state, OrvLogger::traceLevelMessage, filtered, 6000);
}

void writtenToAFile(benchmark::State& state) {
    writeRecords(state, OrvLogger::logLevelMessage, written, 4000);
}

/**
 * What nobody can leave out of a record that is written: the system calls by which the destination opens the file,
 * looks whether it is full, keeps signals away from the host, writes the line and closes the file.
 */
void systemCallsOfARecord(benchmark::State& state) {
    using Norv::Agent::Descriptor;
    using Norv::Agent::FolderOfFile;
    const std::string path = std::string(std::getenv("ORV_AGENT_CONFIG")) + ".log";
    std::string line(200, 'x');
    line.back() = '\n';
    const iovec piece{line.data(), line.size()};
    for (auto _ : state) {
        const FolderOfFile folder(path);
        const Descriptor file =
            folder.openFile(O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC | O_NOCTTY | O_NONBLOCK, 0640);
        struct stat status {};
        sigset_t signals{};
        sigset_t before{};
        if (!file.isOpen() || fstat(file.number(), &status) != 0 ||
            pthread_sigmask(SIG_BLOCK, &signals, &before) != 0 || writev(file.number(), &piece, 1) < 0 ||
            pthread_sigmask(SIG_SETMASK, &before, nullptr) != 0) {
            state.SkipWithError("a system call failed");
            return;
        }
    }
}

BENCHMARK(filteredStep)->Arg(1)->Arg(100);
BENCHMARK(filteredOperation)->Arg(1)->Arg(100);
BENCHMARK(filteredTrace)->Arg(1)->Arg(100);
BENCHMARK(writtenToAFile)->Arg(1)->Arg(100);
BENCHMARK(systemCallsOfARecord);

} // namespace

int main(int argc, char** argv) {
    std::string folder = (std::filesystem::temp_directory_path() / "orv-log-bench-XXXXXX").string();
    if (mkdtemp(folder.data()) == nullptr) {
        std::cerr << folder << ": cannot be made\n";
        return EXIT_FAILURE;
    }
    std::ofstream(folder + "/agent.toml")
        << "[log]\ndestination = \"file\"\nfile = \"" << folder << "/agent.log\"\n[[log.category]]\nprefix = \""
        << written << "\"\nlevel = 0\n";
    setenv("ORV_AGENT_CONFIG", (folder + "/agent.toml").c_str(), 1);

    benchmark::Initialize(&argc, argv);
    const bool understood = !benchmark::ReportUnrecognizedArguments(argc, argv);
    if (understood) {
        benchmark::RunSpecifiedBenchmarks();
    }
    std::filesystem::remove_all(folder);
    return understood ? EXIT_SUCCESS : EXIT_FAILURE;
}

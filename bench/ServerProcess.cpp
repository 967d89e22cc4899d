#include "ServerProcess.h"

#include "System.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <fstream>
#include <stdexcept>

namespace Bench {

namespace {

/** Starts a command whose standard output is `output` and whose standard error
 * nobody reads. */
pid_t start(std::vector<std::string> command, int output) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO);
    posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0);
    std::vector<char*> arguments;
    for (std::string& argument : command) {
        arguments.push_back(argument.data());
    }
    arguments.push_back(nullptr);
    pid_t process = -1;
    const int error = posix_spawnp(&process, arguments[0], &actions, nullptr, arguments.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    if (error != 0) {
        throw std::system_error(error, std::generic_category(), command.front());
    }
    return process;
}

} // namespace

Folder::Folder() {
    std::string name = (std::filesystem::temp_directory_path() / "orv-bench-XXXXXX").string();
    require(mkdtemp(name.data()) != nullptr, "mkdtemp");
    _path = name;
}

Folder::~Folder() {
    std::filesystem::remove_all(_path);
}

Machine::Machine(unsigned int nodes) {
    const std::string configuration = _folder / "agent.toml";
    std::ofstream file(configuration);
    file << "[system]\nname = "
            "\"bench.example\"\n[instrumentation.simulated]\nstate-file = \""
         << (_folder / "machine.json") << "\"\n";
    for (unsigned int i = 0; i < nodes; ++i) {
        file << "[[instrumentation.simulated.node]]\npath = \"node" << i << "\"\n";
    }
    file.close();
    // The log reads a file a second time that has just changed, which would be measured as well.
    std::filesystem::last_write_time(configuration,
                                     std::filesystem::file_time_type::clock::now() - std::chrono::hours{1});
    setenv("ORV_AGENT_CONFIG", configuration.c_str(), 1);
}

ServerProcess::ServerProcess(const std::vector<std::string>& command) {
    int ends[2];
    require(pipe2(ends, O_CLOEXEC) == 0, "pipe");
    _process = start(command, ends[1]);
    close(ends[1]);
    std::FILE* const output = fdopen(ends[0], "r");
    unsigned int number = 0;
    const bool listening = std::fscanf(output, "Listening on %*[a-z]://127.0.0.1:%u", &number) == 1;
    std::fclose(output);
    if (!listening) {
        throw std::runtime_error(command.front() + " did not start to listen");
    }
    _port = static_cast<std::uint16_t>(number);
}

ServerProcess::~ServerProcess() {
    kill(_process, SIGTERM);
    waitpid(_process, nullptr, 0);
}

double ServerProcess::processorTime() const {
    clockid_t clock{};
    timespec time{};
    require(clock_getcpuclockid(_process, &clock) == 0 && clock_gettime(clock, &time) == 0, "processor time");
    constexpr double nanosecondsPerSecond = 1e9;
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) / nanosecondsPerSecond;
}

double ServerProcess::memory(const char* file, std::string_view lines) const {
    std::ifstream status("/proc/" + std::to_string(_process) + "/" + file);
    constexpr double kilobytesPerMegabyte = 1024;
    double kilobytes = 0;
    for (std::string text; std::getline(status, text);) {
        if (text.starts_with(lines)) {
            kilobytes += std::stod(text.substr(text.find(':') + 1));
        }
    }
    return kilobytes / kilobytesPerMegabyte;
}

void runCommand(const std::vector<std::string>& command) {
    const int nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC);
    require(nowhere >= 0, "/dev/null");
    const pid_t process = start(command, nowhere);
    close(nowhere);
    int status = 0;
    waitpid(process, &status, 0);
    if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
        throw std::runtime_error(command.front() + " failed");
    }
}

} // namespace Bench

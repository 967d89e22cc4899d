#include "PrivateBus.h"

#include <systemd/sd-bus.h>

#include <array>
#include <chrono>
#include <csignal>
#include <cstring>
#include <thread>

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>

namespace AgentTest {

namespace {

constexpr const char* variable = "DBUS_SYSTEM_BUS_ADDRESS";

void require(bool done, const std::string& what) {
    if (!done) {
        throw std::system_error(errno, std::system_category(), what);
    }
}

std::string configuration(const std::filesystem::path& socket, const std::string& policy) {
    return "<busconfig><listen>unix:path=" + socket.string() +
           "</listen><auth>EXTERNAL</auth><policy context=\"default\">"
           "<allow send_destination=\"*\" eavesdrop=\"true\"/><allow eavesdrop=\"true\"/><allow own=\"*\"/>" +
           policy + "</policy></busconfig>";
}

bool isOnBus(const char* name) {
    sd_bus* bus = nullptr;
    int result = sd_bus_open_system(&bus);
    if (result >= 0) {
        result = sd_bus_get_name_creds(bus, name, 0, nullptr);
    }
    sd_bus_flush_close_unref(bus);
    return result >= 0;
}

} // namespace

void requireBusIn(const TemporaryFolder& folder) {
    const char* address = std::getenv(variable);
    const std::string expected = "unix:path=" + (folder / "").string();
    if (address == nullptr || !std::string(address).starts_with(expected) || std::strchr(address, ';') != nullptr) {
        throw std::runtime_error(std::string(variable) + ": " + (address == nullptr ? "not set" : address) +
                                 ": expected a single address that begins with " + expected);
    }
}

void forgetSystemBus() {
    setenv(variable, "unix:path=/dev/null/no-bus", 1);
}

Child::Child(const std::vector<std::string>& arguments, int inherited, const std::string& errors) {
    // The child is killed together with the test program: else it would keep the program's output open.
    std::vector<char*> pointers;
    for (const char* argument : {"/usr/bin/setpriv", "--pdeathsig", "KILL", "--"}) {
        pointers.push_back(const_cast<char*>(argument));
    }
    for (const std::string& argument : arguments) {
        pointers.push_back(const_cast<char*>(argument.c_str()));
    }
    pointers.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    if (inherited >= 0) {
        // Duplicated to the same number, the descriptor stays open in the child.
        posix_spawn_file_actions_adddup2(&actions, inherited, inherited);
    }
    if (!errors.empty()) {
        posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, errors.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
    }
    errno = posix_spawn(&_process, pointers[0], &actions, nullptr, pointers.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    require(errno == 0, arguments.front());
}

void Child::end() {
    if (_process > 0) {
        kill(_process, SIGKILL);
        waitpid(_process, nullptr, 0);
        _process = -1;
    }
}

PrivateBus::PrivateBus(const std::string& policy) {
    const auto file = _folder / "bus.conf";
    writeFile(file, configuration(_folder / "bus", policy));
    std::array<int, 2> ends{};
    require(pipe2(ends.data(), O_CLOEXEC) == 0, "pipe");
    _daemon = Child({"/usr/bin/dbus-daemon", "--config-file=" + file.string(), "--nofork", "--nopidfile",
                     "--print-address=" + std::to_string(ends[1])},
                    ends[1], _folder / "errors");
    close(ends[1]);
    // The bus writes its address when it listens.
    std::array<char, 1000> text{};
    const ssize_t size = read(ends[0], text.data(), text.size());
    close(ends[0]);
    if (size <= 1) {
        throw std::runtime_error("dbus-daemon does not start: " + contentOf(_folder / "errors"));
    }
    _address.assign(text.data(), static_cast<std::size_t>(size) - 1);
    setenv(variable, _address.c_str(), 1);
    requireBusIn(_folder);
}

PrivateBus::~PrivateBus() {
    forgetSystemBus();
}

void PrivateBus::startLogind(const std::string& parameters) {
    _logind = Child({"/usr/bin/python3", "-m", "dbusmock", "--system", "--template", ORV_LOGIND_MOCK, "--parameters",
                     parameters, "--logfile", (_folder / "calls").string()});
    const auto end = std::chrono::steady_clock::now() + std::chrono::minutes(1);
    while (!isOnBus("org.freedesktop.login1")) {
        if (waitpid(_logind.process(), nullptr, WNOHANG) != 0 || std::chrono::steady_clock::now() > end) {
            throw std::runtime_error("python-dbusmock does not start with " + parameters);
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
}

std::vector<std::string> PrivateBus::requests() const {
    std::vector<std::string> requests;
    std::istringstream lines(contentOf(_folder / "calls"));
    for (std::string line; std::getline(lines, line);) {
        // The line has the time, and after it the call.
        const std::string call = line.substr(line.find(' ') + 1);
        for (const char* method : {"Reboot", "PowerOff", "ScheduleShutdown", "CancelScheduledShutdown"}) {
            if (call == method || call.starts_with(method + std::string(" "))) {
                requests.push_back(call);
            }
        }
    }
    return requests;
}

} // namespace AgentTest

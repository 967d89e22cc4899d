#include "Process.h"

#include <fcntl.h>
#include <pty.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <fstream>
#include <stdexcept>
#include <system_error>
#include <thread>
#include <utility>

namespace OrvcimTest {

namespace {

void require(bool done, const char* what) {
    if (!done) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

class Descriptor {
public:
    explicit Descriptor(int number) : _number(number) { require(number >= 0, "open"); }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() { close(_number); }

    int number() const { return _number; }

    /** All that was written to the file. */
    std::string content() const {
        std::string text(static_cast<std::size_t>(lseek(_number, 0, SEEK_END)), '\0');
        require(pread(_number, text.data(), text.size(), 0) == static_cast<ssize_t>(text.size()), "pread");
        return text;
    }

private:
    int _number;
};

/** A terminal on which something was typed. */
class Terminal {
public:
    explicit Terminal(const std::string& typed) : Terminal(open(), typed) {}

    int screen() const { return _slave.number(); }

private:
    static std::pair<int, int> open() {
        std::pair<int, int> ends;
        require(openpty(&ends.first, &ends.second, nullptr, nullptr, nullptr) == 0, "openpty");
        return ends;
    }

    Terminal(std::pair<int, int> ends, const std::string& typed) : _master(ends.first), _slave(ends.second) {
        require(write(_master.number(), typed.data(), typed.size()) == static_cast<ssize_t>(typed.size()), "write");
    }

    Descriptor _master;
    Descriptor _slave;
};

std::vector<std::string> environmentWith(const std::map<std::string, std::string>& changes) {
    std::vector<std::string> result;
    for (char** variable = environ; *variable != nullptr; ++variable) {
        const std::string text = *variable;
        if (!changes.contains(text.substr(0, text.find('=')))) {
            result.push_back(text);
        }
    }
    for (const auto& [name, value] : changes) {
        result.push_back(name + "=" + value);
    }
    return result;
}

std::vector<char*> pointersTo(std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    for (std::string& text : texts) {
        pointers.push_back(text.data());
    }
    pointers.push_back(nullptr);
    return pointers;
}

} // namespace

class RunningProcess::Files {
public:
    explicit Files(const std::optional<std::string>& typed) {
        if (typed) {
            _terminal.emplace(*typed);
        }
    }

    int input() const { return _terminal ? _terminal->screen() : _nothing.number(); }

    const Descriptor out{memfd_create("out", MFD_CLOEXEC)};
    const Descriptor err{memfd_create("err", MFD_CLOEXEC)};

private:
    const Descriptor _nothing{open("/dev/null", O_RDONLY | O_CLOEXEC)};
    std::optional<Terminal> _terminal;
};

RunningProcess::RunningProcess(const std::vector<std::string>& arguments,
                               const std::map<std::string, std::string>& environment,
                               const std::optional<std::string>& typed)
    : _files(std::make_unique<Files>(typed)) {
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, _files->input(), STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, _files->out.number(), STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, _files->err.number(), STDERR_FILENO);

    std::vector<std::string> argumentTexts = arguments;
    std::vector<std::string> environmentTexts = environmentWith(environment);
    const int error = posix_spawnp(&_process, arguments.front().c_str(), &actions, nullptr,
                                   pointersTo(argumentTexts).data(), pointersTo(environmentTexts).data());
    posix_spawn_file_actions_destroy(&actions);
    if (error != 0) {
        throw std::system_error(error, std::generic_category(), arguments.front());
    }
}

RunningProcess::~RunningProcess() {
    if (_process >= 0) {
        kill(_process, SIGKILL);
        waitpid(_process, nullptr, 0);
    }
}

std::string RunningProcess::firstLine() const {
    const std::string output = outputWith("\n");
    return output.substr(0, output.find('\n'));
}

std::string RunningProcess::outputWith(const std::string& text) const {
    return waitFor(text, Stream::out);
}

std::string RunningProcess::errWith(const std::string& text) const {
    return waitFor(text, Stream::err);
}

std::string RunningProcess::waitFor(const std::string& text, Stream stream) const {
    siginfo_t ended{};
    const auto end = std::chrono::steady_clock::now() + std::chrono::minutes{1};
    while (std::chrono::steady_clock::now() < end) {
        const bool running =
            waitid(P_PID, static_cast<id_t>(_process), &ended, WEXITED | WNOHANG | WNOWAIT) == 0 && ended.si_pid == 0;
        const std::string written = contentOf(stream);
        if (written.find(text) != std::string::npos) {
            return written;
        }
        if (!running) {
            return "";
        }
        std::this_thread::sleep_for(std::chrono::milliseconds{2});
    }
    throw std::runtime_error("the program does not write \"" + text + "\" within a minute");
}

std::string RunningProcess::err() const {
    return contentOf(Stream::err);
}

std::string RunningProcess::contentOf(Stream stream) const {
    return stream == Stream::out ? _files->out.content() : _files->err.content();
}

void RunningProcess::send(int signal) const {
    require(kill(_process, signal) == 0, "kill");
}

std::size_t RunningProcess::peakMemory() const {
    std::ifstream status("/proc/" + std::to_string(_process) + "/status");
    for (std::string word; status >> word;) {
        if (std::size_t kilobytes = 0; word == "VmHWM:" && status >> kilobytes) {
            return kilobytes * 1024;
        }
    }
    throw std::runtime_error("the program does not run");
}

Outcome RunningProcess::wait() {
    int status = 0;
    require(waitpid(_process, &status, 0) == _process, "waitpid");
    _process = -1;
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, _files->out.content(), _files->err.content()};
}

Outcome runProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed) {
    return RunningProcess(arguments, environment, typed).wait();
}

} // namespace OrvcimTest

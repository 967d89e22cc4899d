#include "Process.h"

#include <fcntl.h>
#include <pty.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>
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

Outcome runProcess(const std::vector<std::string>& arguments, const std::map<std::string, std::string>& environment,
                   const std::optional<std::string>& typed) {
    const Descriptor out(memfd_create("out", MFD_CLOEXEC));
    const Descriptor err(memfd_create("err", MFD_CLOEXEC));
    const Descriptor nothing(open("/dev/null", O_RDONLY | O_CLOEXEC));
    std::optional<Terminal> terminal;
    if (typed) {
        terminal.emplace(*typed);
    }
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, terminal ? terminal->screen() : nothing.number(), STDIN_FILENO);
    posix_spawn_file_actions_adddup2(&actions, out.number(), STDOUT_FILENO);
    posix_spawn_file_actions_adddup2(&actions, err.number(), STDERR_FILENO);

    std::vector<std::string> argumentTexts = arguments;
    std::vector<std::string> environmentTexts = environmentWith(environment);
    pid_t process = -1;
    const int error = posix_spawn(&process, arguments.front().c_str(), &actions, nullptr,
                                  pointersTo(argumentTexts).data(), pointersTo(environmentTexts).data());
    posix_spawn_file_actions_destroy(&actions);
    if (error != 0) {
        throw std::system_error(error, std::generic_category(), arguments.front());
    }
    int status = 0;
    require(waitpid(process, &status, 0) == process, "waitpid");
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, out.content(), err.content()};
}

} // namespace OrvcimTest

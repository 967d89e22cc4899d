#include "orvcim/Graphviz.h"

#include "orvcim/Session.h"

#include <fmt/format.h>

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <memory>
#include <system_error>

namespace ObjectManager::Orvcim {

namespace {

struct CloseFile {
    void operator()(std::FILE* file) const { std::fclose(file); }
};
using File = std::unique_ptr<std::FILE, CloseFile>;

/** A file without a name that has the text, to be read from its beginning. */
File temporaryFile(const std::string& text) {
    File file(std::tmpfile());
    if (file == nullptr || std::fwrite(text.data(), 1, text.size(), file.get()) != text.size() ||
        std::fflush(file.get()) != 0) {
        throw std::system_error(errno, std::generic_category(), "a temporary file cannot be written");
    }
    std::rewind(file.get());
    return file;
}

/** Runs dot to its end; its status as waitpid gives it. */
int runDot(int input, const std::string& output) {
    std::string program = "dot";
    std::string format = "-Tsvg";
    std::string destination = "-o" + output;
    char* arguments[] = {program.data(), format.data(), destination.data(), nullptr};
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, input, STDIN_FILENO);
    pid_t child = -1;
    const int error = posix_spawnp(&child, program.c_str(), &actions, nullptr, arguments, environ);
    posix_spawn_file_actions_destroy(&actions);
    if (error != 0) {
        throw Failure(fmt::format("cannot run the program dot ({}), expected Graphviz to be installed for --svg",
                                  std::generic_category().message(error)));
    }
    int status = -1;
    while (waitpid(child, &status, 0) == -1 && errno == EINTR) {
    }
    return status;
}

} // namespace

std::string dotString(std::string_view text) {
    std::string quoted = "\"";
    for (const char c : text) {
        if (c == '\n') {
            quoted += "\\n";
        } else {
            quoted += c == '"' || c == '\\' ? std::string{'\\', c} : std::string{c};
        }
    }
    return quoted + '"';
}

void drawSvg(const std::string& graph, const std::filesystem::path& file) {
    const File input = temporaryFile(graph);
    if (const int status = runDot(fileno(input.get()), file.string()); status != 0) {
        throw Failure(fmt::format("the program dot did not draw {} ({})", file.string(),
                                  WIFEXITED(status) ? fmt::format("exit status {}", WEXITSTATUS(status))
                                                    : fmt::format("signal {}", WTERMSIG(status))));
    }
}

} // namespace ObjectManager::Orvcim

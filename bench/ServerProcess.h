/** Machines, and programs that serve them. */
#ifndef BENCH_SERVERPROCESS_H
#define BENCH_SERVERPROCESS_H

#include <sys/types.h>

#include <cstdint>
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

namespace Bench {

/** A temporary folder, which is removed when the object is destroyed. */
class Folder {
public:
    Folder();
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;
    ~Folder();

    std::string operator/(const char* name) const { return (_path / name).string(); }

private:
    std::filesystem::path _path;
};

/** A simulated machine with some nodes. Programs that are started while the object exists manage this machine. */
class Machine {
public:
    explicit Machine(unsigned int nodes);

private:
    Folder _folder;
};

/** A program that serves HTTP or HTTPS on a free port, and writes to its standard output where. Ends with this object.
 */
class ServerProcess {
public:
    /** Starts the program, and waits until it listens. */
    explicit ServerProcess(const std::vector<std::string>& command);
    ServerProcess(const ServerProcess&) = delete;
    ServerProcess& operator=(const ServerProcess&) = delete;
    ~ServerProcess();

    std::uint16_t port() const { return _port; }
    pid_t process() const { return _process; }

    /** The processor time that the program has used, in seconds. */
    double processorTime() const;

    /** The sum of all lines that begin with `lines` in a file in the process's folder of /proc, in megabytes. */
    double memory(const char* file, std::string_view lines) const;

private:
    pid_t _process = -1;
    std::uint16_t _port = 0;
};

/** Runs a command to its end. @throws std::runtime_error if it cannot be run or fails. */
void runCommand(const std::vector<std::string>& command);

} // namespace Bench

#endif
